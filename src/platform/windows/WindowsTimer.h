#pragma once

#include "platform/Timer.h"
#include "platform/windows/MessageWindow.h"

namespace tarnwick {

// Restarted with each arrival of a transfer, so the system's timer is left running then, and told the rest of
// the time when it ticks too early.
class WindowsTimer : public Timer {
 public:
  WindowsTimer();

  void SetHandler(std::function<void()> handler) override { handler_ = std::move(handler); }
  void Start(std::uint32_t milliseconds) override;
  void Stop() override { due_ = 0; }

 private:
  void OnTick();
  void TickAt(std::uint64_t time);

  std::function<void()> handler_;
  // In the system's ticks. 0 when it does not run.
  std::uint64_t due_ = 0;
  // When the system's timer runs out; 0 when that does not run.
  std::uint64_t tick_ = 0;
  MessageWindow window_;
};

}  // namespace tarnwick
