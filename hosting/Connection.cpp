#include "hosting/Connection.h"

#include <fcntl.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <openssl/err.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <chrono>
#include <cstring>

namespace tarnwick::hosting {
namespace {

using Clock = std::chrono::steady_clock;
using Kind = Fault::Kind;

constexpr std::size_t kBlock = 64 * 1024;
constexpr std::uint64_t kLongestHead = 64 * 1024;
constexpr int kPatience = 30'000;  // milliseconds without a byte
constexpr int kForEver = -1;
constexpr std::uint64_t kLateCloseDelay = 20;  // milliseconds

// How long a closed connection waits for its client to have read the answer, and how much it still takes from
// it: closing with unread bytes would reset the connection and lose the answer.
constexpr int kLingerPatience = 1'000;
constexpr std::uint64_t kLingerBytes = std::uint64_t{8} << 20;

constexpr std::string_view kHeadTooLong =
    "HTTP/1.1 431 Request Header Fields Too Large\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";
constexpr std::string_view kLengthName = "\r\nContent-Length: ";

std::uint64_t AnnouncedLength(std::string_view head) {
  std::uint64_t length = 0;
  if (const std::size_t at = head.find(kLengthName); at != std::string_view::npos)
    std::from_chars(head.data() + at + kLengthName.size(), head.data() + head.size(), length);
  return length;
}

void ReplaceLength(std::string& head, std::uint64_t length) {
  const std::size_t at = head.find(kLengthName);
  if (at == std::string::npos) return;
  const std::size_t digits = at + kLengthName.size();
  head.replace(digits, head.find("\r\n", digits) - digits, std::to_string(length));
}

void RemoveHeader(std::string& head, std::string_view name) {
  if (const std::size_t at = head.find(name); at != std::string::npos)
    head.erase(at, head.find("\r\n", at + name.size()) - at);
}

}  // namespace

Connection::Connection(int socket, int stopEvent, TlsSession tls)
    : socket_(socket), stopEvent_(stopEvent), tls_(std::move(tls)) {
  // Head and body are sent apart: without this the second one waits for the client's late acknowledgement.
  const int on = 1;
  setsockopt(socket_, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
  if (tls_) {
    fcntl(socket_, F_SETFL, fcntl(socket_, F_GETFL) | O_NONBLOCK);
    SSL_set_fd(tls_.get(), socket_);
  }
}

Connection::~Connection() {
  if (end_ == End::kReset) {
    const linger hard{1, 0};
    setsockopt(socket_, SOL_SOCKET, SO_LINGER, &hard, sizeof hard);
  } else if (end_ != End::kLost) {
    if (const Fault* late = Shown(Kind::kLateClose))
      Wait(POLLRDHUP, static_cast<int>(late->amount.value_or(kLateCloseDelay)));
    if (tls_ && end_ != End::kCut) SSL_shutdown(tls_.get());
    shutdown(socket_, SHUT_WR);
    const auto deadline = Clock::now() + std::chrono::milliseconds(kLingerPatience);
    std::uint64_t taken = 0;
    buffer_.resize(kBlock);
    while (taken < kLingerBytes && Clock::now() < deadline && Wait(POLLIN, kLingerPatience)) {
      const ssize_t got = recv(socket_, buffer_.data(), buffer_.size(), MSG_DONTWAIT);
      if (got <= 0) break;
      taken += static_cast<std::uint64_t>(got);
    }
  }
  close(socket_);
}

void Connection::Stall() {
  // Only the client's end shows on a socket from which nothing is expected.
  Wait(POLLRDHUP, kForEver);
  if (!IsOver()) end_ = End::kCut;
}

bool Connection::AwaitRequest(int milliseconds) {
  if (IsOver() || Shown(Kind::kLateClose)) return false;
  faults_.clear();
  isHeadRead_ = isHeadSent_ = false;
  readBytes_ = sentBytes_ = 0;
  status_ = 0;
  bodyLimit_.reset();
  const auto patience = std::chrono::milliseconds(milliseconds);
  headDeadline_ = Clock::now() + patience;
  if (tls_ && !ShakeHands()) return false;
  const bool hasBegun = position_ < buffer_.size() || Fill();
  headDeadline_ = Clock::now() + patience;
  return hasBegun;
}

void Connection::Show(const std::vector<Fault>& faults) {
  faults_.insert(faults_.end(), faults.begin(), faults.end());
  if (Shown(Kind::kRefuse)) end_ = End::kClosed;
  if (Shown(Kind::kResetRequest)) end_ = End::kReset;
}

ssize_t Connection::read(char* bytes, size_t size) {
  if (IsOver()) return -1;
  if (position_ == buffer_.size() && !Fill()) return IsOver() ? -1 : 0;
  const std::size_t got = std::min(size, buffer_.size() - position_);
  std::memcpy(bytes, buffer_.data() + position_, got);
  position_ += got;
  readBytes_ += got;
  if (!isHeadRead_ && readBytes_ > kLongestHead) {
    SendAtOnce(kHeadTooLong);
    status_ = 431;
    end_ = End::kClosed;
    return -1;
  }
  return static_cast<ssize_t>(got);
}

ssize_t Connection::write(const char* bytes, size_t size) {
  const std::string_view text(bytes, size);
  if (IsOver()) return -1;
  // The library sends the head in one piece, after an interim "100 Continue" where the client asked for it.
  bool isSent = false;
  if (isHeadSent_)
    isSent = SendBody(text);
  else if (text.starts_with("HTTP/1.1 100"))
    isSent = Send(text);
  else
    isSent = SendHead(text);
  return isSent ? static_cast<ssize_t>(size) : -1;
}

// Waits until the socket is ready (a lost connection is too). False after the time or when the server stops.
bool Connection::Wait(short events, int milliseconds) {
  std::array<pollfd, 2> watched{pollfd{socket_, events, 0}, pollfd{stopEvent_, POLLIN, 0}};
  int ready = 0;
  do {
    ready = poll(watched.data(), watched.size(), milliseconds);
  } while (ready < 0 && errno == EINTR);
  if (watched[1].revents != 0) {
    end_ = End::kLost;
    return false;
  }
  return ready > 0;
}

bool Connection::AwaitHead(short events) {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(headDeadline_ - Clock::now()).count();
  if (left > 0 && Wait(events, static_cast<int>(left))) return true;
  if (!IsOver()) end_ = End::kClosed;
  return false;
}

// True as well when that was done before.
bool Connection::ShakeHands() {
  for (;;) {
    // What other connections of this thread left in its queue would pass for an error of this one.
    ERR_clear_error();
    const int result = SSL_accept(tls_.get());
    if (result == 1) return true;
    const int error = SSL_get_error(tls_.get(), result);
    const bool goesOn = (error == SSL_ERROR_WANT_READ && AwaitHead(POLLIN)) ||
                        (error == SSL_ERROR_WANT_WRITE && AwaitHead(POLLOUT));
    if (goesOn) continue;
    if (end_ != End::kLost) end_ = End::kCut;  // the alert, if there was a reason for one, is sent
    return false;
  }
}

// A body may take as long as it arrives. A head may not: a client that sends one byte of it now and then
// would keep the connection for hours.
bool Connection::AwaitBytes() {
  return isHeadRead_ ? Wait(POLLIN, kPatience) : AwaitHead(POLLIN);
}

bool Connection::Fill() {
  std::optional<ssize_t> received;
  while (!received && AwaitBytes()) {
    buffer_.resize(kBlock);
    received = Receive(buffer_.data(), buffer_.size());
  }
  position_ = 0;
  const ssize_t got = received.value_or(0);
  buffer_.resize(got > 0 ? static_cast<std::size_t>(got) : 0);
  if (got < 0) end_ = End::kLost;
  return got > 0;
}

// Takes what is there: the number of bytes, 0 after the client's last one, -1 when the connection is lost.
// The room must hold a record of TLS, 16 KiB: what stayed in OpenSSL would not show on the socket. None:
// nothing has come yet, or no whole record of TLS.
std::optional<ssize_t> Connection::Receive(char* bytes, std::size_t size) {
  if (!tls_) {
    const ssize_t got = recv(socket_, bytes, size, MSG_DONTWAIT);
    return got < 0 && errno == EAGAIN ? std::nullopt : std::optional(got);
  }
  ERR_clear_error();
  std::size_t got = 0;
  const int result = SSL_read_ex(tls_.get(), bytes, size, &got);
  if (result == 1) return static_cast<ssize_t>(got);
  const int error = SSL_get_error(tls_.get(), result);
  if (error == SSL_ERROR_WANT_READ || error == SSL_ERROR_WANT_WRITE) return std::nullopt;
  return error == SSL_ERROR_ZERO_RETURN ? 0 : -1;
}

// Sends as many bytes as can leave now: their number, -1 when the connection is lost. None: not one can.
std::optional<ssize_t> Connection::Transmit(std::string_view bytes) {
  if (!tls_) {
    const ssize_t sent = send(socket_, bytes.data(), bytes.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
    return sent < 0 && errno == EAGAIN ? std::nullopt : std::optional(sent);
  }
  ERR_clear_error();
  std::size_t sent = 0;
  const int result = SSL_write_ex(tls_.get(), bytes.data(), bytes.size(), &sent);
  if (result == 1) return static_cast<ssize_t>(sent);
  return SSL_get_error(tls_.get(), result) == SSL_ERROR_WANT_WRITE ? std::nullopt
                                                                   : std::optional(ssize_t{-1});
}

bool Connection::SendHead(std::string_view head) {
  isHeadSent_ = true;
  if (const Fault* stall = Shown(Kind::kStall)) {
    // Only the client's end shows on a socket from which nothing is expected.
    const int delay = stall->amount ? static_cast<int>(*stall->amount * 1000) : kForEver;
    if (Wait(POLLRDHUP, delay) || IsOver()) {
      if (!IsOver()) end_ = End::kClosed;
      return false;
    }
  }
  constexpr std::size_t kStatusAt = std::string_view("HTTP/1.1 ").size();
  if (head.size() > kStatusAt) std::from_chars(head.data() + kStatusAt, head.data() + head.size(), status_);

  const std::uint64_t length = AnnouncedLength(head);
  if (const Fault* cut = Shown(Kind::kCut)) bodyLimit_ = cut->amount.value_or(length / 2);
  if (Shown(Kind::kResetBody)) bodyLimit_ = length / 2;
  if (Shown(Kind::kResetHead)) {
    Send(head.substr(0, head.size() / 2));
    end_ = End::kReset;
    return false;
  }
  std::string sent(head);
  if (const Fault* lie = Shown(Kind::kLength)) ReplaceLength(sent, *lie->amount);
  if (Shown(Kind::kLateClose))
    for (const std::string_view name : {"\r\nConnection: ", "\r\nKeep-Alive: "}) RemoveHeader(sent, name);
  return Send(sent) && SendBody({});
}

bool Connection::SendBody(std::string_view body) {
  const bool ends = bodyLimit_ && body.size() >= *bodyLimit_ - sentBytes_;
  if (ends) body = body.substr(0, *bodyLimit_ - sentBytes_);
  if (!Send(body)) return false;
  sentBytes_ += body.size();
  if (ends) end_ = Shown(Kind::kResetBody) ? End::kReset : End::kCut;
  return !ends;
}

bool Connection::Send(std::string_view bytes) {
  const Fault* drip = Shown(Kind::kDrip);
  if (!drip) return SendAtOnce(bytes);
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    if (Wait(0, static_cast<int>(*drip->amount)) && !IsOver()) end_ = End::kClosed;
    if (IsOver() || !SendAtOnce(bytes.substr(i, 1))) return false;
  }
  return true;
}

bool Connection::SendAtOnce(std::string_view bytes) {
  while (!bytes.empty()) {
    const std::optional<ssize_t> sent = Transmit(bytes);
    if (sent ? *sent < 0 : !Wait(POLLOUT, kPatience)) {
      end_ = End::kLost;
      return false;
    }
    bytes.remove_prefix(static_cast<std::size_t>(sent.value_or(0)));
  }
  return true;
}

const Fault* Connection::Shown(Kind kind) const {
  const auto found =
      std::find_if(faults_.begin(), faults_.end(), [&](const Fault& fault) { return fault.kind == kind; });
  return found == faults_.end() ? nullptr : &*found;
}

}  // namespace tarnwick::hosting
