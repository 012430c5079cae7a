#include "platform/windows/WindowsStreamSocket.h"

#include <ws2tcpip.h>

#include <algorithm>
#include <limits>
#include <optional>
#include <utility>

#include "platform/windows/AnsiText.h"

namespace tarnwick {
namespace {

constexpr UINT kFirstMessage = WM_APP;
// After so many connections the message numbers come again; those of the first are gone by then.
constexpr UINT kConnections = 1000;

template <typename Peer>
SocketAddress AddressOf(const Peer& peer) {
  return {reinterpret_cast<const char*>(&peer), sizeof peer};
}

// Whether `host` can only be an IPv6 number: no name has a colon or a bracket.
bool LooksLikeIpv6(const std::string& host) {
  return host.find_first_of("[:") != std::string::npos;
}

// The address that `host` writes out in numbers, an IPv6 one also in brackets.
std::optional<SocketAddress> AddressInNumbers(const std::string& host, std::uint16_t port) {
  if (!LooksLikeIpv6(host)) {
    sockaddr_in peer = {};
    peer.sin_family = AF_INET;
    peer.sin_port = htons(port);
    peer.sin_addr.s_addr = inet_addr(host.c_str());
    if (peer.sin_addr.s_addr == INADDR_NONE) return std::nullopt;
    return AddressOf(peer);
  }
  std::string number = host;
  sockaddr_in6 peer = {};
  int size = sizeof peer;
  if (WSAStringToAddressA(number.data(), AF_INET6, nullptr, reinterpret_cast<sockaddr*>(&peer), &size) != 0)
    return std::nullopt;
  peer.sin6_port = htons(port);
  return AddressOf(peer);
}

}  // namespace

// What a message tells. Each connection has message numbers of its own: messages of one that was closed may
// still wait, and the next one may get its socket handle.
enum class WindowsStreamSocket::Tells : UINT { kNetworkEvent, kSent, kError, kCount };

UINT WindowsStreamSocket::MessageOf(Tells tells) const {
  return kFirstMessage + connection_ * static_cast<UINT>(Tells::kCount) + static_cast<UINT>(tells);
}

WindowsStreamSocket::WindowsStreamSocket(std::unique_ptr<Resolver> resolver, std::uint32_t connectMs)
    : started_(StartSockets()),
      resolver_(std::move(resolver)),
      connectMs_(connectMs),
      window_(
          [this](UINT message, WPARAM wParam, LPARAM lParam) { return OnMessage(message, wParam, lParam); }) {
  share_.SetHandler([this] { OnShareIsOver(); });
}

WindowsStreamSocket::~WindowsStreamSocket() {
  events_ = nullptr;
  Close();
}

void WindowsStreamSocket::Close() {
  resolver_->Cancel();
  addresses_.clear();
  share_.Stop();
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
  const auto name = AnsiFromText(host);
  if (!name) return TellError(WSAHOST_NOT_FOUND);
  // A number needs no look-up, which would cost a thread each time.
  if (const auto address = AddressInNumbers(*name, port)) return ConnectToOneOf({*address});
  if (LooksLikeIpv6(*name)) return TellError(WSAHOST_NOT_FOUND);
  resolver_->LookUp(host, port,
                    [this](std::vector<SocketAddress> addresses) { OnLookedUp(std::move(addresses)); });
}

void WindowsStreamSocket::ConnectToOneOf(std::vector<SocketAddress> addresses) {
  deadline_ = addresses.size() > 1 ? GetTickCount64() + connectMs_ : 0;
  addresses_ = std::move(addresses);
  ConnectToNext();
}

void WindowsStreamSocket::ConnectToNext() {
  int error = WSAHOST_NOT_FOUND;
  while (!addresses_.empty()) {
    // Each gets its share of what the ones before have left, so that a silent one leaves time for the rest.
    const std::uint64_t now = GetTickCount64();
    const std::uint64_t share = (std::max(deadline_, now) - now) / addresses_.size();
    // What still waits is of the address before.
    connection_ = (connection_ + 1) % kConnections;
    const SocketAddress address = std::move(addresses_.front());
    addresses_.erase(addresses_.begin());
    error = ConnectTo(address);
    if (error != 0) continue;
    if (deadline_ != 0) share_.Start(static_cast<std::uint32_t>(share));
    return;
  }
  share_.Stop();
  TellError(error);
}

int WindowsStreamSocket::ConnectTo(const SocketAddress& address) {
  const auto* peer = reinterpret_cast<const sockaddr*>(address.data());
  socket_ = SocketOwner(socket(peer->sa_family, SOCK_STREAM, IPPROTO_TCP));
  if (!socket_ || WSAAsyncSelect(socket_.Get(), window_.Get(), MessageOf(Tells::kNetworkEvent),
                                 FD_CONNECT | FD_READ | FD_WRITE | FD_CLOSE) != 0)
    return WSAGetLastError();
  if (connect(socket_.Get(), peer, static_cast<int>(address.size())) == 0) return 0;
  const int error = WSAGetLastError();
  return error == WSAEWOULDBLOCK ? 0 : error;
}

void WindowsStreamSocket::OnShareIsOver() {
  if (!events_) return;
  if (!addresses_.empty()) return ConnectToNext();
  Close();
  events_->OnSocketError(WSAETIMEDOUT);
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

void WindowsStreamSocket::OnLookedUp(std::vector<SocketAddress> addresses) {
  if (!events_) return;
  if (addresses.empty()) return events_->OnSocketError(WSAHOST_NOT_FOUND);
  const UINT connection = connection_;
  events_->OnResolved();
  if (connection == connection_) ConnectToOneOf(std::move(addresses));
}

void WindowsStreamSocket::OnNetworkEvent(int event, int error) {
  if (error != 0 && !addresses_.empty()) return ConnectToNext();
  // There is a connection, or there will be none.
  addresses_.clear();
  share_.Stop();
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
