#pragma once

#include "platform/Platform.h"
// Last, and needed here although nothing of it is used: it takes away the macro of the name Yield.
#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

// The queue of the thread that calls.
class WindowsMessagePump : public MessagePump {
 public:
  void Yield() override;
  bool Wait() override;

 private:
  // False when there is a quit message, which is put back.
  bool Drain();
};

}  // namespace tarnwick
