#pragma once

#include <winsock2.h>

#include <memory>

#include "platform/Resolver.h"
#include "platform/windows/MessageWindow.h"

namespace tarnwick {

inline void EndSockets(bool) {
  WSACleanup();
}
// Holds true while the system's sockets are started.
using SocketsOwner = Owner<bool, EndSockets, false>;
SocketsOwner StartSockets();

// Looks up on a thread of the system's pool, because the system's own call blocks.
class WindowsResolver : public Resolver {
 public:
  WindowsResolver();
  ~WindowsResolver() override;
  WindowsResolver(const WindowsResolver&) = delete;
  WindowsResolver& operator=(const WindowsResolver&) = delete;

  void LookUp(TextView host, std::uint16_t port, Taker taker) override;
  void Cancel() override;

 private:
  // What the worker shares with the object; lives until the last of both has ended.
  struct Shared;

  void Take();

  Taker taker_;
  // Null when nothing is looked up.
  std::shared_ptr<Shared> shared_;
  MessageWindow window_;
};

}  // namespace tarnwick
