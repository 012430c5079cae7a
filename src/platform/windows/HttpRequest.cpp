#include "platform/windows/HttpRequest.h"

#include <algorithm>
#include <charconv>
#include <limits>
#include <utility>

#include "platform/HttpTransport.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/HttpSession.h"
#include "platform/windows/ThreadPool.h"

namespace tarnwick {
namespace {

// How long a request that was given up may take to end, before it is left behind.
constexpr DWORD kGraceMs = 200;

// `context` is a share in the exchange that goes with the request.
void CALLBACK OnTold(HINTERNET, DWORD_PTR context, DWORD status, void* information, DWORD length) {
  auto* const share = reinterpret_cast<std::shared_ptr<HttpExchange>*>(context);
  if (!share) return;
  HttpExchange& exchange = **share;
  DWORD count = 0;
  switch (status) {
    case WINHTTP_CALLBACK_STATUS_READ_COMPLETE:
      count = length;
      break;
    case WINHTTP_CALLBACK_STATUS_DATA_AVAILABLE:
    case WINHTTP_CALLBACK_STATUS_RESPONSE_RECEIVED:
    case WINHTTP_CALLBACK_STATUS_SECURE_FAILURE:
      if (information) count = *static_cast<const DWORD*>(information);
      break;
    case WINHTTP_CALLBACK_STATUS_REQUEST_ERROR:
      if (information) count = static_cast<const WINHTTP_ASYNC_RESULT*>(information)->dwError;
      break;
    case WINHTTP_CALLBACK_STATUS_HANDLE_CLOSING: {
      // The last one.
      const std::unique_ptr<std::shared_ptr<HttpExchange>> last(share);
      exchange.closed = true;
      SetEvent(exchange.told.Get());
      return;
    }
    default:
      break;
  }
  exchange.Told(status, count);
}

bool SetLeastProtocol(HINTERNET session) {
  const auto set = [&](DWORD protocols) {
    return WinHttpSetOption(session, WINHTTP_OPTION_SECURE_PROTOCOLS, &protocols, sizeof protocols) != FALSE;
  };
  // Systems that do not know the newer one refuse both.
  return set(WINHTTP_FLAG_SECURE_PROTOCOL_TLS1_2 | WINHTTP_FLAG_SECURE_PROTOCOL_TLS1_3) ||
         set(WINHTTP_FLAG_SECURE_PROTOCOL_TLS1_2);
}

}  // namespace

void HttpExchange::TellWindow(HWND window, UINT message) {
  const std::lock_guard guard(lock_);
  window_ = window;
  message_ = message;
}

void HttpExchange::Told(DWORD status, DWORD itsCount) {
  switch (status) {
    case WINHTTP_CALLBACK_STATUS_CONNECTED_TO_SERVER:
      made = true;
      heard = GetTickCount64();
      // Of a secure connection only its first half is there.
      if (!secure) connected = true;
      return;
    case WINHTTP_CALLBACK_STATUS_SENDING_REQUEST:
      connected = true;
      break;
    case WINHTTP_CALLBACK_STATUS_RESPONSE_RECEIVED:
      if (itsCount == 0)
        ended = true;
      else
        heard = GetTickCount64();
      return;
    case WINHTTP_CALLBACK_STATUS_SECURE_FAILURE:
      certificateFlags = itsCount;
      return;
    case WINHTTP_CALLBACK_STATUS_REQUEST_ERROR:
      error = itsCount;
      end = status;
      break;
    case WINHTTP_CALLBACK_STATUS_READ_COMPLETE:
    case WINHTTP_CALLBACK_STATUS_DATA_AVAILABLE:
      count = itsCount;
      [[fallthrough]];
    case WINHTTP_CALLBACK_STATUS_SENDREQUEST_COMPLETE:
    case WINHTTP_CALLBACK_STATUS_WRITE_COMPLETE:
    case WINHTTP_CALLBACK_STATUS_HEADERS_AVAILABLE:
      end = status;
      break;
    default:
      return;
  }
  SetEvent(told.Get());
  const std::lock_guard guard(lock_);
  if (window_) PostMessageW(window_, message_, status, static_cast<LPARAM>(itsCount));
}

HttpRequest::HttpRequest(const HttpHead& head, std::uint32_t connectMs, std::uint32_t silenceMs)
    : exchange_(std::make_shared<HttpExchange>(head.secure)) {
  const std::wstring host = WideFromText(head.host);
  const std::wstring target(head.target.begin(), head.target.end());
  session_ = OpenHttpSession((head.secure ? L"https://" : L"http://") + host + L":" +
                             std::to_wstring(head.port) + target);
  if (!session_ || !exchange_->told) return;
  // What is left behind ends by these.
  WinHttpSetTimeouts(session_.Get(), static_cast<int>(connectMs), static_cast<int>(connectMs),
                     static_cast<int>(silenceMs), static_cast<int>(silenceMs));
  WinHttpSetOption(session_.Get(), WINHTTP_OPTION_RECEIVE_RESPONSE_TIMEOUT, &silenceMs, sizeof silenceMs);
  if (head.secure && !SetLeastProtocol(session_.Get())) return;
  connection_ = HttpOwner(WinHttpConnect(session_.Get(), host.c_str(), head.port, 0));
  if (!connection_) return;
  const wchar_t* acceptTypes[] = {L"*/*", nullptr};
  HttpOwner request(WinHttpOpenRequest(
      connection_.Get(), head.verb, target.c_str(), nullptr, WINHTTP_NO_REFERER, acceptTypes,
      WINHTTP_FLAG_REFRESH | WINHTTP_FLAG_ESCAPE_DISABLE | WINHTTP_FLAG_ESCAPE_DISABLE_QUERY |
          (head.secure ? WINHTTP_FLAG_SECURE : 0)));
  if (!request) return;
  // A post may have been carried out although its answer was lost, so it is sent exactly once. On a kept
  // connection that the server has closed meanwhile, the system would either fail or send it again on its
  // own, and could not tell which of the two is right. Hence a connection for each request.
  DWORD without = WINHTTP_DISABLE_KEEP_ALIVE | WINHTTP_DISABLE_REDIRECTS | WINHTTP_DISABLE_COOKIES |
                  WINHTTP_DISABLE_AUTHENTICATION;
  if (!WinHttpSetOption(request.Get(), WINHTTP_OPTION_DISABLE_FEATURE, &without, sizeof without) ||
      (!head.headers.empty() &&
       !WinHttpAddRequestHeaders(request.Get(), head.headers.c_str(), static_cast<DWORD>(head.headers.size()),
                                 WINHTTP_ADDREQ_FLAG_ADD | WINHTTP_ADDREQ_FLAG_REPLACE)))
    return;
  auto share = std::make_unique<std::shared_ptr<HttpExchange>>(exchange_);
  auto context = reinterpret_cast<DWORD_PTR>(share.get());
  if (!WinHttpSetOption(request.Get(), WINHTTP_OPTION_CONTEXT_VALUE, &context, sizeof context) ||
      WinHttpSetStatusCallback(request.Get(), OnTold, WINHTTP_CALLBACK_FLAG_ALL_NOTIFICATIONS, 0) ==
          WINHTTP_INVALID_STATUS_CALLBACK)
    return;
  share_ = share.release();
  request_ = std::move(request);
}

HttpRequest::~HttpRequest() {
  if (!request_) return;
  exchange_->TellWindow(nullptr, 0);
  request_ = {};
  const ULONGLONG limit = GetTickCount64() + kGraceMs;
  while (!exchange_->closed) {
    const ULONGLONG now = GetTickCount64();
    if (now >= limit) {
      // Its end is told later. This code stays loaded for that.
      HMODULE self = nullptr;
      GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_PIN | GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS,
                         reinterpret_cast<const wchar_t*>(OnTold), &self);
      return;
    }
    WaitForSingleObject(exchange_->told.Get(), static_cast<DWORD>(limit - now));
  }
  // The last notification drops the system's share next.
  while (exchange_.use_count() > 1) SwitchToThread();
}

