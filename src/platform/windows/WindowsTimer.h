#pragma once

#include "platform/Timer.h"
#include "platform/windows/MessageWindow.h"

namespace tarnwick {

class WindowsTimer : public Timer {
 public:
  WindowsTimer();

  void SetHandler(std::function<void()> handler) override { handler_ = std::move(handler); }
  void Start(std::uint32_t milliseconds) override;
  void Stop() override;

 private:
  std::function<void()> handler_;
  MessageWindow window_;
};

}  // namespace tarnwick
