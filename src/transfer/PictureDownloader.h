// A control's downloader: ties the machine to a socket, or to a fetch over TLS, the watchdog and the local
// files.
#pragma once

#include <memory>

#include "platform/FileSystem.h"
#include "platform/SecureFetch.h"
#include "platform/StreamSocket.h"
#include "platform/Timer.h"
#include "session/Apartment.h"
#include "transfer/SocketDownloader.h"
#include "transfer/Transfers.h"

namespace tarnwick {

class PictureDownloader : public Downloader, private DownloadActions, private SocketEvents {
 public:
  // All of them outlive the object. The owner keeps it alive while it tells its events.
  PictureDownloader(Apartment& apartment, StreamSocket& socket, SecureFetch& secureFetch, Timer& watchdog);
  ~PictureDownloader() override;
  PictureDownloader(const PictureDownloader&) = delete;
  PictureDownloader& operator=(const PictureDownloader&) = delete;

  void SetEvents(DownloadEvents* events) override { events_ = events; }
  bool CanStart(TextView url) const override;
  void Start(TextView url, TextView explicitTarget) override;
  void Prepare(TextView target) override;
  void Cancel() override;
  void RestartWatchdog() override { watchdog_.Start(kWatchdogMs); }
  void StopWatchdog() override { watchdog_.Stop(); }
  void Wait() override;

 private:
  // Cancels a download that is not wanted any more; whether it did.
  bool GivesUp();
  DownloadRoute Route() const;

  // DownloadActions
  void Connect(const DownloadPlan& plan) override;
  void Send(std::string_view bytes) override { socket_.Send(bytes); }
  void CloseSocket() override { stream_->Close(); }
  void BeginFile(TextView path, TextView explicitPath) override;
  void WriteFile(std::string_view bytes) override;
  bool FinishFile(std::string_view rest) override;
  void DropFile() override { writer_.reset(); }
  void Received(std::int32_t bytes) override;
  void HeaderFound(std::string_view statusLine, std::int32_t bytes) override;
  void Finished(bool written) override;
  void Failed(DownloadFailure failure, bool told) override;

  // SocketEvents
  void OnResolved() override {}
  void OnConnected() override;
  void OnReadable() override;
  void OnClosedByPeer() override;
  void OnSent() override { machine_.OnSent(); }
  void OnSocketError(std::int32_t number) override;

  Apartment& apartment_;
  StreamSocket& socket_;
  SecureFetch& secureFetch_;
  // The one of them that the download uses.
  ByteStream* stream_ = &socket_;
  Timer& watchdog_;
  SocketDownloader machine_;
  DownloadEvents* events_ = nullptr;
  // Winsock's number of the socket's last failure, or an http_error of the fetch over TLS.
  std::int32_t error_ = 0;
  // How often the local copy that is fetched had changed before: see Apartment::copyChanges.
  std::uint32_t changes_ = 0;
  // Where the file that is fetched goes: see DownloadActions.
  Text path_;
  Text explicitPath_;
  // The first of them.
  const Text& Target() const { return explicitPath_.empty() ? path_ : explicitPath_; }
  // Of the file that is to be at `writerTarget_`; null when there is none, or a write failed.
  std::unique_ptr<FileWriter> writer_;
  Text writerTarget_;
  // Whether a part of it was written, so that it is not in memory any more.
  bool large_ = false;
};

}  // namespace tarnwick