void HttpRequest::CloseLater(std::unique_ptr<HttpRequest> request) {
  if (!request) return;
  request->exchange_->TellWindow(nullptr, 0);
  // Where the pool takes nothing it is closed here.
  RunOnPool([shared = std::shared_ptr<HttpRequest>(std::move(request))]() mutable { shared.reset(); });
}

bool HttpRequest::Send() {
  return request_ &&
         WinHttpSendRequest(request_.Get(), nullptr, 0, nullptr, 0, WINHTTP_IGNORE_REQUEST_TOTAL_LENGTH,
                            reinterpret_cast<DWORD_PTR>(share_));
}

std::optional<std::wstring> HttpRequest::Header(DWORD which) const {
  std::wstring value;
  DWORD size = 0;
  const auto query = [&](wchar_t* room) {
    return WinHttpQueryHeaders(request_.Get(), which, WINHTTP_HEADER_NAME_BY_INDEX, room, &size,
                               WINHTTP_NO_HEADER_INDEX);
  };
  if (query(nullptr) || GetLastError() != ERROR_INSUFFICIENT_BUFFER) return std::nullopt;
  value.resize(size / sizeof(wchar_t));
  if (!query(value.data())) return std::nullopt;
  value.resize(size / sizeof(wchar_t));
  return value;
}

