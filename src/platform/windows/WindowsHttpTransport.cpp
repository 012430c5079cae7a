#include "platform/windows/WindowsHttpTransport.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <limits>
#include <string>

#include "platform/windows/AnsiText.h"
#include "platform/windows/InternetOwner.h"

namespace tarnwick {
namespace {

constexpr DWORD kRequestFlags = INTERNET_FLAG_NO_AUTO_REDIRECT | INTERNET_FLAG_RELOAD |
                                INTERNET_FLAG_NO_CACHE_WRITE | INTERNET_FLAG_PRAGMA_NOCACHE |
                                INTERNET_FLAG_NO_COOKIES | INTERNET_FLAG_NO_AUTH | INTERNET_FLAG_NO_UI;

constexpr std::size_t kFirstRoom = 16 * 1024;

std::wstring WideFromAscii(std::string_view ascii) {
  return {ascii.begin(), ascii.end()};
}

std::optional<std::wstring> Header(HINTERNET request, DWORD which) {
  std::array<wchar_t, 64> value{};
  DWORD size = sizeof value;
  if (!HttpQueryInfoW(request, which, value.data(), &size, nullptr)) return std::nullopt;
  return std::wstring(value.data());
}

// The announced length of the body, if there is one.
std::optional<std::uint64_t> AnnouncedLength(HINTERNET request) {
  // Chunks say their lengths themselves.
  if (Header(request, HTTP_QUERY_TRANSFER_ENCODING)) return std::nullopt;
  const auto header = Header(request, HTTP_QUERY_CONTENT_LENGTH);
  if (!header) return std::nullopt;
  std::string digits(header->size(), '?');
  std::transform(header->begin(), header->end(), digits.begin(),
                 [](wchar_t unit) { return unit < 0x7F ? static_cast<char>(unit) : '?'; });
  std::uint64_t length = 0;
  const char* end = digits.data() + digits.size();
  const auto [stop, status] = std::from_chars(digits.data(), end, length);
  // A length that nobody can read fits no bound.
  if (status != std::errc{} || stop != end) return std::numeric_limits<std::uint64_t>::max();
  return length;
}

// Reads the whole body into `body`; false when it is cut short, too long or silent. In chunks, some versions
// of the system do not tell a body that is cut short from a whole one.
bool ReadBody(HINTERNET request, std::size_t maxBytes, std::string& body) {
  const auto announced = AnnouncedLength(request);
  if (announced && *announced > maxBytes) return false;
  std::size_t used = 0;
  body.resize(announced ? static_cast<std::size_t>(*announced) : std::min(kFirstRoom, maxBytes));
  for (;;) {
    if (used == body.size()) {
      if (announced) return true;
      // One byte beyond the bound tells a body that just fits from one that does not.
      if (used > maxBytes) return false;
      body.resize(used < maxBytes ? used + std::min(std::max(used, kFirstRoom), maxBytes - used)
                                  : maxBytes + 1);
    }
    const auto room = static_cast<DWORD>(std::min<std::size_t>(body.size() - used, 1U << 30));
    DWORD received = 0;
    if (!InternetReadFile(request, body.data() + used, room, &received)) return false;
    if (received == 0) break;
    used += received;
  }
  if (announced || used > maxBytes) return false;
  body.resize(used);
  return true;
}

}  // namespace

std::optional<HttpAnswer> WindowsHttpTransport::Post(const HttpPost& post, std::size_t maxBodyBytes) {
  if (post.body.size() > std::numeric_limits<DWORD>::max()) return std::nullopt;
  // Opened for each post, which costs little: so a change of the system's proxy settings counts at once.
  const InternetOwner session(InternetOpenW(L"Tarnwick", INTERNET_OPEN_TYPE_PRECONFIG, nullptr, nullptr, 0));
  if (!session) return std::nullopt;
  SetTimeouts(session.Get(), connectMs_, silenceMs_);
  const InternetOwner connection(InternetConnectW(session.Get(), WideFromText(post.host).c_str(), post.port,
                                                  nullptr, nullptr, INTERNET_SERVICE_HTTP, 0, 0));
  if (!connection) return std::nullopt;
  const wchar_t* acceptTypes[] = {L"*/*", nullptr};
  const InternetOwner request(HttpOpenRequestW(connection.Get(), L"POST", WideFromAscii(post.target).c_str(),
                                               L"HTTP/1.1", nullptr, acceptTypes, kRequestFlags, 0));
  if (!request) return std::nullopt;
  SetTimeouts(request.Get(), connectMs_, silenceMs_);

  // A post may have been carried out although its answer was lost, so it is sent exactly once. On a kept
  // connection that the server has closed meanwhile, the system would either fail or send it again on its
  // own, and could not tell which of the two is right. Hence a connection for each post.
  const std::wstring headers =
      L"Content-Type: " + WideFromAscii(post.contentType) + L"\r\nConnection: close\r\n";
  // The system only reads the body, whatever its declaration says.
  if (!HttpSendRequestW(request.Get(), headers.c_str(), static_cast<DWORD>(headers.size()),
                        const_cast<char*>(post.body.data()), static_cast<DWORD>(post.body.size())))
    return std::nullopt;

  DWORD status = 0;
  DWORD statusSize = sizeof status;
  if (!HttpQueryInfoW(request.Get(), HTTP_QUERY_STATUS_CODE | HTTP_QUERY_FLAG_NUMBER, &status, &statusSize,
                      nullptr) ||
      status < 100)  // a connection that ended before it said anything has a status of 0 in some versions
    return std::nullopt;
  HttpAnswer answer;
  answer.status = static_cast<int>(status);
  if (!ReadBody(request.Get(), maxBodyBytes, answer.body)) return std::nullopt;
  return answer;
}

}  // namespace tarnwick
