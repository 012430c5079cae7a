#include "platform/windows/WindowsHttpTransport.h"

#include <algorithm>
#include <cwchar>
#include <limits>
#include <string>
#include <utility>

#include "platform/windows/CertificateProbe.h"
#include "platform/windows/HttpRequest.h"
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

// More than anybody leaves open to one server.
constexpr int kMostOldConnections = 100;

// How one post is waited for.
struct Waiting {
  std::uint32_t connectMs;
  std::uint32_t silenceMs;
  // Whether messages are handled meanwhile.
  bool pumps;
  ULONGLONG begin = GetTickCount64();
};

// One exchange on its way. All of it happens on the thread that asks.
class Request {
 public:
  Request(const HttpHead& head, BodySource& source, const Waiting& waiting)
      : source_(source),
        length_(source.Length()),
        waiting_(waiting),
        givesUp_(length_ > 0),
        request_(head, waiting.connectMs, waiting.silenceMs),
        exchange_(request_.Exchange()) {}

  // False when there is no connection, or the request is not wanted any more.
  bool SendHead() {
    return request_.Get() &&
           Done(WINHTTP_CALLBACK_STATUS_SENDREQUEST_COMPLETE, [this] { return request_.Send(); });
  }
  // Whether the head went, or was to go, over a connection that somebody had left open.
  bool IsOnOldConnection() const { return exchange_.connected && !exchange_.made; }
  bool SendBody();
  // The head of the answer to a request that has been sent.
  bool ReceiveHead() {
    return Done(WINHTTP_CALLBACK_STATUS_HEADERS_AVAILABLE,
                [this] { return WinHttpReceiveResponse(request_.Get(), nullptr); });
  }
  int Status() const { return request_.Status(); }
  // The whole body; nullopt when it is cut short, too long or silent.
  std::optional<std::string> ReadBody(std::size_t maxBytes);
  // The same, handed on piece by piece.
  bool ReadBody(std::uint64_t maxBytes, const HttpTransport::Sink& sink);
  // Why it failed, see LastFailure.
  std::int32_t Failure() const { return timedOut_ ? http_error::kTimeout : HttpErrorOf(exchange_); }

 private:
  template <typename Call>
  bool Done(DWORD expected, Call&& call);
  // Reads into the room; how many bytes, 0 at the end.
  std::optional<std::size_t> ReadSome(char* room, std::uint64_t most);

  BodySource& source_;
  const std::uint64_t length_;
  const Waiting& waiting_;
  // Whether it ends when the source is not wanted any more: until its last byte is handed over.
  bool givesUp_;
  bool timedOut_ = false;
  HttpRequest request_;
  HttpExchange& exchange_;
};

