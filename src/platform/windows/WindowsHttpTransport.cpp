#include "platform/windows/WindowsHttpTransport.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <charconv>
#include <limits>
#include <string>
#include <thread>
#include <utility>

#include "platform/windows/AnsiText.h"
#include "platform/windows/InternetOwner.h"
#include "platform/windows/WindowsMessagePump.h"

namespace tarnwick {
namespace {

constexpr DWORD kRequestFlags = INTERNET_FLAG_NO_AUTO_REDIRECT | INTERNET_FLAG_RELOAD |
                                INTERNET_FLAG_NO_CACHE_WRITE | INTERNET_FLAG_PRAGMA_NOCACHE |
                                INTERNET_FLAG_NO_COOKIES | INTERNET_FLAG_NO_AUTH | INTERNET_FLAG_NO_UI;

constexpr std::size_t kFirstRoom = 16 * 1024;

// Bytes of a streamed body that are sent at a time. A host hears of the progress after each block, so it is a
// hundredth of the body, within these bounds: handing over takes as long as sending a few KiB.
constexpr std::uint64_t kLeastBlock = 64 * 1024;
constexpr std::uint64_t kMostBlock = 1024 * 1024;

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

// A request that is ready to be sent; the request goes first.
struct OpenedRequest {
  InternetOwner session;
  InternetOwner connection;
  InternetOwner request;
};

// Opens session, connection and request, of which none goes over the network yet. The request is empty on
// failure.
OpenedRequest OpenRequest(const HttpPost& post, std::uint32_t connectMs, std::uint32_t silenceMs) {
  OpenedRequest opened;
  // Opened for each post, which costs little: so a change of the system's proxy settings counts at once.
  opened.session =
      InternetOwner(InternetOpenW(L"Tarnwick", INTERNET_OPEN_TYPE_PRECONFIG, nullptr, nullptr, 0));
  if (!opened.session) return opened;
  SetTimeouts(opened.session.Get(), connectMs, silenceMs);
  opened.connection =
      InternetOwner(InternetConnectW(opened.session.Get(), WideFromText(post.host).c_str(), post.port,
                                     nullptr, nullptr, INTERNET_SERVICE_HTTP, 0, 0));
  if (!opened.connection) return opened;
  const wchar_t* acceptTypes[] = {L"*/*", nullptr};
  opened.request =
      InternetOwner(HttpOpenRequestW(opened.connection.Get(), L"POST", WideFromAscii(post.target).c_str(),
                                     L"HTTP/1.1", nullptr, acceptTypes, kRequestFlags, 0));
  if (opened.request) SetTimeouts(opened.request.Get(), connectMs, silenceMs);
  return opened;
}

// A post may have been carried out although its answer was lost, so it is sent exactly once. On a kept
// connection that the server has closed meanwhile, the system would either fail or send it again on its own,
// and could not tell which of the two is right. Hence a connection for each post.
std::wstring HeadersOf(const HttpPost& post) {
  return L"Content-Type: " + WideFromAscii(post.contentType) + L"\r\nConnection: close\r\n";
}

// The answer to a request that has been sent.
std::optional<HttpAnswer> ReadAnswer(HINTERNET request, std::size_t maxBodyBytes) {
  DWORD status = 0;
  DWORD statusSize = sizeof status;
  if (!HttpQueryInfoW(request, HTTP_QUERY_STATUS_CODE | HTTP_QUERY_FLAG_NUMBER, &status, &statusSize,
                      nullptr) ||
      status < 100)  // a connection that ended before it said anything has a status of 0 in some versions
    return std::nullopt;
  HttpAnswer answer;
  answer.status = static_cast<int>(status);
  if (!ReadBody(request, maxBodyBytes, answer.body)) return std::nullopt;
  return answer;
}

// The network's side of a streamed post. The calls that send block, so they run on a thread of their own,
// which is given one block after the other, each while the one before is sent, and knows nothing of where
// they come from.
class PostWorker {
 public:
  PostWorker(HINTERNET request, std::wstring headers, std::uint64_t length, std::size_t maxBodyBytes)
      : request_(request), headers_(std::move(headers)), length_(length), maxBodyBytes_(maxBodyBytes) {
    thread_ = std::thread([this] {
      Run();
      SetEvent(done_.Get());
    });
  }
  // The request has been closed before, unless the worker is done.
  ~PostWorker() {
    aborted_ = true;
    SetEvent(given_.Get());
    thread_.join();
  }
  PostWorker(const PostWorker&) = delete;
  PostWorker& operator=(const PostWorker&) = delete;

  // Signalled when the next block is wanted or the last one has left, and when all is over.
  std::array<HANDLE, 2> Events() const { return {wanted_.Get(), done_.Get()}; }
  // Bytes that have left.
  std::uint32_t Sent() const { return sent_; }
  // The next block; the caller's from when it is wanted until it is given.
  std::string& Next() { return next_; }
  void Give() { SetEvent(given_.Get()); }
  std::optional<HttpAnswer> TakeAnswer() { return std::move(answer_); }

