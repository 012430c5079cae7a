#include "platform/windows/WindowsHttpTransport.h"

#include "platform/windows/WindowsHeaders.h"
// Needs the types of the header above.
#include <winhttp.h>

#include <algorithm>
#include <atomic>
#include <charconv>
#include <limits>
#include <memory>
#include <string>
#include <utility>

#include "platform/windows/AnsiText.h"
#include "platform/windows/Owner.h"
#include "platform/windows/UserProxy.h"
#include "platform/windows/WindowsMessagePump.h"

namespace tarnwick {
namespace {

constexpr std::size_t kFirstRoom = 16 * 1024;

// Bytes of a body that are handed over at a time: more while that takes less than kQuickMs, because each
// hand-over costs as much as sending a few KiB; but not for the first ones, which the system may only have
// put into a buffer. It does not tell what of a piece has left, so a peer that takes less than one within the
// time-out counts as silent.
constexpr std::uint64_t kLeastPiece = 64 * 1024;
constexpr std::uint64_t kMostPiece = 256 * 1024;
constexpr ULONGLONG kQuickMs = 1000;
constexpr int kQuickPieces = 16;
// Bytes of the last piece, without which a server does not have the body. It holds the end mark of a form.
constexpr std::uint64_t kLastPiece = 1024;

// A host hears of the progress each time a hundredth of the body has left, within these bounds.
constexpr std::uint64_t kLeastStep = 64 * 1024;
constexpr std::uint64_t kMostStep = 1024 * 1024;

// How long a request that was given up may take to end, before it is left behind.
constexpr DWORD kGraceMs = 200;

// More than anybody leaves open to one server.
constexpr int kMostOldConnections = 100;

using HttpOwner = Owner<HINTERNET, WinHttpCloseHandle>;

std::wstring WideFromAscii(std::string_view ascii) {
  return {ascii.begin(), ascii.end()};
}

// What the system tells of one request, on threads of its own, and the memory that it reads and writes. Both
// live until it has let go of the request.
struct Exchange {
  // Something was told.
  const HandleOwner told{CreateEventW(nullptr, FALSE, FALSE, nullptr)};
  // The notification that ended the call that runs; 0 until it comes.
  std::atomic<DWORD> end = 0;
  // Bytes that a read has brought.
  std::atomic<DWORD> count = 0;
  // When the peer last took or gave a byte.
  std::atomic<ULONGLONG> heard = GetTickCount64();
  // A connection was made for this request, or there is one.
  std::atomic<bool> made = false;
  std::atomic<bool> connected = false;
  // The peer has ended the connection while its answer was read.
  std::atomic<bool> ended = false;
  std::atomic<bool> closed = false;
  std::string piece;
  std::string answer;
};

// Only writes down what is told. `context` is a share in the exchange that goes with the request.
void CALLBACK OnTold(HINTERNET, DWORD_PTR context, DWORD status, void* information, DWORD length) {
  auto* const share = reinterpret_cast<std::shared_ptr<Exchange>*>(context);
  if (!share) return;
  Exchange& exchange = **share;
  switch (status) {
    case WINHTTP_CALLBACK_STATUS_CONNECTED_TO_SERVER:
      exchange.made = true;
      exchange.heard = GetTickCount64();
      exchange.connected = true;
      return;
    case WINHTTP_CALLBACK_STATUS_SENDING_REQUEST:
      exchange.connected = true;
      return;
    case WINHTTP_CALLBACK_STATUS_RESPONSE_RECEIVED:
      if (information && *static_cast<const DWORD*>(information) == 0)
        exchange.ended = true;
      else
        exchange.heard = GetTickCount64();
      return;
    case WINHTTP_CALLBACK_STATUS_READ_COMPLETE:
      exchange.count = length;
      [[fallthrough]];
    case WINHTTP_CALLBACK_STATUS_SENDREQUEST_COMPLETE:
    case WINHTTP_CALLBACK_STATUS_WRITE_COMPLETE:
    case WINHTTP_CALLBACK_STATUS_HEADERS_AVAILABLE:
    case WINHTTP_CALLBACK_STATUS_REQUEST_ERROR:
      exchange.end = status;
      SetEvent(exchange.told.Get());
      return;
    case WINHTTP_CALLBACK_STATUS_HANDLE_CLOSING: {
      // The last one.
      const std::unique_ptr<std::shared_ptr<Exchange>> last(share);
      exchange.closed = true;
      SetEvent(exchange.told.Get());
      return;
    }
    default:
      return;
  }
}

// Takes over a text that the system has allocated.
std::wstring Taken(wchar_t* text) {
  const Owner<wchar_t*, GlobalFree> taken(text);
  return taken ? std::wstring(text) : std::wstring();
}

// A session of the system's for one post, which costs little: so a change of the user's proxy settings counts
// at once. `url` is where it goes.
HttpOwner OpenSession(const std::wstring& url) {
  const auto open = [](DWORD access, const wchar_t* server, const wchar_t* bypass, DWORD flags) {
    return HttpOwner(WinHttpOpen(L"Tarnwick", access, server, bypass, flags));
  };
  UserProxy proxy = GetUserProxy();
  WINHTTP_CURRENT_USER_IE_PROXY_CONFIG user = {};
  WinHttpGetIEProxyConfigForCurrentUser(&user);
  const std::wstring script = Taken(user.lpszAutoConfigUrl);
  const std::wstring known = Taken(user.lpszProxy);
  Taken(user.lpszProxyBypass);
  // Wine: auto-detection is reported as on, and no proxy, whatever is set. A proxy that only the user's
  // Internet settings name is taken as it stands there.
  if ((user.fAutoDetect || !script.empty()) && (proxy.server.empty() || !known.empty())) {
    if (HttpOwner found = open(WINHTTP_ACCESS_TYPE_AUTOMATIC_PROXY, nullptr, nullptr, WINHTTP_FLAG_ASYNC))
      return found;
    // Before Windows 8.1 it has to be asked for.
    WINHTTP_AUTOPROXY_OPTIONS options = {};
    if (user.fAutoDetect) {
      options.dwFlags |= WINHTTP_AUTOPROXY_AUTO_DETECT;
      options.dwAutoDetectFlags = WINHTTP_AUTO_DETECT_TYPE_DHCP | WINHTTP_AUTO_DETECT_TYPE_DNS_A;
    }
    if (!script.empty()) {
      options.dwFlags |= WINHTTP_AUTOPROXY_CONFIG_URL;
      options.lpszAutoConfigUrl = script.c_str();
    }
    WINHTTP_PROXY_INFO info = {};
    const HttpOwner asking = open(WINHTTP_ACCESS_TYPE_NO_PROXY, nullptr, nullptr, 0);
    if (WinHttpGetProxyForUrl(asking.Get(), url.c_str(), &options, &info)) {
      proxy.server = HttpProxyOf(Taken(info.lpszProxy));
      proxy.bypass = Taken(info.lpszProxyBypass);
    }
  }
  if (proxy.server.empty()) return open(WINHTTP_ACCESS_TYPE_NO_PROXY, nullptr, nullptr, WINHTTP_FLAG_ASYNC);
  return open(WINHTTP_ACCESS_TYPE_NAMED_PROXY, proxy.server.c_str(),
              proxy.bypass.empty() ? nullptr : proxy.bypass.c_str(), WINHTTP_FLAG_ASYNC);
}

// How one post is waited for.
struct Waiting {
  std::uint32_t connectMs;
  std::uint32_t silenceMs;
  // Whether messages are handled meanwhile.
  bool pumps;
  ULONGLONG begin = GetTickCount64();
};

// One post on its way. All but OnTold happens on the thread that posts.
class Request {
 public:
  Request(const HttpPost& post, BodySource& source, const Waiting& waiting)
      : source_(source), length_(source.Length()), waiting_(waiting), givesUp_(length_ > 0) {
    Open(post);
  }
  ~Request();
  Request(const Request&) = delete;
  Request& operator=(const Request&) = delete;

