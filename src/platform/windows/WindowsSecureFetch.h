#pragma once

#include <memory>
#include <optional>
#include <string>

#include "platform/SecureFetch.h"
#include "platform/windows/HttpRequest.h"
#include "platform/windows/MessageWindow.h"

namespace tarnwick {

// How long connection and handshake may take together. Wine: the system waits for a handshake without end.
inline constexpr std::uint32_t kHandshakeMs = 20'000;

// A fetch through the system's HTTP client, which works on threads of its own; what those tell comes as
// window messages.
class WindowsSecureFetch : public SecureFetch {
 public:
  // Tests shorten the time-out.
  explicit WindowsSecureFetch(std::uint32_t handshakeMs = kHandshakeMs);
  ~WindowsSecureFetch() override { Close(); }
  WindowsSecureFetch(const WindowsSecureFetch&) = delete;
  WindowsSecureFetch& operator=(const WindowsSecureFetch&) = delete;

  void SetEvents(SocketEvents* events) override { events_ = events; }
  void Begin(const HttpGet& get) override;
  std::size_t Read(std::span<char> room) override;
  void Close() override;

 private:
  bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam);
  void OnTold(DWORD status, DWORD count);
  void OnTimer();
  void OnHead();
  void OnBody(DWORD count);
  // Has more of the body fetched; false when that cannot even begin.
  bool ReadMore();
  // Hands over what waits; whether the fetch still goes on then.
  bool TellArrived();
  void Fail(std::int32_t httpError);
  UINT MessageOf(UINT which) const;

  const std::uint32_t handshakeMs_;
  SocketEvents* events_ = nullptr;
  std::unique_ptr<HttpRequest> request_;
  // Counts the fetches, so that messages of one that was closed can be told.
  UINT fetch_ = 0;
  Text host_;
  std::uint16_t port_ = 0;
  // What has arrived and was not read yet, and where that begins.
  std::string arrived_;
  std::size_t readFrom_ = 0;
  std::optional<std::uint64_t> announced_;
  std::uint64_t received_ = 0;
  // Bytes that are asked for next; 0 for what is there.
  std::size_t want_ = 0;
  ULONGLONG asked_ = 0;
  // When the peer was last heard, as far as was told.
  ULONGLONG heard_ = 0;
  MessageWindow window_;
};

}  // namespace tarnwick
