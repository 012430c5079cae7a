#include "platform/windows/MessageWindow.h"

#include <utility>

#include "base/RuntimeError.h"

namespace tarnwick {

MessageWindow::MessageWindow(Handler handler) : handler_(std::move(handler)) {}

HWND MessageWindow::Get() {
  if (window_) return window_.Get();
  // A class of the system's, so that none of ours has to go with the library.
  const HWND window =
      CreateWindowExW(0, L"STATIC", L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr, nullptr, nullptr);
  if (!window) return nullptr;
  window_ = Owner<HWND, DestroyWindow>(window);
  SetWindowLongPtrW(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(this));
  SetWindowLongPtrW(window, GWLP_WNDPROC, reinterpret_cast<LONG_PTR>(WindowProc));
  return window;
}

MessageWindow::~MessageWindow() {
  // The last messages, which come while it is destroyed, are not for the handler.
  if (window_) SetWindowLongPtrW(window_.Get(), GWLP_USERDATA, 0);
}

LRESULT CALLBACK MessageWindow::WindowProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  auto* self = reinterpret_cast<MessageWindow*>(GetWindowLongPtrW(window, GWLP_USERDATA));
  if (self) {
    // A copy, because the object may end inside its handler.
    const Handler handler = self->handler_;
    const bool taken =
        ResultAsItStood(true, [&](bool& result) { result = handler(message, wParam, lParam); });
    if (taken) return 0;
  }
  return DefWindowProcW(window, message, wParam, lParam);
}

}  // namespace tarnwick
