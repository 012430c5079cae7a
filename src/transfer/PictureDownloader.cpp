#include "transfer/PictureDownloader.h"

#include <algorithm>
#include <memory>

#include "platform/FileSystem.h"
#include "platform/Platform.h"
#include "support/PathHelpers.h"
#include "support/RuntimeError.h"

namespace tarnwick {
namespace {

// A host hears of each arrival.
constexpr std::size_t kMostOfArrival = std::size_t{4} << 20;

// Bytes of a file that are compared at a time.
constexpr std::size_t kCompared = std::size_t{256} << 10;

// FtpErrors.
constexpr std::int32_t kHostNotFound = 9;
constexpr std::int32_t kConnectionReset = 7;
constexpr std::int32_t kConnectionRefused = 6;
constexpr std::int32_t kConnectAborted = 5;
constexpr std::int32_t kTimeout = 58;
// Winsock's numbers of the same conditions.
constexpr std::int32_t kWinsockReset = 10054;
constexpr std::int32_t kWinsockRefused = 10061;
constexpr std::int32_t kWinsockHostNotFound = 11001;

std::int32_t FtpErrorOf(std::int32_t winsockError) {
  switch (winsockError) {
    case kWinsockReset:
      return kConnectionReset;
    case kWinsockRefused:
      return kConnectionRefused;
    case kWinsockHostNotFound:
      return kHostNotFound;
    default:
      return kConnectAborted;
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
    ftpError_ = kTimeout;
    if (machine_.IsRunning()) return machine_.OnWatchdog();
    // Of an upload: it fails the transfer all the same.
    watchdog_.Stop();
    Failed(false);
  });
}

PictureDownloader::~PictureDownloader() {
  watchdog_.Stop();
  socket_.SetEvents(nullptr);
  socket_.Close();
}

void PictureDownloader::Start(TextView url, TextView explicitTarget) {
  ftpError_ = kConnectAborted;
  machine_.StartDownload(url, apartment_.UserFolderPath, explicitTarget, apartment_.proxy.ProxyHost,
                         apartment_.proxy.ProxyPort);
}

void PictureDownloader::Wait() {
  // A quit message ends the program: nothing is waited for any more.
  if (apartment_.platform.pump.Wait()) return;
  machine_.Cancel();
  Failed(false);
}

void PictureDownloader::Connect(TextView host, std::uint16_t port) {
  // It tells nothing yet, so the event still comes first; and what the host does there finds a download to
  // end.
  socket_.Connect(host, port);
  if (events_) events_->Resolving();
}

void PictureDownloader::OnConnected() {
  if (!machine_.IsRunning()) return;
  if (events_) events_->Connected();
  machine_.OnConnected();
  if (events_ && machine_.IsRunning()) events_->TransferStarting();
}

void PictureDownloader::OnReadable() {
  const std::span<char> room = machine_.Room(kMostOfArrival);
  if (!room.empty()) machine_.OnArrived(socket_.Read(room));
}

void PictureDownloader::OnSocketError(std::int32_t number) {
  ftpError_ = FtpErrorOf(number);
  machine_.OnSocketError();
}

void PictureDownloader::WriteFile(TextView path, TextView explicitPath, std::string_view bytes) {
  ResultAsItStood(0, [&](int&) {
    FileSystem& files = apartment_.platform.files;
    if (!explicitPath.empty()) files.Write(explicitPath, bytes);
    // Not copied from the other one: the bytes are here. Most often the picture has been shown before, and
    // the user's folder has it.
    if (explicitPath != path && !Holds(files, path, bytes)) files.Write(path, bytes);
  });
}

void PictureDownloader::Received(std::int32_t bytes) {
  if (events_) events_->Received(bytes);
}

void PictureDownloader::HeaderFound(std::string_view statusLine, std::int32_t bytes) {
  if (events_) events_->HeaderFound(TextFromLatin1(statusLine), bytes);
}

void PictureDownloader::Finished() {
  if (events_) events_->Finished();
}

void PictureDownloader::Failed(bool told) {
  if (events_) events_->Failed(ftpError_, ftpError_ == kTimeout ? u"Timed out" : u"Connection failed", told);
}

}  // namespace tarnwick
