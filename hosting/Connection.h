// One client's connection. It hands cpp-httplib the bytes of one request after the other and sends the
// answers, spoilt by faults where they are to be shown: the library has no place of its own where a
// connection can be reset, cut or slowed down, with TLS or without. All waits end at once when the server
// stops, and none uses processor time.
#pragma once

#include <httplib.h>

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "hosting/Faults.h"
#include "hosting/Tls.h"

namespace tarnwick::hosting {

class Connection : public httplib::Stream {
 public:
  // Owns the socket. `stopEvent` becomes readable when the server stops and must outlive the connection. With
  // a session, all bytes go over TLS.
  Connection(int socket, int stopEvent, TlsSession tls = {});
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;
  ~Connection() override;

  // Says nothing until the client goes.
  void Stall();

  // Waits for the first byte of the next request, the first time for TLS's handshake before that. False when
  // the client has gone or nothing came for so long.
  // From then on the head of the request has that time once more to come whole.
  bool AwaitRequest(int milliseconds);

  // Tells that the head of the request is read; until then its size and time are bounded.
  void EndHead() { isHeadRead_ = true; }

  // Adds faults to show until the next request. One that refuses or resets at once ends the connection.
  void Show(const std::vector<Fault>& faults);

  // Whether nothing can be read or sent any more.
  bool IsOver() const { return end_ != End::kOpen; }

  // Of the answer to the current request: its status (0: none was sent) and the bytes of its body.
  int Status() const { return status_; }
  std::uint64_t SentBytes() const { return sentBytes_; }
  // Bytes of the current request, as far as they were read.
  std::uint64_t ReadBytes() const { return readBytes_; }

  // httplib::Stream
  bool is_readable() const override { return !IsOver(); }
  bool is_writable() const override { return !IsOver(); }
  ssize_t read(char* bytes, size_t size) override;
  ssize_t write(const char* bytes, size_t size) override;
  void get_remote_ip_and_port(std::string&, int&) const override {}  // nobody asks
  void get_local_ip_and_port(std::string&, int&) const override {}
  socket_t socket() const override { return socket_; }

 private:
  // After kCut nothing tells that the end was meant: over TLS, the close-notify is missing.
  enum class End { kOpen, kClosed, kCut, kReset, kLost };

  bool Wait(short events, int milliseconds);
  bool AwaitHead(short events);
  bool ShakeHands();
  bool AwaitBytes();
  bool Fill();
  std::optional<ssize_t> Receive(char* bytes, std::size_t size);
  std::optional<ssize_t> Transmit(std::string_view bytes);
  bool SendHead(std::string_view head);
  bool SendBody(std::string_view body);
  bool Send(std::string_view bytes);
  bool SendAtOnce(std::string_view bytes);
  const Fault* Shown(Fault::Kind kind) const;

  int socket_;
  int stopEvent_;
  TlsSession tls_;  // none: without TLS
  std::string buffer_;
  std::size_t position_ = 0;  // of the first byte of the buffer that is not handed out
  End end_ = End::kOpen;

  // Of the current request.
  std::vector<Fault> faults_;
  bool isHeadRead_ = false;
  std::chrono::steady_clock::time_point headDeadline_;
  bool isHeadSent_ = false;
  std::uint64_t readBytes_ = 0;
  std::uint64_t sentBytes_ = 0;
  int status_ = 0;
  std::optional<std::uint64_t> bodyLimit_;  // bytes of the body after which a fault ends the connection
};

}  // namespace tarnwick::hosting
