#include "platform/windows/WindowsMessagePump.h"

#include <cstdint>

namespace tarnwick {
namespace {

// A window that never gets its painting done, or a handler that posts its message again, would keep the loop
// going for ever. Messages this much younger than the call are left for the next one.
constexpr std::int32_t kMostMs = 100;

}  // namespace

void WindowsMessagePump::Yield() {
  Drain();
}

bool WindowsMessagePump::Drain() {
  const DWORD begin = GetTickCount();
  MSG message{};
  while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
    if (message.message == WM_QUIT) {
      // It is for the loop that the host runs.
      PostQuitMessage(static_cast<int>(message.wParam));
      return false;
    }
    TranslateMessage(&message);
    DispatchMessageW(&message);
    // Signed, because the tick count starts again from 0.
    if (static_cast<std::int32_t>(message.time - begin) > kMostMs)
      return !PeekMessageW(&message, nullptr, WM_QUIT, WM_QUIT, PM_NOREMOVE);
  }
  return true;
}

bool WindowsMessagePump::Wait() {
  // MWMO_INPUTAVAILABLE: also for messages that somebody has looked at already.
  MsgWaitForMultipleObjectsEx(0, nullptr, INFINITE, QS_ALLINPUT, MWMO_INPUTAVAILABLE);
  return Drain();
}

}  // namespace tarnwick
