#include "platform/windows/WindowsStreamSocket.h"

#include <algorithm>
#include <cstring>
#include <limits>

#include "platform/windows/AnsiText.h"

namespace tarnwick {
namespace {

constexpr UINT kLookedUp = WM_APP + 1;
constexpr UINT kNetworkEvent = WM_APP + 2;
constexpr UINT kFailedAtOnce = WM_APP + 3;

}  // namespace

WindowsStreamSocket::WindowsStreamSocket()
    : window_(
          [this](UINT message, WPARAM wParam, LPARAM lParam) { return OnMessage(message, wParam, lParam); }) {
  WSADATA data = {};
  started_ = WSAStartup(MAKEWORD(2, 2), &data) == 0;
}

WindowsStreamSocket::~WindowsStreamSocket() {
  events_ = nullptr;
  Close();
  if (started_) WSACleanup();
}

void WindowsStreamSocket::Close() {
  if (lookup_) WSACancelAsyncRequest(lookup_);
  lookup_ = nullptr;
  pending_.clear();
  if (socket_ != INVALID_SOCKET) closesocket(socket_);
  socket_ = INVALID_SOCKET;
}

// Told as a message: nothing is told inside a call.
void WindowsStreamSocket::TellError(int error) {
  PostMessageW(window_.Get(), kFailedAtOnce, static_cast<WPARAM>(error), 0);
}

void WindowsStreamSocket::Connect(TextView host, std::uint16_t port) {
  Close();
  port_ = port;
  const auto name = AnsiFromText(host);
  if (!name) return TellError(WSAHOST_NOT_FOUND);
  // A number needs no look-up, which would cost a thread each time.
  const unsigned long number = inet_addr(name->c_str());
  if (number != INADDR_NONE) return ConnectTo(number);
  lookupAnswer_.assign(MAXGETHOSTSTRUCT, '\0');
  lookup_ = WSAAsyncGetHostByName(window_.Get(), kLookedUp, name->c_str(), lookupAnswer_.data(),
                                  static_cast<int>(lookupAnswer_.size()));
  if (!lookup_) TellError(WSAGetLastError());
}

void WindowsStreamSocket::ConnectTo(std::uint32_t address) {
  socket_ = socket(AF_INET, SOCK_STREAM, IPPROTO_TCP);
  if (socket_ == INVALID_SOCKET ||
      WSAAsyncSelect(socket_, window_.Get(), kNetworkEvent, FD_CONNECT | FD_READ | FD_WRITE | FD_CLOSE) != 0)
    return TellError(WSAGetLastError());
  sockaddr_in peer = {};
  peer.sin_family = AF_INET;
  peer.sin_port = htons(port_);
  peer.sin_addr.s_addr = address;
  if (connect(socket_, reinterpret_cast<const sockaddr*>(&peer), sizeof peer) != 0 &&
      WSAGetLastError() != WSAEWOULDBLOCK)
    TellError(WSAGetLastError());
}

void WindowsStreamSocket::Send(std::string_view bytes) {
  pending_.append(bytes);
  SendPending();
}

void WindowsStreamSocket::SendPending() {
  while (!pending_.empty()) {
    const int count =
        send(socket_, pending_.data(), static_cast<int>(std::min<std::size_t>(pending_.size(), 1U << 30)), 0);
    // What cannot go now goes when the socket tells that it may.
    if (count <= 0) return;
    pending_.erase(0, static_cast<std::size_t>(count));
  }
}

std::size_t WindowsStreamSocket::Read(std::span<char> room) {
  const int most = static_cast<int>(std::min<std::size_t>(room.size(), std::numeric_limits<int>::max()));
  const int count = recv(socket_, room.data(), most, 0);
  return count > 0 ? static_cast<std::size_t>(count) : 0;
}

bool WindowsStreamSocket::OnMessage(UINT message, WPARAM wParam, LPARAM lParam) {
  switch (message) {
    case kLookedUp: {
      if (!lookup_ || reinterpret_cast<HANDLE>(wParam) != lookup_) return true;
      lookup_ = nullptr;
      const int error = WSAGETASYNCERROR(lParam);
      const auto* found = reinterpret_cast<const hostent*>(lookupAnswer_.data());
      if (error != 0 || found->h_length != sizeof(std::uint32_t)) {
        if (events_) events_->OnSocketError(WSAHOST_NOT_FOUND);
        return true;
      }
      std::uint32_t address = 0;
      std::memcpy(&address, found->h_addr_list[0], sizeof address);
      if (events_) events_->OnResolved();
      ConnectTo(address);
      return true;
    }
    case kNetworkEvent:
      // Messages of a socket that has been closed may still be there.
      if (static_cast<SOCKET>(wParam) == socket_ && socket_ != INVALID_SOCKET)
        OnNetworkEvent(WSAGETSELECTEVENT(lParam), WSAGETSELECTERROR(lParam));
      return true;
    case kFailedAtOnce:
      if (events_) events_->OnSocketError(static_cast<std::int32_t>(wParam));
      return true;
    default:
      return false;
  }
}

void WindowsStreamSocket::OnNetworkEvent(int event, int error) {
  if (!events_) return;
  if (error != 0) return events_->OnSocketError(error);
  switch (event) {
    case FD_CONNECT:
      events_->OnConnected();
      return;
    case FD_WRITE: {
      const bool any = !pending_.empty();
      SendPending();
      if (any) events_->OnSent();
      return;
    }
    case FD_READ:
      events_->OnReadable();
      return;
    case FD_CLOSE: {
      // What arrived before the close is still to be read.
      const SOCKET closed = socket_;
      unsigned long left = 0;
      while (socket_ == closed && ioctlsocket(closed, FIONREAD, &left) == 0 && left > 0)
        events_->OnReadable();
      if (socket_ == closed && events_) events_->OnClosedByPeer();
      return;
    }
    default:
      return;
  }
}

}  // namespace tarnwick