// Starts a call and waits for its end; false when it failed or was given up, and nothing else may be started
// then.
template <typename Call>
bool Request::Done(DWORD expected, Call&& call) {
  exchange_.end = 0;
  exchange_.heard = GetTickCount64();
  if (!call()) return false;
  WindowsMessagePump pump;
  const HANDLE told = exchange_.told.Get();
  for (;;) {
    if (givesUp_ && !source_.IsWanted()) return false;
    if (const DWORD end = exchange_.end) return end == expected;
    const ULONGLONG limit =
        exchange_.connected ? exchange_.heard + waiting_.silenceMs : waiting_.begin + waiting_.connectMs;
    const ULONGLONG now = GetTickCount64();
    if (now >= limit) {
      timedOut_ = true;
      return false;
    }
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
  std::string& next = exchange_.next;
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
    exchange_.piece.swap(next);
    const std::string& piece = exchange_.piece;
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

std::optional<std::size_t> Request::ReadSome(char* room, std::uint64_t most) {
  auto size = static_cast<DWORD>(std::min<std::uint64_t>(most, 1U << 30));
  if (waiting_.pumps) {
    // Wine: a read of which some bytes are there waits for the rest in the call, where no message is handled.
    if (!Done(WINHTTP_CALLBACK_STATUS_DATA_AVAILABLE,
              [&] { return WinHttpQueryDataAvailable(request_.Get(), nullptr); }))
      return std::nullopt;
    if (exchange_.count == 0) return 0;
    size = std::min<DWORD>(size, exchange_.count);
  }
  if (!Done(WINHTTP_CALLBACK_STATUS_READ_COMPLETE,
            [&] { return WinHttpReadData(request_.Get(), room, size, nullptr); }))
    return std::nullopt;
  return exchange_.count;
}

std::optional<std::string> Request::ReadBody(std::size_t maxBytes) {
  const auto announced = request_.AnnouncedLength();
  if (announced && *announced > maxBytes) return std::nullopt;
  std::string& body = exchange_.answer;
  std::size_t used = 0;
  body.resize(announced ? static_cast<std::size_t>(*announced) : std::min(kFirstRoom, maxBytes));
  exchange_.ended = false;
  for (;;) {
    if (used == body.size()) {
      if (announced) return std::move(body);
      // One byte beyond the bound tells a body that just fits from one that does not.
      if (used > maxBytes) return std::nullopt;
      body.resize(used < maxBytes ? used + std::min(std::max(used, kFirstRoom), maxBytes - used)
                                  : maxBytes + 1);
    }
    const auto count = ReadSome(body.data() + used, body.size() - used);
    if (!count) return std::nullopt;
    if (*count == 0) break;
    used += *count;
  }
  if (request_.IsCut(used) || used > maxBytes) return std::nullopt;
  // Wine: an answer without the empty line that ends its head would pass for a whole one.
  if (used == 0 && !request_.Header(WINHTTP_QUERY_RAW_HEADERS_CRLF).value_or(L"").ends_with(L"\r\n\r\n"))
    return std::nullopt;
  body.resize(used);
  // The records of a listing keep its bytes.
  if (used > kFirstRoom) body.shrink_to_fit();
  return std::move(body);
}

bool Request::ReadBody(std::uint64_t maxBytes, const HttpTransport::Sink& sink) {
  const auto announced = request_.AnnouncedLength();
  if (announced && *announced > maxBytes) return false;
  std::string& room = exchange_.answer;
  room.resize(kMostPiece);
  exchange_.ended = false;
  for (std::uint64_t used = 0; !announced || used < *announced;) {
    const auto count = ReadSome(
        room.data(), announced ? std::min<std::uint64_t>(room.size(), *announced - used) : room.size());
    if (!count) return false;
    if (*count == 0) return !request_.IsCut(used);
    used += *count;
    if (used > maxBytes || !sink({room.data(), *count})) return false;
  }
  return true;
}

HttpHead HeadOf(const HttpPost& post, std::uint64_t length) {
  // Wine: a length of more than 2 GiB would be written as a negative one.
  const std::string lines = "Content-Type: " + std::string(post.contentType) +
                            "\r\nContent-Length: " + std::to_string(length) + "\r\nConnection: close\r\n";
  return {L"POST", post.secure, post.host, post.port, post.target, {lines.begin(), lines.end()}};
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

// Sends head and body, and has `receive` read the body of the answer once its head is there. `failure` tells
// why that has no result.
template <typename Receive>
auto Exchanged(const HttpHead& head, BodySource& source, const Waiting& waiting, std::int32_t& failure,
               const Receive& receive) -> decltype(receive(std::declval<Request&>())) {
  failure = 0;
  // The system counts in 32 bits.
  if (source.Length() > std::numeric_limits<DWORD>::max()) return std::nullopt;
  const bool repeatable = source.Length() > 0 || std::wcscmp(head.verb, L"GET") == 0;
  for (int tries = 0;; ++tries) {
    Request request(head, source, waiting);
    const bool sent = request.SendHead();
    // Wine: all clients of the process share the connections that any of them kept. The head alone is no
    // post, so another connection can be tried; this one is closed. A system that tells of no connection at
    // all would go on for ever.
    if (request.IsOnOldConnection() && repeatable && tries < kMostOldConnections) continue;
    if (sent && request.SendBody() && request.ReceiveHead()) {
      if (auto result = receive(request)) {
        // The source may have run other exchanges.
        failure = 0;
        return result;
      }
    }
    failure = request.Failure();
    if (failure == http_error::kSecureChannel) failure = ProbedCertificate(head.host, head.port);
    return std::nullopt;
  }
}

std::optional<HttpAnswer> Posted(const HttpPost& post, BodySource& source, std::size_t maxBodyBytes,
                                 const Waiting& waiting, std::int32_t& failure) {
  return Exchanged(HeadOf(post, source.Length()), source, waiting, failure,
                   [&](Request& request) -> std::optional<HttpAnswer> {
                     auto body = request.ReadBody(maxBodyBytes);
                     if (!body) return std::nullopt;
                     return HttpAnswer{request.Status(), std::move(*body)};
                   });
}

}  // namespace

std::optional<HttpAnswer> WindowsHttpTransport::Post(const HttpPost& post, std::size_t maxBodyBytes) {
  MemorySource source(post.body);
  return Posted(post, source, maxBodyBytes, {connectMs_, silenceMs_, false}, failure_);
}

std::optional<HttpAnswer> WindowsHttpTransport::PostStream(const HttpPost& post, BodySource& source,
                                                           std::size_t maxBodyBytes) {
  return Posted(post, source, maxBodyBytes, {connectMs_, silenceMs_, true}, failure_);
}

std::optional<int> WindowsHttpTransport::Get(const HttpGet& get, std::uint64_t maxBodyBytes,
                                             const Sink& sink) {
  MemorySource source({});
  const HttpHead head{L"GET", true, get.host, get.port, get.target, {get.headers.begin(), get.headers.end()}};
  return Exchanged(head, source, {connectMs_, silenceMs_, false}, failure_,
                   [&](Request& request) -> std::optional<int> {
                     if (!request.ReadBody(maxBodyBytes, sink)) return std::nullopt;
                     return request.Status();
                   });
}

}  // namespace tarnwick
