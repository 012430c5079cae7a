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
// The reply is everything up to an orderly close, whatever it says of itself: its bytes after the first empty
// line are the file.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "support/Text.h"
#include "transfer/ReplyBuffer.h"

namespace tarnwick {

// More bytes than a picture has; a reply that is longer fails.
inline constexpr std::size_t kMostReplyBytes = std::size_t{256} << 20;

// Longest silence of a transfer.
inline constexpr std::uint32_t kWatchdogMs = 40'000;

// What the downloader wants to be done. The last four are events: in them a host may start or end a download,
// and more of what happens may be told. Nothing may be told to it from inside the others.
class DownloadActions {
 public:
  virtual ~DownloadActions() = default;
  virtual void Connect(TextView host, std::uint16_t port) = 0;
  virtual void Send(std::string_view bytes) = 0;
  virtual void CloseSocket() = 0;
  virtual void RestartWatchdog() = 0;
  virtual void StopWatchdog() = 0;
  // Writes the bytes to `explicitPath`, unless that is empty, and to `path`, over what is there. Failures are
  // ignored: who waits for the file sees that it is not there.
  virtual void WriteFile(TextView path, TextView explicitPath, std::string_view bytes) = 0;

  virtual void Received(std::int32_t bytes) = 0;
  // The header is whole: its first line, and the bytes behind it that have arrived.
  virtual void HeaderFound(std::string_view statusLine, std::int32_t bytes) = 0;
  virtual void Finished() = 0;
  // The download is over without a file. `told`: hosts hear of it.
  virtual void Failed(bool told) = 0;
};

class SocketDownloader {
 public:
  explicit SocketDownloader(DownloadActions& actions) : actions_(actions) {}

  // Begins to fetch `url` ("http://host[:port]/path", or without the scheme), through the proxy unless its
  // host is empty. The file goes to `folder` under the last part of the address, and first to
  // `explicitTarget` unless that is empty. An address or name that could do harm, a folder that is empty, or
  // a proxy without a usable port fails at once. An empty address does nothing.
  void StartDownload(TextView url, TextView folder, TextView explicitTarget, TextView proxyHost,
                     TextView proxyPort);

  // Ends a download without an event.
  void Cancel();

  void OnConnected();
  // Where the next bytes that arrive are to be put, at most `most`; empty when the download is over, which it
  // is when there is no memory for them.
  std::span<char> Room(std::size_t most);
  // So many bytes have arrived in the room.
  void OnArrived(std::size_t count);
  void OnClosedByPeer();
  void OnSent();
  void OnSocketError();
  void OnWatchdog();

  bool IsRunning() const { return running_; }
  // The announced length of the file; 0 when there is none that is a 32-bit number.
  std::int32_t ContentLength() const { return contentLength_; }

 private:
  void Fail(bool told);
  // The status line when the header, which was not known before, is whole.
  std::optional<std::string> FindHeader();
  std::int32_t BodyBytes() const { return static_cast<std::int32_t>(reply_.Size() - bodyStart_); }

  DownloadActions& actions_;
  Text remoteHost_;
  Text hostLine_;
  Text remotePath_;
  Text target_;
  Text explicitTarget_;
  // Everything that has arrived.
  ReplyBuffer reply_;
  std::size_t searched_ = 0;
  // Where the body begins, once the header was found.
  std::size_t bodyStart_ = 0;
  std::int32_t contentLength_ = 0;
  bool headerFound_ = false;
  bool running_ = false;
};

}  // namespace tarnwick
