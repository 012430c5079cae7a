#include "platform/windows/WindowsTimer.h"

namespace tarnwick {
namespace {

constexpr UINT_PTR kTimer = 1;

}  // namespace

WindowsTimer::WindowsTimer()
    : window_([this](UINT message, WPARAM, LPARAM) {
        if (message != WM_TIMER) return false;
        Stop();
        const std::function<void()> handler = handler_;
        if (handler) handler();
        return true;
      }) {}

void WindowsTimer::Start(std::uint32_t milliseconds) {
  SetTimer(window_.Get(), kTimer, milliseconds, nullptr);
}

void WindowsTimer::Stop() {
  KillTimer(window_.Get(), kTimer);
}

}  // namespace tarnwick
