#pragma once

#include <winsock2.h>

#include <memory>
#include <string>

#include "platform/StreamSocket.h"
#include "platform/windows/MessageWindow.h"
#include "platform/windows/Owner.h"

namespace tarnwick {

using SocketOwner = Owner<SOCKET, closesocket, INVALID_SOCKET>;

inline void EndSockets(bool) {
  WSACleanup();
}
// Holds true while the system's sockets are started.
using SocketsOwner = Owner<bool, EndSockets, false>;

// A non-blocking Winsock socket that tells its events as window messages, so that a wait for them uses no
// processor time.
class WindowsStreamSocket : public StreamSocket {
 public:
  WindowsStreamSocket();
  ~WindowsStreamSocket() override;
  WindowsStreamSocket(const WindowsStreamSocket&) = delete;
  WindowsStreamSocket& operator=(const WindowsStreamSocket&) = delete;

  void SetEvents(SocketEvents* events) override { events_ = events; }
  void Connect(TextView host, std::uint16_t port) override;
  void Send(std::string_view bytes) override;
  std::size_t Read(std::span<char> room) override;
  void Close() override;

 private:
  enum class Tells : UINT;

  UINT MessageOf(Tells tells) const;
  bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam);
  void OnLookedUp(int error);
  void OnNetworkEvent(int event, int error);
  void OnClose();
  void ConnectTo(std::uint32_t address);
  void TellError(int error);
  // Whether the connection is still the same afterwards.
  bool TellSent();

  // Ends after the socket.
  SocketsOwner started_;
  SocketEvents* events_ = nullptr;
  SocketOwner socket_;
  // Counts the connections, so that messages of one that was closed can be told.
  UINT connection_ = 0;
  // Of the look-up that runs; null when none does.
  HANDLE lookup_ = nullptr;
  std::unique_ptr<char[]> lookupAnswer_;
  std::uint16_t port_ = 0;
  std::string pending_;
  // Bytes have left that the user was not told of.
  bool sent_ = false;
  // Whether something was read since it was set back.
  bool read_ = false;
  MessageWindow window_;
};

}  // namespace tarnwick
