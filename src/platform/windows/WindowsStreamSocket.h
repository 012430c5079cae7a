#pragma once

#include <winsock2.h>

#include <memory>
#include <string>
#include <vector>

#include "platform/HttpTransport.h"
#include "platform/StreamSocket.h"
#include "platform/windows/MessageWindow.h"
#include "platform/windows/Owner.h"
#include "platform/windows/WindowsResolver.h"
#include "platform/windows/WindowsTimer.h"

namespace tarnwick {

using SocketOwner = Owner<SOCKET, closesocket, INVALID_SOCKET>;

// A non-blocking Winsock socket that tells its events as window messages, so that a wait for them uses no
// processor time.
class WindowsStreamSocket : public StreamSocket {
 public:
  // The addresses of a host that has several are tried for `connectMs` in all.
  explicit WindowsStreamSocket(std::unique_ptr<Resolver> resolver = std::make_unique<WindowsResolver>(),
                               std::uint32_t connectMs = kConnectTimeoutMs);
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
  void OnLookedUp(std::vector<SocketAddress> addresses);
  void OnNetworkEvent(int event, int error);
  void OnClose();
  void ConnectToOneOf(std::vector<SocketAddress> addresses);
  void ConnectToNext();
  // The error when it fails at once, or 0.
  int ConnectTo(const SocketAddress& address);
  void OnShareIsOver();
  void TellError(int error);
  // Whether the connection is still the same afterwards.
  bool TellSent();

  // Ends after the socket.
  SocketsOwner started_;
  SocketEvents* events_ = nullptr;
  SocketOwner socket_;
  // Counts the connections, so that messages of one that was closed can be told.
  UINT connection_ = 0;
  const std::unique_ptr<Resolver> resolver_;
  const std::uint32_t connectMs_;
  // Those that were not tried yet; none once there is a connection.
  std::vector<SocketAddress> addresses_;
  // When the last of several tries is over, in the system's ticks; 0 for a single one, which is the caller's
  // to end.
  std::uint64_t deadline_ = 0;
  // Runs while one of several addresses is tried.
  WindowsTimer share_;
  std::string pending_;
  // Bytes have left that the user was not told of.
  bool sent_ = false;
  // Whether something was read since it was set back.
  bool read_ = false;
  MessageWindow window_;
};

}  // namespace tarnwick
