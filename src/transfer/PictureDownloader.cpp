#include "transfer/PictureDownloader.h"

#include <algorithm>
#include <initializer_list>
#include <memory>
#include <string>
#include <utility>

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"
#include "platform/Platform.h"
#include "support/HttpAddress.h"
#include "support/PathHelpers.h"
#include "transfer/ExchangeFailures.h"
#include "transfer/FtpErrors.h"

namespace tarnwick {
namespace {

// Bytes of a file that are compared or copied at a time.
constexpr std::size_t kBlock = std::size_t{256} << 10;

// Winsock's numbers.
constexpr std::int32_t kWinsockReset = 10054;
constexpr std::int32_t kWinsockRefused = 10061;
constexpr std::int32_t kWinsockHostNotFound = 11001;

// An FtpErrors value and its text.
struct Reason {
  std::int32_t ftpError;
  TextView text;
};

Reason ReasonOf(DownloadFailure failure, std::int32_t error) {
  using namespace ftp_error;
  switch (failure) {
    case DownloadFailure::kAddress:
      return {kAborted, u"The file's address is not safe."};
    case DownloadFailure::kClearText:
      return {kAborted, u"The file's address is not a secure one, as this session needs it."};
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
  if (const TextView text = SecureFailureText(error); !text.empty()) return {kConnectAborted, text};
  switch (error) {
    case kWinsockReset:
      return {kConnectionReset, u"The server reset the connection."};
    case kWinsockRefused:
    case http_error::kCannotConnect:
      return {kConnectionRefused, u"The server refused the connection."};
    case kWinsockHostNotFound:
    case http_error::kNameNotResolved:
      return {kHostNotFound, u"The server's name was not found."};
    case http_error::kTimeout:
      return {kTimeout, u"The server was silent for too long."};
    case http_error::kConnectionLost:
      return {kConnectAborted, u"The server closed the connection in the middle of its answer."};
    default:
      return {kConnectAborted, u"The connection failed."};
  }
}

// Whether the file has exactly these bytes.
bool Holds(FileSystem& files, TextView path, std::string_view bytes) {
  return ResultAsItStood(false, [&](bool& same) {
    if (files.Length(path) != bytes.size()) return;
    const std::unique_ptr<FileReader> reader = files.Open(path);
    std::string block(std::min(bytes.size(), kBlock), '\0');
    for (; !bytes.empty(); bytes.remove_prefix(block.size())) {
      block.resize(std::min(bytes.size(), kBlock));
      if (reader->Read(block) != block.size() || bytes.substr(0, block.size()) != block) return;
    }
    same = true;
  });
}

// Not with the system's copy, which writes by name: what that leaves when the process is killed stays.
void Copy(FileSystem& files, TextView from, TextView to) {
  const std::unique_ptr<FileReader> reader = files.Open(from);
  const std::unique_ptr<FileWriter> writer = files.Create(to);
  std::string block(kBlock, '\0');
  while (const std::size_t count = reader->Read(block)) writer->Write({block.data(), count});
  writer->Commit();
}

}  // namespace

PictureDownloader::PictureDownloader(Apartment& apartment, StreamSocket& socket, SecureFetch& secureFetch,
                                     Timer& watchdog)
    : apartment_(apartment),
      socket_(socket),
      secureFetch_(secureFetch),
      watchdog_(watchdog),
      machine_(*this) {
  socket_.SetEvents(this);
  secureFetch_.SetEvents(this);
  watchdog_.SetHandler([this] {
    if (machine_.IsRunning()) return machine_.OnWatchdog();
    // Of an upload: it fails the transfer all the same.
    watchdog_.Stop();
    Failed(DownloadFailure::kSilence, false);
  });
}

PictureDownloader::~PictureDownloader() {
  watchdog_.Stop();
  for (ByteStream* const stream : std::initializer_list<ByteStream*>{&socket_, &secureFetch_}) {
    stream->SetEvents(nullptr);
    stream->Close();
  }
}

DownloadRoute PictureDownloader::Route() const {
  return {apartment_.UserFolderPath, apartment_.proxy.ProxyHost, apartment_.proxy.ProxyPort,
          apartment_.session.IsSecure()};
}

bool PictureDownloader::CanStart(TextView url) const {
  DownloadPlan plan;
  return !url.empty() && !MakeDownloadPlan(url, Route(), plan);
}

void PictureDownloader::Start(TextView url, TextView explicitTarget) {
  error_ = 0;
  changes_ = apartment_.ChangesOfCopy(apartment_.UserFolderPath + u"\\" + Text(FileNameFromUrl(url)));
  machine_.StartDownload(url, explicitTarget, Route());
}

void PictureDownloader::Prepare(TextView target) {
  DropFile();
  ResultAsItStood(0, [&](int&) {
    writerTarget_ = target;
    writer_ = apartment_.platform.files.Create(target);
  });
}

void PictureDownloader::Cancel() {
  machine_.Cancel();
  DropFile();
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

void PictureDownloader::Connect(const DownloadPlan& plan) {
  ByteStream& stream = plan.secure ? static_cast<ByteStream&>(secureFetch_) : socket_;
  // One that fell silent in a session of the other kind is open still, and its end would pass for this one's.
  if (stream_ != &stream) stream_->Close();
  stream_ = &stream;
  // It tells nothing yet, so the event still comes first; and what the host does there finds a download to
  // end.
  if (plan.secure) {
    secureFetch_.Begin(
        {plan.host, plan.port, EscapeUnprintable(plan.requestTarget), std::string(kDownloadHeaders)});
  } else {
    socket_.Connect(plan.host, plan.port);
  }
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
  const std::span<char> room = machine_.Room();
  if (!room.empty()) machine_.OnArrived(stream_->Read(room));
}

void PictureDownloader::OnClosedByPeer() {
  if (!GivesUp()) machine_.OnClosedByPeer();
}

void PictureDownloader::OnSocketError(std::int32_t number) {
  error_ = number;
  machine_.OnSocketError();
}

void PictureDownloader::BeginFile(TextView path, TextView explicitPath) {
  path_ = path;
  explicitPath_ = explicitPath;
  large_ = false;
  if (!writer_ || writerTarget_ != Target()) Prepare(Target());
}

void PictureDownloader::WriteFile(std::string_view bytes) {
  large_ = true;
  const bool written = ResultAsItStood(false, [&](bool& done) {
    if (writer_) writer_->Write(bytes);
    done = true;
  });
  if (!written) writer_.reset();
}

bool PictureDownloader::FinishFile(std::string_view rest) {
  std::unique_ptr<FileWriter> writer = std::move(writer_);
  return ResultAsItStood(false, [&](bool& written) {
    if (!writer) return;
    FileSystem& files = apartment_.platform.files;
    // An upload, a rename or a delete has come before these bytes, which are not the file's any more. The
    // target may be the copy itself.
    const bool overtaken = apartment_.ChangesOfCopy(path_) != changes_;
    if (overtaken && (explicitPath_.empty() || LowerCase(explicitPath_) == LowerCase(path_) ||
                      files.SameFile(explicitPath_, path_)))
      return;
    writer->Write(rest);
    writer->Commit();
    // It holds the file.
    writer.reset();
    written = true;
    if (overtaken || explicitPath_.empty() || explicitPath_ == path_) return;
    if (large_) return Copy(files, explicitPath_, path_);
    // Not copied from the other one: the bytes are here. Most often the picture has been shown before, and
    // the user's folder has it. In a large folder it takes long to find that a name is not there, so nothing
    // looks before the file is made; an empty one that a kill leaves there is found by its length.
    if (!files.WriteNew(path_, rest) && !Holds(files, path_, rest)) files.Write(path_, rest);
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
  const Reason reason = ReasonOf(failure, error_);
  if (events_) events_->Failed(reason.ftpError, reason.text, told);
}

}  // namespace tarnwick
