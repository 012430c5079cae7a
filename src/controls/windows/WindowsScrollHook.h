// The scroll bar's hook on a real window.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include "support/ScrollBarHook.h"

namespace tarnwick {

class WindowsScrollHook {
 public:
  // `state` is the apartment's; it outlives this object.
  explicit WindowsScrollHook(ScrollHookState& state) : state_(state) {}
  // The procedure stays with the window. What still comes for it then goes to its class's own
  // procedure.
  ~WindowsScrollHook();
  WindowsScrollHook(const WindowsScrollHook&) = delete;
  WindowsScrollHook& operator=(const WindowsScrollHook&) = delete;

  // Hooks the window of a new control; nothing when that is the one that was hooked last.
  //
  // The window takes its texts as ANSI from here on. Windows inside it are not concerned.
  void Install(HWND window);

 private:
  static LRESULT CALLBACK HookProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam);

  ScrollHookState& state_;
  HWND window_ = nullptr;
};

}  // namespace tarnwick