 private:
  void Run() {
    INTERNET_BUFFERSW buffers = {};
    buffers.dwStructSize = sizeof buffers;
    buffers.lpcszHeader = headers_.c_str();
    buffers.dwHeadersLength = static_cast<DWORD>(headers_.size());
    buffers.dwBufferTotal = static_cast<DWORD>(length_);
    if (!HttpSendRequestExW(request_, &buffers, nullptr, 0, 0)) return;
    std::string block;
    SetEvent(wanted_.Get());
    while (sent_ < length_) {
      WaitForSingleObject(given_.Get(), INFINITE);
      if (aborted_) return;
      block.swap(next_);
      SetEvent(wanted_.Get());
      std::string_view rest = block;
      while (!rest.empty()) {
        DWORD written = 0;
        if (!InternetWriteFile(request_, rest.data(), static_cast<DWORD>(rest.size()), &written) ||
            written == 0)
          return;
        rest.remove_prefix(written);
      }
      sent_ += static_cast<std::uint32_t>(block.size());
    }
    SetEvent(wanted_.Get());
    if (!HttpEndRequestW(request_, nullptr, 0, 0)) return;
    answer_ = ReadAnswer(request_, maxBodyBytes_);
  }

  struct EventKind {
    using Handle = HANDLE;
    static Handle None() { return nullptr; }
    static void Close(Handle handle) { CloseHandle(handle); }
  };
  using EventOwner = Owner<EventKind>;

  const HINTERNET request_;
  const std::wstring headers_;
  const std::uint64_t length_;
  const std::size_t maxBodyBytes_;
  const EventOwner wanted_{CreateEventW(nullptr, FALSE, FALSE, nullptr)};
  const EventOwner given_{CreateEventW(nullptr, FALSE, FALSE, nullptr)};
  const EventOwner done_{CreateEventW(nullptr, TRUE, FALSE, nullptr)};
  std::atomic<bool> aborted_ = false;
  std::atomic<std::uint32_t> sent_ = 0;
  // Handed over by the events.
  std::string next_;
  std::optional<HttpAnswer> answer_;
  std::thread thread_;
};

}  // namespace

std::optional<HttpAnswer> WindowsHttpTransport::Post(const HttpPost& post, std::size_t maxBodyBytes) {
  if (post.body.size() > std::numeric_limits<DWORD>::max()) return std::nullopt;
  const OpenedRequest opened = OpenRequest(post, connectMs_, silenceMs_);
  if (!opened.request) return std::nullopt;
  const std::wstring headers = HeadersOf(post);
  // The system only reads the body, whatever its declaration says.
  if (!HttpSendRequestW(opened.request.Get(), headers.c_str(), static_cast<DWORD>(headers.size()),
                        const_cast<char*>(post.body.data()), static_cast<DWORD>(post.body.size())))
    return std::nullopt;
  return ReadAnswer(opened.request.Get(), maxBodyBytes);
}

std::optional<HttpAnswer> WindowsHttpTransport::PostStream(const HttpPost& post, BodySource& source,
                                                           std::size_t maxBodyBytes) {
  const std::uint64_t length = source.Length();
  if (length > std::numeric_limits<DWORD>::max()) return std::nullopt;
  OpenedRequest opened = OpenRequest(post, connectMs_, silenceMs_);
  if (!opened.request) return std::nullopt;
  PostWorker worker(opened.request.Get(), HeadersOf(post), length, maxBodyBytes);
  // Goes before the worker: a request that is closed ends the call that the worker is in.
  const OpenedRequest closing = std::move(opened);
  const std::array<HANDLE, 2> events = worker.Events();
  WindowsMessagePump pump;
  const std::uint64_t most = std::clamp(length / 100, kLeastBlock, kMostBlock);
  std::uint64_t given = 0;
  for (;;) {
    const DWORD woken = MsgWaitForMultipleObjectsEx(static_cast<DWORD>(events.size()), events.data(),
                                                    INFINITE, QS_ALLINPUT, MWMO_INPUTAVAILABLE);
    if (woken == WAIT_OBJECT_0) {
      source.Sent(worker.Sent());
      if (given == length) continue;
      std::string& block = worker.Next();
      block.resize(static_cast<std::size_t>(std::min(most, length - given)));
      if (source.Read(block) != block.size()) return std::nullopt;
      given += block.size();
      worker.Give();
    } else if (woken == WAIT_OBJECT_0 + 1) {
      return worker.TakeAnswer();
    } else if (woken == WAIT_FAILED) {
      return std::nullopt;
    } else {
      MSG message = {};
      if (PeekMessageW(&message, nullptr, WM_QUIT, WM_QUIT, PM_NOREMOVE)) return std::nullopt;
      pump.Yield();
    }
  }
}

}  // namespace tarnwick
