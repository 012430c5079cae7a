#include "platform/windows/WindowsStreamSocket.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <utility>

#include "platform/windows/AnsiText.h"

namespace tarnwick {
namespace {

constexpr UINT kFirstMessage = WM_APP;
// After so many connections the message numbers come again; those of the first are gone by then.
constexpr UINT kConnections = 1000;

}  // namespace

// What a message tells. Each connection has message numbers of its own: messages of one that was closed may
// still wait, and the next one may get its socket handle.
enum class WindowsStreamSocket::Tells : UINT { kLookedUp, kNetworkEvent, kSent, kError, kCount };

UINT WindowsStreamSocket::MessageOf(Tells tells) const {
  return kFirstMessage + connection_ * static_cast<UINT>(Tells::kCount) + static_cast<UINT>(tells);
}

WindowsStreamSocket::WindowsStreamSocket()
    : window_(
          [this](UINT message, WPARAM wParam, LPARAM lParam) { return OnMessage(message, wParam, lParam); }) {
  WSADATA data = {};
  started_ = SocketsOwner(WSAStartup(MAKEWORD(2, 2), &data) == 0);
}

WindowsStreamSocket::~WindowsStreamSocket() {
  events_ = nullptr;
  Close();
}

void WindowsStreamSocket::Close() {
  if (lookup_) {
    WSACancelAsyncRequest(lookup_);
    // Wine: the look-up may go on and write its answer, so the memory for that is left to it.
    static_cast<void>(lookupAnswer_.release());
  }
  lookup_ = nullptr;
  pending_.clear();
  socket_ = {};
  sent_ = false;
  connection_ = (connection_ + 1) % kConnections;
}

// Told as a message: nothing is told inside a call.
void WindowsStreamSocket::TellError(int error) {
  PostMessageW(window_.Get(), MessageOf(Tells::kError), static_cast<WPARAM>(error), 0);
}

void WindowsStreamSocket::Connect(TextView host, std::uint16_t port) {
  Close();
  port_ = port;
  const auto name = AnsiFromText(host);
  if (!name) return TellError(WSAHOST_NOT_FOUND);
  // A number needs no look-up, which would cost a thread each time.
  const unsigned long number = inet_addr(name->c_str());
  if (number != INADDR_NONE) return ConnectTo(number);
  lookupAnswer_ = std::make_unique<char[]>(MAXGETHOSTSTRUCT);
  lookup_ = WSAAsyncGetHostByName(window_.Get(), MessageOf(Tells::kLookedUp), name->c_str(),
                                  lookupAnswer_.get(), MAXGETHOSTSTRUCT);
  if (!lookup_) TellError(WSAGetLastError());
}

void WindowsStreamSocket::ConnectTo(std::uint32_t address) {
  socket_ = SocketOwner(socket(AF_INET, SOCK_STREAM, IPPROTO_TCP));
  if (!socket_ || WSAAsyncSelect(socket_.Get(), window_.Get(), MessageOf(Tells::kNetworkEvent),
                                 FD_CONNECT | FD_READ | FD_WRITE | FD_CLOSE) != 0)
    return TellError(WSAGetLastError());
  sockaddr_in peer = {};
  peer.sin_family = AF_INET;
  peer.sin_port = htons(port_);
  peer.sin_addr.s_addr = address;
  if (connect(socket_.Get(), reinterpret_cast<const sockaddr*>(&peer), sizeof peer) != 0 &&
      WSAGetLastError() != WSAEWOULDBLOCK)
    TellError(WSAGetLastError());
}

void WindowsStreamSocket::Send(std::string_view bytes) {
  pending_.append(bytes);
  while (!pending_.empty()) {
    const int count = send(socket_.Get(), pending_.data(),
                           static_cast<int>(std::min<std::size_t>(pending_.size(), 1U << 30)), 0);
    // What cannot go now goes when the socket tells that it may.
    if (count <= 0) return;
    pending_.erase(0, static_cast<std::size_t>(count));
    sent_ = true;
    PostMessageW(window_.Get(), MessageOf(Tells::kSent), 0, 0);
  }
}

std::size_t WindowsStreamSocket::Read(std::span<char> room) {
  const int most = static_cast<int>(std::min<std::size_t>(room.size(), std::numeric_limits<int>::max()));
  read_ = true;
  const int count = recv(socket_.Get(), room.data(), most, 0);
  return count > 0 ? static_cast<std::size_t>(count) : 0;
}

bool WindowsStreamSocket::OnMessage(UINT message, WPARAM wParam, LPARAM lParam) {
  constexpr UINT kCount = static_cast<UINT>(Tells::kCount);
  if (message < kFirstMessage || message >= kFirstMessage + kConnections * kCount) return false;
  if (!events_ || (message - kFirstMessage) / kCount != connection_) return true;
  switch (static_cast<Tells>((message - kFirstMessage) % kCount)) {
    case Tells::kLookedUp:
      OnLookedUp(WSAGETASYNCERROR(lParam));
      break;
    case Tells::kNetworkEvent:
      // The answer to what was sent may be posted before the message that tells of the sending.
      if (TellSent()) OnNetworkEvent(WSAGETSELECTEVENT(lParam), WSAGETSELECTERROR(lParam));
      break;
    case Tells::kSent:
      TellSent();
      break;
    case Tells::kError:
    case Tells::kCount:
      events_->OnSocketError(static_cast<std::int32_t>(wParam));
      break;
  }
  return true;
}

bool WindowsStreamSocket::TellSent() {
  const UINT connection = connection_;
  if (std::exchange(sent_, false)) events_->OnSent();
  return connection == connection_;
}

void WindowsStreamSocket::OnLookedUp(int error) {
  lookup_ = nullptr;
  const auto* found = reinterpret_cast<const hostent*>(lookupAnswer_.get());
  if (error != 0 || found->h_length != sizeof(std::uint32_t))
    return events_->OnSocketError(WSAHOST_NOT_FOUND);
  std::uint32_t address = 0;
  std::memcpy(&address, found->h_addr_list[0], sizeof address);
  const UINT connection = connection_;
  events_->OnResolved();
  if (connection == connection_) ConnectTo(address);
}

void WindowsStreamSocket::OnNetworkEvent(int event, int error) {
  if (error != 0) return events_->OnSocketError(error);
  switch (event) {
    case FD_CONNECT:
      return events_->OnConnected();
    case FD_WRITE:
      return Send({});
    case FD_READ:
      return events_->OnReadable();
    case FD_CLOSE:
      return OnClose();
    default:
      return;
  }
}

void WindowsStreamSocket::OnClose() {
  const UINT connection = connection_;
  while (connection == connection_) {
    // What arrived before the close is still to be read; a reset may follow even now.
    char next = 0;
    const int left = recv(socket_.Get(), &next, 1, MSG_PEEK);
    if (left < 0 && WSAGetLastError() != WSAEWOULDBLOCK) return events_->OnSocketError(WSAGetLastError());
    if (left <= 0) {
      // Whoever was reset cannot send any more, not even nothing, but whose peer has closed in an orderly way
      // can. Wine: a reset may arrive as an orderly close.
      if (send(socket_.Get(), &next, 0, 0) != 0) return events_->OnSocketError(WSAECONNRESET);
      return events_->OnClosedByPeer();
    }
    read_ = false;
    events_->OnReadable();
    // Nobody wants it: the download is over, and its socket was left open.
    if (!read_) return;
  }
}

}  // namespace tarnwick
