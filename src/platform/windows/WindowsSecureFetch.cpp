#include "platform/windows/WindowsSecureFetch.h"

#include <algorithm>
#include <utility>

#include "platform/windows/CertificateProbe.h"

namespace tarnwick {
namespace {

constexpr UINT kFirstMessage = WM_APP;
// What the request tells, and what stands against the server's certificate.
enum Which : UINT { kTold, kProbed, kFailed, kCount };
// After so many fetches the message numbers come again; those of the first are gone by then.
constexpr UINT kFetches = 1000;

constexpr UINT_PTR kTimer = 1;
// How often a silence is looked after.
constexpr UINT kTickMs = 1'000;

// Bytes that are asked for at a time. Wine: a read takes until all of them are there, so only a peer that has
// just sent quickly is asked for many; the hand-over of each read costs as much as the deciphering of a few
// KiB.
constexpr std::size_t kLeastRead = std::size_t{16} << 10;
constexpr std::size_t kMostRead = std::size_t{512} << 10;
constexpr DWORD kManyBytes = 4096;
constexpr ULONGLONG kQuickMs = 20;
constexpr ULONGLONG kSlowMs = 200;

// The time-outs of the system for what is left behind. How long a silence may last is the download's to say,
// which allows for less.
constexpr std::uint32_t kLeftBehindMs = 60'000;

}  // namespace

WindowsSecureFetch::WindowsSecureFetch(std::uint32_t handshakeMs)
    : handshakeMs_(handshakeMs), window_([this](UINT message, WPARAM wParam, LPARAM lParam) {
        return OnMessage(message, wParam, lParam);
      }) {}

UINT WindowsSecureFetch::MessageOf(UINT which) const {
  return kFirstMessage + fetch_ * kCount + which;
}

void WindowsSecureFetch::Close() {
  fetch_ = (fetch_ + 1) % kFetches;
  arrived_.clear();
  readFrom_ = 0;
  if (!request_) return;
  KillTimer(window_.Get(), kTimer);
  // It may be in a call that nobody can end.
  HttpRequest::CloseLater(std::move(request_));
}

void WindowsSecureFetch::Begin(const HttpGet& get) {
  Close();
  host_ = get.host;
  port_ = get.port;
  announced_.reset();
  received_ = 0;
  want_ = 0;
  request_ = std::make_unique<HttpRequest>(
      HttpHead{L"GET", true, get.host, get.port, get.target, {get.headers.begin(), get.headers.end()}},
      handshakeMs_, kLeftBehindMs);
  request_->Exchange().TellWindow(window_.Get(), MessageOf(kTold));
  SetTimer(window_.Get(), kTimer, handshakeMs_, nullptr);
  // Told as a message: nothing is told inside a call.
  if (!request_->Send())
    PostMessageW(window_.Get(), MessageOf(kFailed), static_cast<WPARAM>(http_error::kCannotConnect), 0);
}

std::size_t WindowsSecureFetch::Read(std::span<char> room) {
  const std::size_t count = arrived_.copy(room.data(), room.size(), readFrom_);
  readFrom_ += count;
  return count;
}

bool WindowsSecureFetch::OnMessage(UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_TIMER && wParam == kTimer) {
    if (request_) OnTimer();
    return true;
  }
  if (message < kFirstMessage || message >= kFirstMessage + kFetches * kCount) return false;
  if (!events_ || !request_ || (message - kFirstMessage) / kCount != fetch_) return true;
  switch ((message - kFirstMessage) % kCount) {
    case kTold:
      OnTold(static_cast<DWORD>(wParam), static_cast<DWORD>(lParam));
      break;
    default:
      Fail(static_cast<std::int32_t>(wParam));
      break;
  }
  return true;
}

void WindowsSecureFetch::OnTimer() {
  HttpExchange& exchange = request_->Exchange();
  if (!exchange.connected) {
    KillTimer(window_.Get(), kTimer);
    return Fail(http_error::kTimeout);
  }
  // A long read of a peer that has become slow goes on.
  if (events_ && std::exchange(heard_, exchange.heard) != exchange.heard) events_->OnSent();
}

