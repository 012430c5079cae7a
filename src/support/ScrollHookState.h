// What ScrollBarHook remembers between its calls.
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

}  // namespace tarnwick
