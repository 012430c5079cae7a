// The picture downloader: an HTTP/1.1 client for one file at a time, made of what the server sends. It owns
// no socket, clock or window: it is told what happens and says what is to be done, so that Winsock, a test
// and a fuzzer drive it alike.
//
// Wire form of the request, each line with CR LF at its end, then an empty one:
//   GET TARGET HTTP/1.1
//   Host: HOST
//   Connection: close
//   Accept: */*
//   User-Agent: Mozilla/4.0 (compatible; MSIE 4.0; Windows NT)
// Over TLS the system writes it, and its answer is handed on in the same form. The reply is everything up to
// an orderly close, whatever it says of itself: its bytes after the first empty line are the file.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "base/Text.h"
#include "transfer/ReplyBuffer.h"

namespace tarnwick {

// More bytes than a picture has; a reply that is longer fails.
inline constexpr std::size_t kMostReplyBytes = std::size_t{256} << 20;

// Longest silence of a transfer.
inline constexpr std::uint32_t kWatchdogMs = 40'000;

// Why there is no file.
enum class DownloadFailure {
  kAddress,     // the address, or the name in it, could do harm
  kClearText,   // the address is not one of TLS, and the session is
  kFolder,      // there is no folder for it
  kProxy,       // the proxy setting names no port
  kConnection,  // the socket failed
  kEmpty,       // closed without a byte
  kCut,         // closed in the header
  kTooLong,
  kMemory,
  kSilence,
};

// Where a file is fetched from and goes to.
struct DownloadPlan {
  bool secure = false;
  Text host;
  std::uint16_t port = 80;
  Text hostLine;
  Text requestTarget;
  Text file;
};

// How the files of a session are fetched.
struct DownloadRoute {
  // Where they go; there is none when it is empty.
  TextView folder;
  // None when its host is empty. Over TLS the system's own is used.
  TextView proxyHost;
  TextView proxyPort;
  // The session is one over TLS.
  bool secure = false;
};

// The lines of a request's head between Host and the empty line.
inline constexpr std::string_view kDownloadHeaders =
    "Connection: close\r\nAccept: */*\r\nUser-Agent: Mozilla/4.0 (compatible; MSIE 4.0; Windows NT)\r\n";

// The plan for fetching `url` ("http://host[:port]/path", or without the scheme, or with "https://" over TLS)
// under the last part of the address. Returns what stands against it: an address of the other kind or with a
// name that could do harm, a folder that is empty, a proxy without a usable port.
std::optional<DownloadFailure> MakeDownloadPlan(TextView url, const DownloadRoute& route, DownloadPlan& plan);

// What the downloader wants to be done. The last four are events: in them a host may start or end a download,
// and more of what happens may be told. Nothing may be told to it from inside the others.
class DownloadActions {
 public:
  virtual ~DownloadActions() = default;
  // Connects for the plan; over TLS that begins the whole fetch, so nothing is sent afterwards.
  virtual void Connect(const DownloadPlan& plan) = 0;
  virtual void Send(std::string_view bytes) = 0;
  virtual void CloseSocket() = 0;
  virtual void RestartWatchdog() = 0;
  virtual void StopWatchdog() = 0;
  // A file begins that will be at `explicitPath`, unless that is empty, and at `path`. One that cannot be
  // written fails at its end.
  virtual void BeginFile(TextView path, TextView explicitPath) = 0;
  // The next bytes of a large file.
  virtual void WriteFile(std::string_view bytes) = 0;
  // Writes the rest, which of a small file is all, and puts the file over what is there. Whether it is at the
  // first of its places now.
  virtual bool FinishFile(std::string_view rest) = 0;
  // It is not wanted any more. There may be none.
  virtual void DropFile() = 0;

  virtual void Received(std::int32_t bytes) = 0;
  // The header is whole: its first line, and the bytes behind it that have arrived.
  virtual void HeaderFound(std::string_view statusLine, std::int32_t bytes) = 0;
  virtual void Finished(bool written) = 0;
  // The download is over without a file. `told`: hosts hear of it.
  virtual void Failed(DownloadFailure failure, bool told) = 0;
};

class SocketDownloader {
 public:
  explicit SocketDownloader(DownloadActions& actions) : actions_(actions) {}

  // Begins to fetch a file as MakeDownloadPlan says, and fails at once where that fails. The file goes to
  // `explicitTarget` first unless that is empty. An empty address does nothing.
  void StartDownload(TextView url, TextView explicitTarget, const DownloadRoute& route);

  // Ends a download without an event.
  void Cancel();

  void OnConnected();
  // Where the next bytes that arrive are to be put; empty when the download is over, which it is when there
  // is no memory for them.
  std::span<char> Room();
  // So many bytes have arrived in the room.
  void OnArrived(std::size_t count);
  void OnClosedByPeer();
  void OnSent();
  void OnSocketError();
  void OnWatchdog();

  bool IsRunning() const { return running_; }

 private:
  // It runs no more, and nothing is left of it.
  void Stop();
  void EndWith(DownloadFailure failure, bool told);
  // The status line when the header, which was not known before, is whole.
  std::optional<std::string> FindHeader();
  std::int32_t BodyBytes() const { return static_cast<std::int32_t>(received_ - bodyStart_); }
  // The bytes of the body that were not handed on yet.
  std::string_view Unwritten() const { return reply_.Bytes().substr(unwritten_); }

  DownloadActions& actions_;
  DownloadPlan plan_;
  Text explicitTarget_;
  // What has arrived: everything up to the first piece that is written, later what came after the last one.
  ReplyBuffer reply_;
  // Where in it the bytes begin that are still to be written.
  std::size_t unwritten_ = 0;
  // Bytes that have arrived in all.
  std::size_t received_ = 0;
  std::size_t searched_ = 0;
  // Where the body begins, once the header was found.
  std::size_t bodyStart_ = 0;
  std::int32_t contentLength_ = 0;
  bool headerFound_ = false;
  bool running_ = false;
};

}  // namespace tarnwick
