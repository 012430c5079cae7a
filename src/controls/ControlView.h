// What the windows of both controls do for the rules.
#pragma once

namespace tarnwick {

// No member throws. All work without a window too; a window that comes later shows the same state.
class ControlView {
 public:
  virtual ~ControlView() = default;

  // The keyboard focus.
  virtual void Focus() = 0;

  // The hourglass over the control, or the default pointer.
  virtual void SetHourglass(bool hourglass) = 0;

  // Starts a drag of the selection, as if the user did.
  virtual void StartDrag() = 0;
};

}  // namespace tarnwick
