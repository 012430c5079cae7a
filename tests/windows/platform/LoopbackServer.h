// A server on the loopback address that plays one scripted answer for each connection and keeps what it was
// sent.
#pragma once

#include <winsock2.h>
// Before any <windows.h>, whose own sockets are older.
#include <ws2tcpip.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <limits>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

namespace tarnwick {

// A socket that listens on the loopback address of `family`; INVALID_SOCKET when there is none.
inline SOCKET ListenOnLoopback(int family, int most, std::uint16_t& port) {
  const SOCKET listener = socket(family, SOCK_STREAM, 0);
  sockaddr_in6 address{};
  int size = family == AF_INET6 ? sizeof address : sizeof(sockaddr_in);
  if (family == AF_INET6)
    address.sin6_addr.s6_addr[15] = 1;
  else
    reinterpret_cast<sockaddr_in&>(address).sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  address.sin6_family = static_cast<short>(family);
  auto* bare = reinterpret_cast<sockaddr*>(&address);
  if (bind(listener, bare, size) != 0 || listen(listener, most) != 0 ||
      getsockname(listener, bare, &size) != 0) {
    closesocket(listener);
    return INVALID_SOCKET;
  }
  // At the same place in both kinds of addresses.
  port = ntohs(address.sin6_port);
  return listener;
}

class LoopbackServer {
 public:
  enum class End { kClose, kReset, kSilence };
  struct Answer {
    std::string bytes;
    End end = End::kClose;
    // Reads no more than about this many bytes of the request, and pauses after each piece.
    std::size_t reads = std::numeric_limits<std::size_t>::max();
    unsigned pauseMs = 0;
  };

  explicit LoopbackServer(std::vector<Answer> answers, int family = AF_INET) : answers_(std::move(answers)) {
    WSADATA data;
    WSAStartup(MAKEWORD(2, 2), &data);
    listener_ = ListenOnLoopback(family, 8, port_);
    if (listener_ == INVALID_SOCKET) throw std::runtime_error("no loopback socket");
    thread_ = std::thread([this] { Serve(); });
  }
  ~LoopbackServer() { Requests(); }
  LoopbackServer(const LoopbackServer&) = delete;
  LoopbackServer& operator=(const LoopbackServer&) = delete;

  std::uint16_t Port() const { return port_; }

  // Ends the server; what each connection had sent.
  const std::vector<std::string>& Requests() {
    if (thread_.joinable()) {
      done_ = true;
      thread_.join();
      closesocket(listener_);
      WSACleanup();
    }
    return requests_;
  }

 private:
  enum class For { kRead, kWrite };

  // True when there is something to accept or to read, or room to write, within `ms`.
  static bool Ready(SOCKET socket, long ms, For what = For::kRead) {
    fd_set set;
    FD_ZERO(&set);
    set.fd_count = 1;
    set.fd_array[0] = socket;
    timeval limit{ms / 1000, ms % 1000 * 1000};
    return select(0, what == For::kRead ? &set : nullptr, what == For::kWrite ? &set : nullptr, nullptr,
                  &limit) > 0;
  }

  static bool Whole(const std::string& request) {
    const std::size_t head = request.find("\r\n\r\n");
    if (head == std::string::npos) return false;
    const std::size_t length = request.find("Content-Length: ");
    return length > head || request.size() - head - 4 >= std::stoul(request.substr(length + 16, 20));
  }

  void Serve() {
    // One more than the answers, for a while: a request that nobody expects is to be seen too.
    for (std::size_t i = 0; i <= answers_.size(); ++i) {
      if (!Ready(listener_, i < answers_.size() ? 5000 : 150)) return;
      const SOCKET peer = accept(listener_, nullptr, nullptr);
      const Answer answer = i < answers_.size() ? answers_[i] : Answer{};
      std::string request;
      char buffer[32 * 1024];
      while (request.size() < answer.reads && !Whole(request) && Ready(peer, 2000)) {
        const int received = recv(peer, buffer, sizeof buffer, 0);
        if (received <= 0) break;
        request.append(buffer, static_cast<std::size_t>(received));
        if (answer.pauseMs != 0) Sleep(answer.pauseMs);
      }
      requests_.push_back(request);
      if (i < answers_.size()) Play(peer, answer);
      closesocket(peer);
    }
  }

  void Play(SOCKET peer, const Answer& answer) {
    // A send that blocks is not always woken when the client goes: Wine forgets it now and then.
    unsigned long on = 1;
    ioctlsocket(peer, FIONBIO, &on);
    for (std::string_view rest = answer.bytes; !rest.empty() && !done_;) {
      if (!Ready(peer, 100, For::kWrite)) continue;
      const int sent = send(peer, rest.data(), static_cast<int>(rest.size()), 0);
      if (sent <= 0 && WSAGetLastError() != WSAEWOULDBLOCK) break;
      rest.remove_prefix(static_cast<std::size_t>(std::max(sent, 0)));
    }
    if (answer.end == End::kReset) {
      const linger now{1, 0};
      setsockopt(peer, SOL_SOCKET, SO_LINGER, reinterpret_cast<const char*>(&now), sizeof now);
    } else if (answer.end == End::kSilence) {
      // Until the client gives up: it ends the connection, or its test is done. What of its request was not
      // read is read only then, before which it would be no silence.
      const bool reads = answer.reads == std::numeric_limits<std::size_t>::max();
      for (int i = 0; i < 500 && !done_ && !(reads && Ready(peer, 0)); ++i) Sleep(10);
      char buffer[32 * 1024];
      while (!reads && Ready(peer, 500)) {
        const int received = recv(peer, buffer, sizeof buffer, 0);
        if (received <= 0) break;
        requests_.back().append(buffer, static_cast<std::size_t>(received));
      }
    }
  }

  std::vector<Answer> answers_;
  std::vector<std::string> requests_;
  SOCKET listener_ = INVALID_SOCKET;
  std::uint16_t port_ = 0;
  // Nothing more is asked of the server.
  std::atomic<bool> done_ = false;
  std::thread thread_;
};

}  // namespace tarnwick
