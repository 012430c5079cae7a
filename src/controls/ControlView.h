// What the windows of both controls do for the rules.
#pragma once

namespace tarnwick {

// No member throws. All work without a window too; a window that comes later shows the same state.
class ControlView {
 public:
  virtual ~ControlView() = default;

  // Gives the control the keyboard focus. Runs the code of the window that had it, and the host's.
  virtual void Focus() = 0;

  // The hourglass over the control, or the default pointer.
  virtual void SetHourglass(bool hourglass) = 0;

  // Drags the selection out, as if the user did. Returns after the drop, pumps messages until then, and
  // raises events.
  virtual void StartDrag() = 0;
};

}  // namespace tarnwick
