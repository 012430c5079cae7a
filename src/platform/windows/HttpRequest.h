// One request of the system's HTTP client, which works on threads of its own and tells what happens there.
#pragma once

#include "platform/windows/WindowsHeaders.h"
// Needs the types of the header above.
#include <winhttp.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "base/Secret.h"
#include "base/Text.h"
#include "platform/windows/Owner.h"

namespace tarnwick {

using HttpOwner = Owner<HINTERNET, WinHttpCloseHandle>;

// What the system tells of one request, and the memory that it reads and writes. Both live until it has let
// go of the request.
struct HttpExchange {
  explicit HttpExchange(bool isSecure) : secure(isSecure) {}
  // Forms and the heads of uploads hold passwords, some answers hold keys.
  ~HttpExchange() {
    for (std::string* const bytes : {&piece, &next, &answer}) Wipe(*bytes);
  }

  const bool secure;
  // Something was told.
  const HandleOwner told{CreateEventW(nullptr, FALSE, FALSE, nullptr)};
  // The notification that ended the call that runs; 0 until it comes.
  std::atomic<DWORD> end = 0;
  // Bytes that a read has brought, or that wait for one.
  std::atomic<DWORD> count = 0;
  // The system's number of a failed call, and what it said against the certificate
  // (WINHTTP_CALLBACK_STATUS_FLAG_...).
  std::atomic<DWORD> error = 0;
  std::atomic<DWORD> certificateFlags = 0;
  // When the peer last took or gave a byte.
  std::atomic<ULONGLONG> heard = GetTickCount64();
  // A connection was made for this request; the request goes over one now.
  std::atomic<bool> made = false;
  std::atomic<bool> connected = false;
  // The peer has ended the connection while its answer was read.
  std::atomic<bool> ended = false;
  std::atomic<bool> closed = false;
  // What is sent, and what is read meanwhile.
  std::string piece;
  std::string next;
  std::string answer;

  // Posts `message` with a notification and its `count` to the window from here on; with null, to none.
  void TellWindow(HWND window, UINT message);
  // On a thread of the system.
  void Told(DWORD status, DWORD itsCount);

 private:
  std::mutex lock_;
  HWND window_ = nullptr;
  UINT message_ = 0;
};

// Head of a request.
struct HttpHead {
  const wchar_t* verb;
  bool secure;
  Text host;
  std::uint16_t port;
  std::string target;
  // Lines of the head, each with CR LF at its end.
  std::wstring headers;
};

class HttpRequest {
 public:
  // Opens the request; nothing of it goes over the network yet. Redirects, cookies and passwords of the
  // system are left out; a secure one takes TLS 1.2 and later versions. The time-outs are the system's, which
  // not every version of it keeps.
  HttpRequest(const HttpHead& head, std::uint32_t connectMs, std::uint32_t silenceMs);
  // Closes the request and waits a little for the system to let go of it. Wine: a call that blocks cannot be
  // ended; it is left behind, with the library loaded until the process ends.
  ~HttpRequest();
  HttpRequest(const HttpRequest&) = delete;
  HttpRequest& operator=(const HttpRequest&) = delete;

  // Closes the request as its destructor does, on a thread of the system's pool.
  static void CloseLater(std::unique_ptr<HttpRequest> request);

  // Null when it could not be opened.
  HINTERNET Get() const { return request_.Get(); }
  HttpExchange& Exchange() const { return *exchange_; }

  // Begins to connect and to send the head.
  bool Send();

  // Of the answer, once its head is there.
  std::optional<std::wstring> Header(DWORD which) const;
  int Status() const;
  bool IsChunked() const { return Header(WINHTTP_QUERY_TRANSFER_ENCODING).has_value(); }
  // The announced length of the body, if there is one. A length that nobody can read fits no bound.
  std::optional<std::uint64_t> AnnouncedLength() const;
  // Whether a body of so many bytes, after which nothing came, may be cut short. Neither the system nor Wine
  // tells of a connection that was cut.
  bool IsCut(std::uint64_t received) const;

 private:
  const std::shared_ptr<HttpExchange> exchange_;
  // The system's share, once there is a request.
  std::shared_ptr<HttpExchange>* share_ = nullptr;
  HttpOwner session_;
  HttpOwner connection_;
  HttpOwner request_;
};

// The http_error that the failure of an exchange is, 0 when nothing can be said to it. Wine: whatever is
// wrong with a certificate is kSecureChannel.
std::int32_t HttpErrorOf(const HttpExchange& exchange);

}  // namespace tarnwick