  // False when there is no connection, or the request is not wanted any more.
  bool SendHead() {
    return request_ && Done(WINHTTP_CALLBACK_STATUS_SENDREQUEST_COMPLETE, [this] {
             return WinHttpSendRequest(request_.Get(), nullptr, 0, nullptr, 0,
                                       WINHTTP_IGNORE_REQUEST_TOTAL_LENGTH,
                                       reinterpret_cast<DWORD_PTR>(share_));
           });
  }
  // Whether the head went, or was to go, over a connection that somebody had left open.
  bool IsOnOldConnection() const { return exchange_->connected && !exchange_->made; }
  bool SendBody();
  std::optional<HttpAnswer> Receive(std::size_t maxBodyBytes);

 private:
  void Open(const HttpPost& post);
  template <typename Call>
  bool Done(DWORD expected, Call&& call);
  std::optional<std::wstring> Header(DWORD which) const;
  std::optional<std::uint64_t> AnnouncedLength() const;
  bool ReadBody(std::size_t maxBytes);

  BodySource& source_;
  const std::uint64_t length_;
  const Waiting& waiting_;
  // Whether it ends when the source is not wanted any more: until its last byte is handed over.
  bool givesUp_;
  const std::shared_ptr<Exchange> exchange_ = std::make_shared<Exchange>();
  // The system's share, once there is a request.
  std::shared_ptr<Exchange>* share_ = nullptr;
  HttpOwner session_;
  HttpOwner connection_;
  HttpOwner request_;
};

// Opens session, connection and request, of which none goes over the network yet. The request is empty on
// failure.
void Request::Open(const HttpPost& post) {
  const std::wstring host = WideFromText(post.host);
  const std::wstring target = WideFromAscii(post.target);
  session_ = OpenSession(L"http://" + host + L":" + std::to_wstring(post.port) + target);
  if (!session_ || !exchange_->told) return;
  // What is left behind ends by these.
  WinHttpSetTimeouts(session_.Get(), static_cast<int>(waiting_.connectMs),
                     static_cast<int>(waiting_.connectMs), static_cast<int>(waiting_.silenceMs),
                     static_cast<int>(waiting_.silenceMs));
  DWORD silenceMs = waiting_.silenceMs;
  WinHttpSetOption(session_.Get(), WINHTTP_OPTION_RECEIVE_RESPONSE_TIMEOUT, &silenceMs, sizeof silenceMs);
  connection_ = HttpOwner(WinHttpConnect(session_.Get(), host.c_str(), post.port, 0));
  if (!connection_) return;
  const wchar_t* acceptTypes[] = {L"*/*", nullptr};
  HttpOwner request(WinHttpOpenRequest(
      connection_.Get(), L"POST", target.c_str(), nullptr, WINHTTP_NO_REFERER, acceptTypes,
      WINHTTP_FLAG_REFRESH | WINHTTP_FLAG_ESCAPE_DISABLE | WINHTTP_FLAG_ESCAPE_DISABLE_QUERY));
  if (!request) return;
  // A post may have been carried out although its answer was lost, so it is sent exactly once. On a kept
  // connection that the server has closed meanwhile, the system would either fail or send it again on its
  // own, and could not tell which of the two is right. Hence a connection for each post.
  DWORD without = WINHTTP_DISABLE_KEEP_ALIVE | WINHTTP_DISABLE_REDIRECTS | WINHTTP_DISABLE_COOKIES |
                  WINHTTP_DISABLE_AUTHENTICATION;
  // Wine: a length of more than 2 GiB would be written as a negative one.
  const std::wstring headers = L"Content-Type: " + WideFromAscii(post.contentType) + L"\r\nContent-Length: " +
                               std::to_wstring(length_) + L"\r\nConnection: close\r\n";
  if (!WinHttpSetOption(request.Get(), WINHTTP_OPTION_DISABLE_FEATURE, &without, sizeof without) ||
      !WinHttpAddRequestHeaders(request.Get(), headers.c_str(), static_cast<DWORD>(headers.size()),
                                WINHTTP_ADDREQ_FLAG_ADD | WINHTTP_ADDREQ_FLAG_REPLACE))
    return;
  auto share = std::make_unique<std::shared_ptr<Exchange>>(exchange_);
  auto context = reinterpret_cast<DWORD_PTR>(share.get());
  if (!WinHttpSetOption(request.Get(), WINHTTP_OPTION_CONTEXT_VALUE, &context, sizeof context) ||
      WinHttpSetStatusCallback(request.Get(), OnTold, WINHTTP_CALLBACK_FLAG_ALL_NOTIFICATIONS, 0) ==
          WINHTTP_INVALID_STATUS_CALLBACK)
    return;
  share_ = share.release();
  request_ = std::move(request);
}

Request::~Request() {
  if (!request_) return;
  request_ = {};
  const ULONGLONG limit = GetTickCount64() + kGraceMs;
  while (!exchange_->closed) {
    const ULONGLONG now = GetTickCount64();
    if (now >= limit) {
      // Wine: a call that blocks cannot be ended, and its end is told later. This code stays loaded for that,
      // until the process ends.
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

// Starts a call and waits for its end; false when it failed or was given up, and nothing else may be started
// then.
template <typename Call>
bool Request::Done(DWORD expected, Call&& call) {
  exchange_->end = 0;
  exchange_->heard = GetTickCount64();
  if (!call()) return false;
  WindowsMessagePump pump;
  const HANDLE told = exchange_->told.Get();
  for (;;) {
    if (givesUp_ && !source_.IsWanted()) return false;
    if (const DWORD end = exchange_->end) return end == expected;
    const ULONGLONG limit =
        exchange_->connected ? exchange_->heard + waiting_.silenceMs : waiting_.begin + waiting_.connectMs;
    const ULONGLONG now = GetTickCount64();
    if (now >= limit) return false;
    const auto rest = static_cast<DWORD>(limit - now);
    if (!waiting_.pumps) {
      WaitForSingleObject(told, rest);
      continue;
    }
    const DWORD woken = MsgWaitForMultipleObjectsEx(1, &told, rest, QS_ALLINPUT, MWMO_INPUTAVAILABLE);
    if (woken == WAIT_FAILED) return false;
    if (woken != WAIT_OBJECT_0 + 1) continue;
    MSG message = {};
    if (PeekMessageW(&message, nullptr, WM_QUIT, WM_QUIT, PM_NOREMOVE)) return false;
    pump.Yield();
  }
}

// Each piece is read while the one before is sent. The last one goes when all others have left, so that a
// source that is not wanted any more can keep the body from being whole until then.
bool Request::SendBody() {
  const std::uint64_t step = std::clamp(length_ / 100, kLeastStep, kMostStep);
  std::string next;
  int quick = 0;  // pieces in a row
  std::uint64_t read = 0;
  const auto readNext = [&] {
    const std::uint64_t left = length_ - read;
    const std::uint64_t most = quick > kQuickPieces ? kMostPiece : kLeastPiece;
    next.resize(static_cast<std::size_t>(left > kLastPiece ? std::min(most, left - kLastPiece) : left));
    read += next.size();
    return source_.Read(next) == next.size();
  };
  source_.Sent(0);
  std::uint64_t sent = 0;
  std::uint64_t told = 0;
  if (length_ > 0 && !readNext()) return false;
  while (sent < length_) {
    if (!source_.IsWanted()) return false;
    exchange_->piece.swap(next);
    const std::string& piece = exchange_->piece;
    givesUp_ = read < length_;
    const ULONGLONG begin = GetTickCount64();
    const bool left = Done(WINHTTP_CALLBACK_STATUS_WRITE_COMPLETE, [&] {
      if (!WinHttpWriteData(request_.Get(), piece.data(), static_cast<DWORD>(piece.size()), nullptr))
        return false;
      return read == length_ || readNext();
    });
    if (!left) return false;
    quick = GetTickCount64() - begin < kQuickMs ? quick + 1 : 0;
    sent += piece.size();
    if (sent - told < step && sent < length_) continue;
    source_.Sent(sent);
    told = sent;
  }
  return true;
}

std::optional<std::wstring> Request::Header(DWORD which) const {
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

// The announced length of the body, if there is one.
std::optional<std::uint64_t> Request::AnnouncedLength() const {
  // Chunks say their lengths themselves.
  if (Header(WINHTTP_QUERY_TRANSFER_ENCODING)) return std::nullopt;
  const auto header = Header(WINHTTP_QUERY_CONTENT_LENGTH);
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

// Reads the whole body; false when it is cut short, too long or silent.
bool Request::ReadBody(std::size_t maxBytes) {
  const auto announced = AnnouncedLength();
  if (announced && *announced > maxBytes) return false;
  std::string& body = exchange_->answer;
  std::size_t used = 0;
  body.resize(announced ? static_cast<std::size_t>(*announced) : std::min(kFirstRoom, maxBytes));
  exchange_->ended = false;
  for (;;) {
    if (used == body.size()) {
      if (announced) return true;
      // One byte beyond the bound tells a body that just fits from one that does not.
      if (used > maxBytes) return false;
      body.resize(used < maxBytes ? used + std::min(std::max(used, kFirstRoom), maxBytes - used)
                                  : maxBytes + 1);
    }
    const auto room = static_cast<DWORD>(std::min<std::size_t>(body.size() - used, 1U << 30));
    if (!Done(WINHTTP_CALLBACK_STATUS_READ_COMPLETE,
              [&] { return WinHttpReadData(request_.Get(), body.data() + used, room, nullptr); }))
      return false;
    if (exchange_->count == 0) break;
    used += exchange_->count;
  }
  // The chunk that is the last one ends the answer before the connection ends, and an empty line its head.
  // Wine: an answer without either would pass for a whole one.
  const bool cut = exchange_->ended && Header(WINHTTP_QUERY_TRANSFER_ENCODING);
  if (announced || cut || used > maxBytes) return false;
  if (used == 0 && !Header(WINHTTP_QUERY_RAW_HEADERS_CRLF).value_or(L"").ends_with(L"\r\n\r\n")) return false;
  body.resize(used);
  return true;
}

// The answer to a request that has been sent.
std::optional<HttpAnswer> Request::Receive(std::size_t maxBodyBytes) {
  if (!Done(WINHTTP_CALLBACK_STATUS_HEADERS_AVAILABLE,
            [this] { return WinHttpReceiveResponse(request_.Get(), nullptr); }))
    return std::nullopt;
  DWORD status = 0;
  DWORD statusSize = sizeof status;
  if (!WinHttpQueryHeaders(request_.Get(), WINHTTP_QUERY_STATUS_CODE | WINHTTP_QUERY_FLAG_NUMBER,
                           WINHTTP_HEADER_NAME_BY_INDEX, &status, &statusSize, WINHTTP_NO_HEADER_INDEX) ||
      !ReadBody(maxBodyBytes))
    return std::nullopt;
  return HttpAnswer{static_cast<int>(status), std::move(exchange_->answer)};
}

std::optional<HttpAnswer> Exchanged(const HttpPost& post, BodySource& source, std::size_t maxBodyBytes,
                                    const Waiting& waiting) {
  // The system counts in 32 bits.
  if (source.Length() > std::numeric_limits<DWORD>::max()) return std::nullopt;
  for (int tries = 0;; ++tries) {
    Request request(post, source, waiting);
    const bool sent = request.SendHead();
    // Wine: all clients of the process share the connections that any of them kept. The head alone is no
    // post, so another connection can be tried; this one is closed. A system that tells of no connection at
    // all would go on for ever.
    if (request.IsOnOldConnection() && source.Length() > 0 && tries < kMostOldConnections) continue;
    if (!sent || !request.SendBody()) return std::nullopt;
    return request.Receive(maxBodyBytes);
  }
}

// A body that is in memory.
class MemorySource : public BodySource {
 public:
  explicit MemorySource(std::string_view body) : length_(body.size()), rest_(body) {}
  std::uint64_t Length() const override { return length_; }
  std::size_t Read(std::span<char> room) override {
    const std::size_t count = rest_.copy(room.data(), room.size());
    rest_.remove_prefix(count);
    return count;
  }
  void Sent(std::uint64_t) override {}
  bool IsWanted() const override { return true; }

 private:
  const std::size_t length_;
  std::string_view rest_;
};

}  // namespace

std::optional<HttpAnswer> WindowsHttpTransport::Post(const HttpPost& post, std::size_t maxBodyBytes) {
  MemorySource source(post.body);
  return Exchanged(post, source, maxBodyBytes, {connectMs_, silenceMs_, false});
}

std::optional<HttpAnswer> WindowsHttpTransport::PostStream(const HttpPost& post, BodySource& source,
                                                           std::size_t maxBodyBytes) {
  return Exchanged(post, source, maxBodyBytes, {connectMs_, silenceMs_, true});
}

}  // namespace tarnwick
