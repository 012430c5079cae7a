#include "controls/windows/WindowsScrollHook.h"

namespace tarnwick {
namespace {

// The window carries the state, because a window procedure is told nothing else.
constexpr wchar_t kStateProperty[] = L"TarnwickScrollHook";

class SystemProcedures : public WindowProcedures {
 public:
  explicit SystemProcedures(WNDPROC hook) : hook_(hook) {}
  ProcedureAddress SetHook(WindowHandle window) override {
    return static_cast<ProcedureAddress>(
        SetWindowLongPtrA(reinterpret_cast<HWND>(window), GWLP_WNDPROC, reinterpret_cast<LONG_PTR>(hook_)));
  }
  std::intptr_t Call(ProcedureAddress procedure, WindowHandle window, std::uint32_t message,
                     std::uintptr_t first, std::intptr_t second) override {
    return CallWindowProcA(reinterpret_cast<WNDPROC>(procedure), reinterpret_cast<HWND>(window), message,
                           first, second);
  }

 private:
  const WNDPROC hook_;
};

}  // namespace

WindowsScrollHook::~WindowsScrollHook() {
  if (window_) RemovePropW(window_, kStateProperty);
}

void WindowsScrollHook::Install(HWND window) {
  // Hooked twice, the previous procedure would be the hook itself.
  if (!window || window == window_) return;
  if (!SetPropW(window, kStateProperty, &state_)) return;
  window_ = window;
  state_.hooked = false;
  state_.window = reinterpret_cast<WindowHandle>(window);
  SystemProcedures procedures(HookProc);
  ScrollBarHook(state_, procedures).Install();
}

LRESULT CALLBACK WindowsScrollHook::HookProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  auto* state = static_cast<ScrollHookState*>(GetPropW(window, kStateProperty));
  // The hook may go before its window; then it is as if it had not been there.
  if (!state)
    return CallWindowProcA(reinterpret_cast<WNDPROC>(GetClassLongPtrA(window, GCLP_WNDPROC)), window, message,
                           wParam, lParam);
  SystemProcedures procedures(HookProc);
  return ScrollBarHook(*state, procedures)
      .Answer(reinterpret_cast<WindowHandle>(window), message, wParam, lParam);
}

}  // namespace tarnwick
