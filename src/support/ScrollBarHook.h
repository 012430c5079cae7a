// Keeps one message from a window: the colour request that a scroll bar sends to the window that holds it
// before it paints. The window's procedure is replaced; every other message goes on to the one that was
// there.
#pragma once

#include <cstdint>

namespace tarnwick {

// Handle of a window, address of a window procedure; 0 is none.
using WindowHandle = std::uintptr_t;
using ProcedureAddress = std::uintptr_t;

// One for each apartment. All windows that are hooked belong to one class and so share the previous
// procedure.
struct ScrollHookState {
  bool hooked = false;
  // The window to hook, set before Install.
  WindowHandle window = 0;
  // What was there before the hook; 0 when the system did not take it.
  ProcedureAddress previous = 0;
};

// The seam to the system's window procedures.
class WindowProcedures {
 public:
  virtual ~WindowProcedures() = default;

  // Puts the hook in the place of the window's procedure; returns the one that was there, 0 on failure.
  virtual ProcedureAddress SetHook(WindowHandle window) = 0;
  // Passes a message to a procedure; 0 when there is none.
  virtual std::intptr_t Call(ProcedureAddress procedure, WindowHandle window, std::uint32_t message,
                             std::uintptr_t first, std::intptr_t second) = 0;
};

class ScrollBarHook {
 public:
  // Both outlive the hook.
  ScrollBarHook(ScrollHookState& state, WindowProcedures& procedures)
      : state_(state), procedures_(procedures) {}

  // Hooks the state's window; does nothing while the state says that it is hooked. A new window needs that
  // cleared first.
  void Install();

  // What the hook answers to a message of a hooked window.
  std::intptr_t Answer(WindowHandle window, std::uint32_t message, std::uintptr_t first,
                       std::intptr_t second) const;

 private:
  ScrollHookState& state_;
  WindowProcedures& procedures_;
};

}  // namespace tarnwick
