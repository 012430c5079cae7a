// The seam to a TCP socket that tells what happens to it through the thread's messages.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

// What a socket tells. Nothing is told inside a call of the socket's own members, and nothing after Close.
class SocketEvents {
 public:
  virtual ~SocketEvents() = default;
  virtual void OnResolved() = 0;
  virtual void OnConnected() = 0;
  // There are bytes to read. Told again as long as some are left.
  virtual void OnReadable() = 0;
  // The peer has closed, and all its bytes have been read.
  virtual void OnClosedByPeer() = 0;
  // Some of the bytes that were to be sent have left.
  virtual void OnSent() = 0;
  virtual void OnSocketError(std::int32_t number) = 0;
};

// Bytes that arrive from a peer.
class ByteStream {
 public:
  virtual ~ByteStream() = default;

  virtual void SetEvents(SocketEvents* events) = 0;
  // Reads what is there, as far as it fits; how many bytes.
  virtual std::size_t Read(std::span<char> room) = 0;
  virtual void Close() = 0;
};

class StreamSocket : public ByteStream {
 public:
  // Begins to connect; closes what was open. Failures are told as events. `host` is a name, an IPv4 number or
  // an IPv6 one, which may stand in brackets. The addresses of a name are tried one after the other, the next
  // one when one fails or, within kConnectTimeoutMs for all of several, stays silent.
  virtual void Connect(TextView host, std::uint16_t port) = 0;
  // Sends as much as the system takes now, and the rest when it takes more; neither blocks nor pumps
  // messages.
  virtual void Send(std::string_view bytes) = 0;
};

}  // namespace tarnwick
