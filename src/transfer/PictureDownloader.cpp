#include "transfer/PictureDownloader.h"

#include <algorithm>
#include <memory>

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"
#include "platform/Platform.h"
#include "support/PathHelpers.h"
#include "transfer/FtpErrors.h"

namespace tarnwick {
namespace {

// A host hears of each arrival.
constexpr std::size_t kMostOfArrival = std::size_t{4} << 20;

// Bytes of a file that are compared at a time.
constexpr std::size_t kCompared = std::size_t{256} << 10;

// Winsock's numbers.
constexpr std::int32_t kWinsockReset = 10054;
constexpr std::int32_t kWinsockRefused = 10061;
constexpr std::int32_t kWinsockHostNotFound = 11001;

// An FtpErrors value and its text.
struct Reason {
  std::int32_t ftpError;
  TextView text;
};

Reason ReasonOf(DownloadFailure failure, std::int32_t socketError) {
  using namespace ftp_error;
  switch (failure) {
    case DownloadFailure::kAddress:
      return {kAborted, u"The file's address is not safe."};
    case DownloadFailure::kFolder:
      return {kAborted, u"There is no folder for local copies."};
    case DownloadFailure::kProxy:
      return {kAborted, u"The proxy setting names no port."};
    case DownloadFailure::kEmpty:
      return {kConnectAborted, u"The server closed the connection without an answer."};
    case DownloadFailure::kCut:
      return {kConnectAborted, u"The server closed the connection in the middle of its answer."};
    case DownloadFailure::kTooLong:
      return {kAborted, u"The file is too large."};
    case DownloadFailure::kMemory:
      return {kAborted, u"There is not enough memory for the file."};
    case DownloadFailure::kSilence:
      return {kTimeout, u"The server was silent for too long."};
    case DownloadFailure::kConnection:
      break;
  }
  switch (socketError) {
    case kWinsockReset:
      return {kConnectionReset, u"The server reset the connection."};
    case kWinsockRefused:
      return {kConnectionRefused, u"The server refused the connection."};
    case kWinsockHostNotFound:
      return {kHostNotFound, u"The server's name was not found."};
    default:
      return {kConnectAborted, u"The connection failed."};
  }
}

// Whether the file has exactly these bytes.
bool Holds(FileSystem& files, TextView path, std::string_view bytes) {
  return ResultAsItStood(false, [&](bool& same) {
    if (files.Length(path) != bytes.size()) return;
    const std::unique_ptr<FileReader> reader = files.Open(path);
    std::string block(std::min(bytes.size(), kCompared), '\0');
    for (; !bytes.empty(); bytes.remove_prefix(block.size())) {
      block.resize(std::min(bytes.size(), kCompared));
      if (reader->Read(block) != block.size() || bytes.substr(0, block.size()) != block) return;
    }
    same = true;
  });
}

}  // namespace

PictureDownloader::PictureDownloader(Apartment& apartment, StreamSocket& socket, Timer& watchdog)
    : apartment_(apartment), socket_(socket), watchdog_(watchdog), machine_(*this) {
  socket_.SetEvents(this);
  watchdog_.SetHandler([this] {
    if (machine_.IsRunning()) return machine_.OnWatchdog();
    // Of an upload: it fails the transfer all the same.
    watchdog_.Stop();
    Failed(DownloadFailure::kSilence, false);
  });
}

PictureDownloader::~PictureDownloader() {
  watchdog_.Stop();
  socket_.SetEvents(nullptr);
  socket_.Close();
}

bool PictureDownloader::CanStart(TextView url) const {
  DownloadPlan plan;
  return !url.empty() && !MakeDownloadPlan(url, apartment_.UserFolderPath, apartment_.proxy.ProxyHost,
                                           apartment_.proxy.ProxyPort, plan);
}

void PictureDownloader::Start(TextView url, TextView explicitTarget) {
  socketError_ = 0;
  changes_ = apartment_.ChangesOfCopy(apartment_.UserFolderPath + u"\\" + Text(FileNameFromUrl(url)));
  machine_.StartDownload(url, apartment_.UserFolderPath, explicitTarget, apartment_.proxy.ProxyHost,
                         apartment_.proxy.ProxyPort);
}

void PictureDownloader::Wait() {
  // A quit message ends the program: nothing is waited for any more.
  if (apartment_.platform.pump.Wait()) return;
  machine_.Cancel();
  Failed(DownloadFailure::kConnection, false);
}

bool PictureDownloader::GivesUp() {
  if (!events_ || events_->IsWanted()) return false;
  machine_.Cancel();
  return true;
}

void PictureDownloader::Connect(TextView host, std::uint16_t port) {
  // It tells nothing yet, so the event still comes first; and what the host does there finds a download to
  // end.
  socket_.Connect(host, port);
  if (events_) events_->Resolving();
}

void PictureDownloader::OnConnected() {
  if (!machine_.IsRunning() || GivesUp()) return;
  if (events_) events_->Connected();
  machine_.OnConnected();
  if (events_ && machine_.IsRunning()) events_->TransferStarting();
}

void PictureDownloader::OnReadable() {
  if (GivesUp()) return;
  const std::span<char> room = machine_.Room(kMostOfArrival);
  if (!room.empty()) machine_.OnArrived(socket_.Read(room));
}

void PictureDownloader::OnClosedByPeer() {
  if (!GivesUp()) machine_.OnClosedByPeer();
}

void PictureDownloader::OnSocketError(std::int32_t number) {
  socketError_ = number;
  machine_.OnSocketError();
}

bool PictureDownloader::WriteFile(TextView path, TextView explicitPath, std::string_view bytes) {
  return ResultAsItStood(false, [&](bool& written) {
    FileSystem& files = apartment_.platform.files;
    // An upload, a rename or a delete has come before these bytes, which are not the file's any more.
    const bool overtaken = apartment_.ChangesOfCopy(path) != changes_;
    if (!explicitPath.empty()) {
      // The target may be the copy itself.
      if (overtaken && (LowerCase(explicitPath) == LowerCase(path) || files.SameFile(explicitPath, path)))
        return;
      files.Write(explicitPath, bytes);
      written = true;
    }
    if (overtaken) return;
    // Not copied from the other one: the bytes are here. Most often the picture has been shown before, and
    // the user's folder has it.
    if (explicitPath != path && !Holds(files, path, bytes)) files.Write(path, bytes);
    written = true;
  });
}

void PictureDownloader::Received(std::int32_t bytes) {
  if (events_) events_->Received(bytes);
}

void PictureDownloader::HeaderFound(std::string_view statusLine, std::int32_t bytes) {
  if (events_) events_->HeaderFound(TextFromLatin1(statusLine), bytes);
}

void PictureDownloader::Finished(bool written) {
  if (events_) events_->Finished(written);
}

void PictureDownloader::Failed(DownloadFailure failure, bool told) {
  const Reason reason = ReasonOf(failure, socketError_);
  if (events_) events_->Failed(reason.ftpError, reason.text, told);
}

}  // namespace tarnwick
