#include "transfer/SocketDownloader.h"

#include <algorithm>
#include <charconv>
#include <new>
#include <utility>

#include "base/RuntimeError.h"
#include "support/HttpAddress.h"
#include "support/PathHelpers.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {
namespace {

constexpr TextView kPlainScheme = u"http://";
constexpr std::string_view kHeaderEnd = "\r\n\r\n";

// Bytes from which on a piece of the body is written: what is less stays in memory until more comes.
constexpr std::size_t kPiece = std::size_t{256} << 10;

// Room for what arrives at a time, if the file is that long.
constexpr std::size_t kMostRoom = std::size_t{1} << 20;

// The number after the first blank of a header line; 0 when it is no 32-bit number.
std::int32_t NumberOf(std::string_view line) {
  const std::size_t blank = line.find(' ');
  if (blank == std::string_view::npos) return 0;
  const std::string_view digits = line.substr(blank + 1);
  std::int32_t number = 0;
  const auto [stop, status] = std::from_chars(digits.data(), digits.data() + digits.size(), number);
  return status == std::errc{} && stop == digits.data() + digits.size() ? number : 0;
}

}  // namespace

std::optional<DownloadFailure> MakeDownloadPlan(TextView url, const DownloadRoute& route,
                                                DownloadPlan& plan) {
  const TextView fileName = FileNameFromUrl(url);
  const auto address = SplitUrl(url);
  if (!address || address->path.empty() || !IsSafeFileName(fileName)) return DownloadFailure::kAddress;
  if (address->secure != route.secure)
    return route.secure ? DownloadFailure::kClearText : DownloadFailure::kAddress;
  if (route.folder.empty()) return DownloadFailure::kFolder;
  plan.secure = address->secure;
  plan.host = address->host;
  plan.port = address->port;
  plan.requestTarget = address->path;
  plan.file = Text(route.folder) + u"\\" + Text(fileName);
  if (plan.secure) return std::nullopt;
  const TextView rest = url.starts_with(kPlainScheme) ? url.substr(kPlainScheme.size()) : url;
  // With the port, where there is one.
  plan.hostLine = rest.substr(0, rest.find(u'/'));
  if (route.proxyHost.empty()) return std::nullopt;
  const auto proxy = SplitHttpAddress(Text(route.proxyHost) + u":" + Text(route.proxyPort));
  if (!proxy || !proxy->path.empty()) return DownloadFailure::kProxy;
  plan.host = plan.hostLine = proxy->host;
  plan.port = proxy->port;
  plan.requestTarget = Text(kPlainScheme) + Text(rest);
  return std::nullopt;
}

// Other characters than blanks go out as their UTF-8 bytes.
std::string TargetBytes(TextView path) {
  return Utf8FromText(ReplaceAll(path, u" ", u"%20"));
}

void SocketDownloader::StartDownload(TextView url, TextView explicitTarget, const DownloadRoute& route) {
  if (url.empty()) return;
  Cancel();
  reply_ = {};
  searched_ = bodyStart_ = unwritten_ = received_ = 0;
  contentLength_ = 0;
  headerFound_ = false;
  running_ = true;
  actions_.RestartWatchdog();
  explicitTarget_ = explicitTarget;
  plan_ = {};
  if (const auto failure = MakeDownloadPlan(url, route, plan_)) return EndWith(*failure, true);
  actions_.Connect(plan_);
}

void SocketDownloader::Cancel() {
  if (!running_) return;
  Stop();
  actions_.CloseSocket();
  actions_.StopWatchdog();
}

void SocketDownloader::Stop() {
  running_ = false;
  reply_ = {};
  actions_.DropFile();
}

void SocketDownloader::OnConnected() {
  if (!running_) return;
  if (!plan_.secure)
    actions_.Send("GET " + TargetBytes(plan_.requestTarget) + " HTTP/1.1\r\nHost: " +
                  Utf8FromText(plan_.hostLine) + "\r\n" + std::string(kDownloadHeaders) + "\r\n");
  actions_.BeginFile(plan_.file, explicitTarget_);
}

