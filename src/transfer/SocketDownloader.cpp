#include "transfer/SocketDownloader.h"

#include <algorithm>
#include <charconv>
#include <new>

#include "support/PathHelpers.h"
#include "support/RuntimeError.h"
#include "transfer/FileNameGuard.h"
#include "transfer/HttpAddress.h"

namespace tarnwick {
namespace {

constexpr TextView kScheme = u"http://";
constexpr std::string_view kHeaderEnd = "\r\n\r\n";

// A request target with blanks as %20; other characters go out as their UTF-8 bytes.
std::string TargetBytes(TextView path) {
  return Utf8FromText(ReplaceAll(path, u" ", u"%20"));
}

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

void SocketDownloader::StartDownload(TextView url, TextView folder, TextView explicitTarget,
                                     TextView proxyHost, TextView proxyPort) {
  if (url.empty()) return;
  Cancel();
  buffer_ = {};
  searched_ = arrived_ = 0;
  contentLength_ = 0;
  headerFound_ = false;
  running_ = true;
  actions_.RestartWatchdog();

  const TextView fileName = FileNameFromUrl(url);
  const TextView rest = url.starts_with(kScheme) ? url.substr(kScheme.size()) : url;
  const auto address = SplitHttpAddress(rest);
  if (!address || address->path.empty() || folder.empty() || !IsSafeFileName(fileName)) return Fail(true);
  std::uint16_t port = address->port;
  remoteHost_ = address->host;
  remotePath_ = address->path;
  // With the port, where there is one.
  hostLine_ = rest.substr(0, rest.find(u'/'));
  if (!proxyHost.empty()) {
    const auto proxy = SplitHttpAddress(Text(proxyHost) + u":" + Text(proxyPort));
    if (!proxy || !proxy->path.empty()) return Fail(true);
    remoteHost_ = hostLine_ = proxy->host;
    port = proxy->port;
    remotePath_ = Text(kScheme) + Text(rest);
  }
  target_ = Text(folder) + u"\\" + Text(fileName);
  explicitTarget_ = explicitTarget;
  actions_.Connect(remoteHost_, port);
}

void SocketDownloader::Cancel() {
  if (!running_) return;
  running_ = false;
  buffer_ = {};
  actions_.CloseSocket();
  actions_.StopWatchdog();
}

void SocketDownloader::OnConnected() {
  if (!running_) return;
  actions_.Send("GET " + TargetBytes(remotePath_) + " HTTP/1.1\r\nHost: " + Utf8FromText(hostLine_) +
                "\r\nConnection: close\r\nAccept: */*\r\n"
                "User-Agent: Mozilla/4.0 (compatible; MSIE 4.0; Windows NT)\r\n\r\n");
}

void SocketDownloader::OnData(std::span<const char> bytes) {
  if (!running_ || bytes.empty()) return;
  arrived_ += bytes.size();
  if (arrived_ > kMostReplyBytes) return Fail(true);
  const auto shown = static_cast<std::int32_t>(headerFound_ ? buffer_.size() + bytes.size() : arrived_);
  try {
    buffer_.append(bytes.data(), bytes.size());
  } catch (const std::bad_alloc&) {
    // A file with a hole in it is worse than none.
    return Fail(true);
  }
  actions_.Received(shown);
  // The host may have ended or replaced the download in its event.
  if (!running_) return;
  actions_.RestartWatchdog();
  if (const auto statusLine = FindHeader()) actions_.ReplyLine(*statusLine);
}

std::optional<std::string> SocketDownloader::FindHeader() {
  if (headerFound_) return std::nullopt;
  // The last three bytes may be the beginning of the empty line; all before them has been seen.
  const std::size_t from = searched_ > 3 ? searched_ - 3 : 0;
  const std::size_t end = buffer_.find(kHeaderEnd, from);
  searched_ = buffer_.size();
  if (end == std::string::npos) return std::nullopt;
  headerFound_ = true;

  const std::string header = buffer_.substr(0, end);
  buffer_.erase(0, end + kHeaderEnd.size());
  std::string_view lines = header;
  const std::string_view statusLine = lines.substr(0, lines.find("\r\n"));
  while (!lines.empty()) {
    const std::string_view line = lines.substr(0, lines.find("\r\n"));
    if (line.find("Content-Length") != std::string_view::npos) {
      contentLength_ = NumberOf(line);
      break;
    }
    lines.remove_prefix(std::min(line.size() + 2, lines.size()));
  }
  // Once, so that the body is not copied as it grows; what the server says is believed up to the bound. Where
  // there is no room for all of it, there may be for what really comes.
  ResultAsItStood(0, [&](int&) {
    if (contentLength_ > 0)
      buffer_.reserve(std::min<std::size_t>(static_cast<std::size_t>(contentLength_), kMostReplyBytes));
  });
  return std::string(statusLine);
}

void SocketDownloader::OnClosedByPeer() {
  if (!running_) return;
  // A host that pumps messages in the event of an arrival gets the close before the arrival was searched.
  const auto statusLine = FindHeader();
  if (!headerFound_) return Fail(arrived_ == 0);
  const std::string body = std::move(buffer_);
  buffer_ = {};
  running_ = false;
  actions_.CloseSocket();
  actions_.StopWatchdog();
  actions_.WriteFile(target_, explicitTarget_, body);
  if (statusLine) actions_.ReplyLine(*statusLine);
  actions_.Finished();
}

void SocketDownloader::OnSent() {
  if (running_) actions_.RestartWatchdog();
}

void SocketDownloader::OnSocketError() {
  if (running_) Fail(true);
}

void SocketDownloader::OnWatchdog() {
  if (!running_) return;
  // The socket stays as it is; a new download closes it.
  running_ = false;
  buffer_ = {};
  actions_.StopWatchdog();
  actions_.Failed(false);
}

void SocketDownloader::Fail(bool told) {
  running_ = false;
  buffer_ = {};
  actions_.CloseSocket();
  actions_.StopWatchdog();
  actions_.Failed(told);
}

}  // namespace tarnwick