void WindowsSecureFetch::OnTold(DWORD status, DWORD count) {
  const UINT fetch = fetch_;
  switch (status) {
    case WINHTTP_CALLBACK_STATUS_SENDING_REQUEST:
      heard_ = request_->Exchange().heard;
      SetTimer(window_.Get(), kTimer, kTickMs, nullptr);
      return events_->OnConnected();
    case WINHTTP_CALLBACK_STATUS_SENDREQUEST_COMPLETE:
      events_->OnSent();
      if (fetch == fetch_ && !WinHttpReceiveResponse(request_->Get(), nullptr))
        Fail(http_error::kConnectionLost);
      return;
    case WINHTTP_CALLBACK_STATUS_HEADERS_AVAILABLE:
      return OnHead();
    case WINHTTP_CALLBACK_STATUS_DATA_AVAILABLE:
      want_ = std::clamp<std::size_t>(count, 1, kMostRead);
      if (!ReadMore()) Fail(http_error::kConnectionLost);
      return;
    case WINHTTP_CALLBACK_STATUS_READ_COMPLETE:
      return OnBody(count);
    default: {
      const std::int32_t error = HttpErrorOf(request_->Exchange());
      if (error != http_error::kSecureChannel) return Fail(error != 0 ? error : http_error::kConnectionLost);
      // The window may be gone when the answer comes; its number is not given to another one so soon.
      const bool asked = ProbeCertificate(
          host_, port_, [window = window_.Get(), message = MessageOf(kProbed)](std::int32_t probed) {
            PostMessageW(window, message, static_cast<WPARAM>(probed), 0);
          });
      if (!asked) Fail(error);
      return;
    }
  }
}

void WindowsSecureFetch::OnHead() {
  const auto head = request_->Header(WINHTTP_QUERY_RAW_HEADERS_CRLF);
  announced_ = request_->AnnouncedLength();
  // A body without a length that the connection's end ends could have been cut by anybody.
  if (!head || !head->ends_with(L"\r\n\r\n") || (!announced_ && !request_->IsChunked()))
    return Fail(http_error::kConnectionLost);
  HttpExchange& exchange = request_->Exchange();
  exchange.ended = false;
  // Latin-1, as the system has read it.
  arrived_.assign(head->size(), '?');
  std::transform(head->begin(), head->end(), arrived_.begin(),
                 [](wchar_t unit) { return static_cast<char>(unit & 0xFF); });
  if (!TellArrived()) return;
  if (announced_ == 0U) return events_->OnClosedByPeer();
  if (!ReadMore()) Fail(http_error::kConnectionLost);
}

bool WindowsSecureFetch::ReadMore() {
  HttpExchange& exchange = request_->Exchange();
  if (want_ == 0) {
    asked_ = GetTickCount64();
    return WinHttpQueryDataAvailable(request_->Get(), nullptr);
  }
  std::size_t most = want_;
  if (announced_) most = static_cast<std::size_t>(std::min<std::uint64_t>(most, *announced_ - received_));
  exchange.answer.resize(most);
  return WinHttpReadData(request_->Get(), exchange.answer.data(), static_cast<DWORD>(most), nullptr);
}

void WindowsSecureFetch::OnBody(DWORD count) {
  HttpExchange& exchange = request_->Exchange();
  if (count == 0) {
    if (request_->IsCut(received_)) return Fail(http_error::kConnectionLost);
    return events_->OnClosedByPeer();
  }
  received_ += count;
  // The next bytes are fetched while these are taken.
  if (readFrom_ == arrived_.size()) {
    arrived_.swap(exchange.answer);
    arrived_.resize(count);
    readFrom_ = 0;
  } else {
    // The host handles messages in the event of the bytes before.
    arrived_.append(exchange.answer, 0, count);
  }
  const bool whole = announced_ && received_ == *announced_;
  const ULONGLONG now = GetTickCount64();
  const ULONGLONG took = now - asked_;
  asked_ = now;
  if (took < kQuickMs && count >= kManyBytes) {
    want_ = std::clamp<std::size_t>(std::size_t{2} * count, kLeastRead, kMostRead);
  } else if (took > kSlowMs) {
    want_ = 0;
  }
  if (!whole && !ReadMore()) return Fail(http_error::kConnectionLost);
  if (TellArrived() && whole) events_->OnClosedByPeer();
}

bool WindowsSecureFetch::TellArrived() {
  const UINT fetch = fetch_;
  while (fetch == fetch_ && readFrom_ < arrived_.size()) {
    const std::size_t before = readFrom_;
    events_->OnReadable();
    // Nobody wants it: the download is over, and its fetch was left open.
    if (fetch == fetch_ && readFrom_ == before) {
      Close();
      return false;
    }
  }
  return fetch == fetch_;
}

void WindowsSecureFetch::Fail(std::int32_t httpError) {
  SocketEvents* const events = events_;
  Close();
  if (events) events->OnSocketError(httpError);
}

}  // namespace tarnwick