std::span<char> SocketDownloader::Room() {
  if (!running_) return {};
  try {
    return reply_.Room();
  } catch (const std::bad_alloc&) {
    // A file with a hole in it is worse than none.
    EndWith(DownloadFailure::kMemory, true);
    return {};
  }
}

void SocketDownloader::OnArrived(std::size_t count) {
  if (!running_ || count == 0) return;
  reply_.Add(count);
  received_ += count;
  if (received_ > kMostReplyBytes) return EndWith(DownloadFailure::kTooLong, true);
  // Before the event, in which more may arrive.
  if (headerFound_ && Unwritten().size() >= kPiece) {
    actions_.WriteFile(Unwritten());
    reply_.Clear();
    unwritten_ = 0;
  }
  actions_.Received(BodyBytes());
  // The host may have ended or replaced the download in its event.
  if (!running_) return;
  actions_.RestartWatchdog();
  if (const auto statusLine = FindHeader()) actions_.HeaderFound(*statusLine, BodyBytes());
}

std::optional<std::string> SocketDownloader::FindHeader() {
  if (headerFound_) return std::nullopt;
  // The last three bytes may be the beginning of the empty line; all before them has been seen.
  const std::string_view arrived = reply_.Bytes();
  const std::size_t end = arrived.find(kHeaderEnd, searched_ > 3 ? searched_ - 3 : 0);
  searched_ = arrived.size();
  if (end == std::string_view::npos) return std::nullopt;
  headerFound_ = true;
  bodyStart_ = unwritten_ = end + kHeaderEnd.size();

  std::string_view lines = arrived.substr(0, end);
  const std::string statusLine(lines.substr(0, lines.find("\r\n")));
  while (!lines.empty()) {
    const std::string_view line = lines.substr(0, lines.find("\r\n"));
    if (line.find("Content-Length") != std::string_view::npos) {
      contentLength_ = NumberOf(line);
      break;
    }
    lines.remove_prefix(std::min(line.size() + 2, lines.size()));
  }
  // Once, so that the body is not copied as it grows. Without it there may be room for what really comes.
  ResultAsItStood(0, [&](int&) {
    if (contentLength_ > 0)
      reply_.Reserve(bodyStart_ + std::min(static_cast<std::size_t>(contentLength_), kMostRoom));
  });
  return statusLine;
}

void SocketDownloader::OnClosedByPeer() {
  if (!running_) return;
  // A host that pumps messages in the event of an arrival gets the close before the arrival was searched.
  const auto statusLine = FindHeader();
  if (!headerFound_)
    return received_ == 0 ? EndWith(DownloadFailure::kEmpty, true) : EndWith(DownloadFailure::kCut, false);
  const std::int32_t bytes = BodyBytes();
  const ReplyBuffer reply = std::exchange(reply_, {});
  running_ = false;
  actions_.CloseSocket();
  actions_.StopWatchdog();
  const bool written = actions_.FinishFile(reply.Bytes().substr(unwritten_));
  if (statusLine) actions_.HeaderFound(*statusLine, bytes);
  actions_.Finished(written);
}

void SocketDownloader::OnSent() {
  if (running_) actions_.RestartWatchdog();
}

void SocketDownloader::OnSocketError() {
  if (running_) EndWith(DownloadFailure::kConnection, true);
}

void SocketDownloader::OnWatchdog() {
  if (!running_) return;
  // The socket stays as it is; a new download closes it.
  Stop();
  actions_.StopWatchdog();
  actions_.Failed(DownloadFailure::kSilence, false);
}

void SocketDownloader::EndWith(DownloadFailure failure, bool told) {
  Stop();
  actions_.CloseSocket();
  actions_.StopWatchdog();
  actions_.Failed(failure, told);
}

}  // namespace tarnwick
