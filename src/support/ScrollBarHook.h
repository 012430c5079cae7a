// Keeps one message from a window: the colour request that a scroll bar sends to the window that holds it
// before it paints. The window's procedure is replaced; every other message goes on to the one that was
// there.
#pragma once

#include <cstdint>

#include "support/ScrollHookState.h"

namespace tarnwick {

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