int HttpRequest::Status() const {
  DWORD status = 0;
  DWORD size = sizeof status;
  return WinHttpQueryHeaders(request_.Get(), WINHTTP_QUERY_STATUS_CODE | WINHTTP_QUERY_FLAG_NUMBER,
                             WINHTTP_HEADER_NAME_BY_INDEX, &status, &size, WINHTTP_NO_HEADER_INDEX)
             ? static_cast<int>(status)
             : 0;
}

std::optional<std::uint64_t> HttpRequest::AnnouncedLength() const {
  // Chunks say their lengths themselves.
  if (IsChunked()) return std::nullopt;
  const auto header = Header(WINHTTP_QUERY_CONTENT_LENGTH);
  if (!header) return std::nullopt;
  std::string digits(header->size(), '?');
  std::transform(header->begin(), header->end(), digits.begin(),
                 [](wchar_t unit) { return unit < 0x7F ? static_cast<char>(unit) : '?'; });
  std::uint64_t length = 0;
  const char* end = digits.data() + digits.size();
  const auto [stop, status] = std::from_chars(digits.data(), end, length);
  if (status != std::errc{} || stop != end) return std::numeric_limits<std::uint64_t>::max();
  return length;
}

bool HttpRequest::IsCut(std::uint64_t received) const {
  if (const auto announced = AnnouncedLength()) return received < *announced;
  // The chunk that is the last one ends the answer before the connection ends.
  if (IsChunked()) return exchange_->ended;
  // Only the end of the connection ends it, which anybody on the way can bring about: in the clear that is
  // how servers answer, over TLS it is no end.
  return exchange_->secure;
}

std::int32_t HttpErrorOf(const HttpExchange& exchange) {
  switch (const DWORD error = exchange.error) {
    case ERROR_WINHTTP_TIMEOUT:
    case ERROR_WINHTTP_NAME_NOT_RESOLVED:
    case ERROR_WINHTTP_CANNOT_CONNECT:
    case ERROR_WINHTTP_CONNECTION_ERROR:
    case ERROR_WINHTTP_SECURE_CERT_DATE_INVALID:
    case ERROR_WINHTTP_SECURE_CERT_CN_INVALID:
    case ERROR_WINHTTP_SECURE_INVALID_CA:
    case ERROR_WINHTTP_SECURE_CHANNEL_ERROR:
      return static_cast<std::int32_t>(error);
    case ERROR_WINHTTP_SECURE_FAILURE: {
      const DWORD flags = exchange.certificateFlags;
      if (flags & WINHTTP_CALLBACK_STATUS_FLAG_CERT_DATE_INVALID) return http_error::kCertificateDate;
      if (flags & WINHTTP_CALLBACK_STATUS_FLAG_CERT_CN_INVALID) return http_error::kCertificateName;
      if (flags & (WINHTTP_CALLBACK_STATUS_FLAG_INVALID_CA | WINHTTP_CALLBACK_STATUS_FLAG_INVALID_CERT |
                   WINHTTP_CALLBACK_STATUS_FLAG_CERT_REVOKED | WINHTTP_CALLBACK_STATUS_FLAG_CERT_REV_FAILED))
        return http_error::kUnknownAuthority;
      return http_error::kSecureChannel;
    }
    default:
      return 0;
  }
}

}  // namespace tarnwick
