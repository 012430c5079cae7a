#include "platform/windows/WindowsTimer.h"

#include <algorithm>

namespace tarnwick {
namespace {

constexpr UINT_PTR kTimer = 1;

}  // namespace

WindowsTimer::WindowsTimer()
    : window_([this](UINT message, WPARAM, LPARAM) {
        if (message != WM_TIMER) return false;
        OnTick();
        return true;
      }) {}

void WindowsTimer::Start(std::uint32_t milliseconds) {
  due_ = GetTickCount64() + milliseconds;
  if (tick_ == 0 || tick_ > due_) TickAt(due_);
}

void WindowsTimer::OnTick() {
  KillTimer(window_.Get(), kTimer);
  tick_ = 0;
  if (due_ == 0) return;
  if (GetTickCount64() < due_) return TickAt(due_);
  due_ = 0;
  const std::function<void()> handler = handler_;
  if (handler) handler();
}

void WindowsTimer::TickAt(std::uint64_t time) {
  tick_ = time;
  SetTimer(window_.Get(), kTimer, static_cast<UINT>(time - std::min(time, GetTickCount64())), nullptr);
}

}  // namespace tarnwick
