// A server on the loopback address that plays one scripted answer for each connection and keeps what it was
// sent.
#pragma once

#include <winsock2.h>
// Before any <windows.h>, whose own sockets are older.
#include <chrono>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace tarnwick {

class LoopbackServer {
 public:
  enum class End { kClose, kReset, kSilence };
  struct Answer {
    std::string bytes;
    End end = End::kClose;
  };

  explicit LoopbackServer(std::vector<Answer> answers) : answers_(std::move(answers)) {
    WSADATA data;
    WSAStartup(MAKEWORD(2, 2), &data);
    listener_ = socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    int size = sizeof address;
    if (bind(listener_, reinterpret_cast<sockaddr*>(&address), size) != 0 || listen(listener_, 8) != 0 ||
        getsockname(listener_, reinterpret_cast<sockaddr*>(&address), &size) != 0)
      throw std::runtime_error("no loopback socket");
    port_ = ntohs(address.sin_port);
    thread_ = std::thread([this] { Serve(); });
  }
  ~LoopbackServer() { Requests(); }
  LoopbackServer(const LoopbackServer&) = delete;
  LoopbackServer& operator=(const LoopbackServer&) = delete;

  std::uint16_t Port() const { return port_; }

  // Ends the server; what each connection had sent.
  const std::vector<std::string>& Requests() {
    if (thread_.joinable()) {
      thread_.join();
      closesocket(listener_);
      WSACleanup();
    }
    return requests_;
  }

 private:
  // True when there is something to accept or to read within `ms`.
  static bool Ready(SOCKET socket, long ms) {
    fd_set set;
    FD_ZERO(&set);
    set.fd_count = 1;
    set.fd_array[0] = socket;
    timeval limit{ms / 1000, ms % 1000 * 1000};
    return select(0, &set, nullptr, nullptr, &limit) > 0;
  }

  static bool Whole(const std::string& request) {
    const std::size_t head = request.find("\r\n\r\n");
    if (head == std::string::npos) return false;
    const std::size_t length = request.find("Content-Length: ");
    return length < head && request.size() - head - 4 >= std::stoul(request.substr(length + 16));
  }

  void Serve() {
    // One more than the answers, for a while: a request that nobody expects is to be seen too.
    for (std::size_t i = 0; i <= answers_.size(); ++i) {
      if (!Ready(listener_, i < answers_.size() ? 5000 : 150)) return;
      const SOCKET peer = accept(listener_, nullptr, nullptr);
      std::string request;
      char buffer[4096];
      while (!Whole(request) && Ready(peer, 2000)) {
        const int received = recv(peer, buffer, sizeof buffer, 0);
        if (received <= 0) break;
        request.append(buffer, static_cast<std::size_t>(received));
      }
      requests_.push_back(request);
      if (i < answers_.size()) Play(peer, answers_[i]);
      closesocket(peer);
    }
  }

  static void Play(SOCKET peer, const Answer& answer) {
    send(peer, answer.bytes.data(), static_cast<int>(answer.bytes.size()), 0);
    if (answer.end == End::kReset) {
      const linger now{1, 0};
      setsockopt(peer, SOL_SOCKET, SO_LINGER, reinterpret_cast<const char*>(&now), sizeof now);
    } else if (answer.end == End::kSilence) {
      // Until the client gives up.
      Ready(peer, 5000);
    }
  }

  std::vector<Answer> answers_;
  std::vector<std::string> requests_;
  SOCKET listener_ = INVALID_SOCKET;
  std::uint16_t port_ = 0;
  std::thread thread_;
};

}  // namespace tarnwick
