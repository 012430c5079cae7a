#include "controls/FileControl.h"

#include <utility>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"
#include "platform/HttpTransport.h"
#include "support/HttpAddress.h"
#include "support/PathHelpers.h"
#include "transfer/AcceptorPages.h"
#include "transfer/ExchangeFailures.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {
namespace {

// An error of the upload component after which the file is on the server all the same, like
// acceptor::kNothingChanged.
constexpr std::int32_t kInvalidProperty = 380;

constexpr TextView kRefusedCharacters = u"\\/:*?\"<>|#%";

}  // namespace

FileControl::Operation::Operation(FileControl& control)
    : control_(control), outer_(std::exchange(control.operation_, this)) {
  Succeed();
}

FileControl::Operation::~Operation() {
  control_.operation_ = outer_;
  // What nobody foresaw, such as a lack of memory.
  if (ftpError_ == ftp_error::kSuccess && std::uncaught_exceptions() > exceptions_) {
    ftpError_ = ftp_error::kAborted;
    ResultAsItStood(0, [this](int&) { description_ = u"The operation failed unexpectedly."; });
  }
  control_.m_LastError = ftpError_;
  control_.m_strLastErrorDesc = std::move(description_);
}

void FileControl::Operation::Fail(std::int32_t ftpError, TextView description) {
  ftpError_ = ftpError;
  description_ = description;
  // A host may look in the next event.
  control_.m_LastError = ftpError;
  control_.m_strLastErrorDesc = description;
}

FileControl::RunningTransfer::RunningTransfer(FileControl& control)
    : control_(control),
      nested_(std::exchange(control.transferRuns_, true)),
      transfer_(std::exchange(control.transfer_, control.operation_)),
      closings_(std::exchange(control.closingsBefore_, control.closings_)),
      aborts_(std::exchange(control.abortsBefore_, control.apartment_.aborts)) {
  control_.m_bTransferInProgress = true;
}

FileControl::RunningTransfer::~RunningTransfer() {
  control_.transferRuns_ = control_.m_bTransferInProgress = nested_;
  control_.transfer_ = transfer_;
  control_.closingsBefore_ = closings_;
  control_.abortsBefore_ = aborts_;
}

FileControl::Hourglass::Hourglass(FileControl& control) : control_(control) {
  if (++control_.hourglasses_ == 1) control_.controlView_.SetHourglass(true);
}

FileControl::Hourglass::~Hourglass() {
  if (--control_.hourglasses_ == 0) control_.controlView_.SetHourglass(false);
}

FileControl::FileControl(const ControlParts& parts, ControlView& view, TransferEvents transferEvents)
    : mobjFileupload(std::make_shared<CFileUpload>(parts.apartment)),
      apartment_(parts.apartment),
      listing_(parts.apartment.listing),
      events_(parts.events),
      copies_(parts.apartment),
      controlView_(view),
      uploader_(parts.uploader),
      downloader_(parts.downloader),
      tellsTransfers_(transferEvents == TransferEvents::kTold) {
  downloader_.SetEvents(this);
}

FileControl::~FileControl() {
  Close();
}

void FileControl::Close() {
  closed_ = true;
  EndTransfer();
  downloader_.SetEvents(nullptr);
  downloader_.Cancel();
}

void FileControl::Open() {
  closed_ = false;
  downloader_.SetEvents(this);
}

void FileControl::Fail(std::int32_t ftpError, TextView description) {
  if (operation_) operation_->Fail(ftpError, description);
}

bool FileControl::CheckTransferAllowed() {
  if (transferRuns_) {
    Fail(ftp_error::kTransferInProgress, u"A transfer is in progress.");
  } else if (closed_) {
    Fail(ftp_error::kAborted, u"The control was closed.");
  }
  return !transferRuns_ && !closed_;
}

std::shared_ptr<CFileUpload> FileControl::Client() {
  if (!mobjFileupload) Fail(ftp_error::kNoClient, u"The control has no service client.");
  return mobjFileupload;
}

bool FileControl::CheckShownChangeable() {
  if (ShowsOtherAccount()) Fail(ftp_error::kNotLoggedOn, u"The files are those of another user.");
  return !ShowsOtherAccount();
}

void FileControl::FailExchange(std::int32_t ftpError, TextView description) {
  const SessionValues& session = apartment_.session;
  // A server whose name is none was not asked, so that the last failure is another one's.
  const bool isAsked = session.IsSecure() && !ServerUrl(session.serverName).empty();
  const TextView unsafe = isAsked ? SecureFailureText(apartment_.platform.http.LastFailure()) : TextView();
  if (!unsafe.empty()) return Fail(ftp_error::kConnectAborted, unsafe);
  Fail(ftpError, description);
}

void FileControl::FailStopped() {
  if (IsAborted()) {
    Fail(ftp_error::kAborted, u"The transfer was stopped.");
  } else {
    Fail(ftp_error::kAborted, u"The control was closed.");
  }
}

// --- Listing ---

bool FileControl::ListAccount() {
  const std::shared_ptr<CFileUpload> client = Client();
  if (!client) return false;
  if (client->ListFilesForUser([&](const std::shared_ptr<CUpload>& record) { listing_.all.Add(record); }))
    return true;
  // Half a listing would pass for the account.
  listing_.Forget();
  FailExchange(ftp_error::kNotTaken, u"The service did not list the files.");
  return false;
}

// --- Selection ---

Text FileControl::SelectedFileName() const {
  const auto record = SelectedRecord();
  return record ? record->FileName : Text();
}

Text FileControl::SelectedAddress() const {
  const auto record = SelectedRecord();
  return record ? record->FilePath : Text();
}

std::optional<Text> FileControl::GetSelectedFilesHttpPath() const {
  const auto record = SelectedRecord();
  return record ? std::optional(record->FilePath) : std::nullopt;
}

void FileControl::GetFileDetails(TextView FileName,
                                 const std::function<void(const std::shared_ptr<CUpload>&)>& colFiles) {
  ResultAsItStood(0, [&](int&) {
    const std::size_t position = listing_.all.PositionWhere([&](const CUpload& record) {
      const Text address = record.FilePath;
      return address == FileName || FileNameFromUrl(address) == FileName;
    });
    if (position == 0) return;
    auto details = std::make_shared<CUpload>(*listing_.all.At(position));
    details->FilePath.clear();
    colFiles(details);
  });
}

// --- Upload ---

bool FileControl::UploadImage(TextView szLocalPath) {
  return ResultAsItStood(false, [&](bool& uploaded) {
    Operation operation(*this);
    if (!CheckTransferAllowed()) return;
    const Text path(szLocalPath);
    const Hourglass pointer(*this);
    const std::shared_ptr<CFileUpload> client = Client();
    if (!client) return;
    const std::int32_t answer = client->CanUploadFile();
    if (answer == status::kNegative) {
      Fail(ftp_error::kFull, u"The account is full.");
      return Raise(event::kUploadRefused);
    }
    if (answer == status::kFailure) {
      FailExchange(ftp_error::kNotAllowed, u"The account takes no files, or the service could not be asked.");
      return Raise(event::kNotAllowed);
    }
    const AccountKey account = apartment_.session.Account();
    const Text url = SendAndRegister(*client, path, account);
    FileRecord record;
    if (!url.empty()) {
      // Whatever the watchdog told meanwhile.
      operation.Succeed();
      record = RecordUploaded(path, url);
    }
    TransferEnded();
    if (!record) return;
    // Not among the files of another user who was logged on meanwhile.
    if (apartment_.session.Account() == account) ShowUploaded(record);
    uploaded = true;
    RaiseCurrentItem();
  });
}

Text FileControl::SendAndRegister(CFileUpload& client, const Text& path, const AccountKey& account) {
  const RunningTransfer running(*this);
  uploadTimedOut_ = false;
  Text url;
  // What is on the server is registered, whatever the host made of the control meanwhile, but not with
  // another user.
  if (SendFile(client, path)) {
    if (apartment_.session.Account() == account) url = client.SaveUploadFile(path);
    if (url.empty()) {
      copies_.LoseUpload(path);
      FailExchange(ftp_error::kNotTaken, u"The file was sent, but not registered.");
    }
  }
  downloader_.StopWatchdog();
  // Or the next download would not begin.
  if (uploadTimedOut_) gbConnectionFailed = false;
  return url;
}

bool FileControl::SendFile(CFileUpload& client, const Text& path) {
  const SessionValues& session = apartment_.session;
  uploadFinished_ = false;
  m_lUploadedBytes = 0;
  downloader_.RestartWatchdog();
  copies_.BeginUpload(path);
  try {
    uploader_.UploadFile(path, UsersBaseUrl(session.serverName), AcceptorPath(u"UploadAcceptor.asp"), 0,
                         Text(session.userName), Secret(session.password), kProductGuid, *this);
  } catch (const RuntimeError& failure) {
    const std::int32_t number = failure.Number();
    if (number != acceptor::kNothingChanged && number != kInvalidProperty) {
      FailUpload(client, path, number);
      return false;
    }
  }
  Yield();
  if (uploadFinished_) return true;
  copies_.LoseUpload(path);
  if (!uploadTimedOut_) Fail(ftp_error::kNotTaken, u"The server did not say that it has the file.");
  return false;
}

void FileControl::FailUpload(CFileUpload& client, const Text& path, std::int32_t number) {
  // Whether the file is there is not known when the answer was lost.
  if (number == acceptor::kUnspecified) {
    copies_.LoseUpload(path);
  } else {
    copies_.AbandonUpload();
  }
  if (number == error::kInterrupted) return FailStopped();
  // The watchdog has told why.
  if (uploadTimedOut_) return;
  // An upload takes the place of a file of that very name.
  const TextView name = FileNameFromPath(path);
  const bool taken = IsNameTaken(name, name);
  if (number == error::kFileNotFound) {
    const bool folder = FolderExists(apartment_.platform.files, path);
    Fail(NumberedFailure(ftp_error::kUnavailable,
                         folder ? u"This is a folder, not a file." : u"The file was not found.", number));
  } else if (number == error::kPathAccess) {
    Fail(NumberedFailure(ftp_error::kUnavailable, u"The file could not be read.", number));
  } else if (number == acceptor::kNameRefused && IsNameAllowed(name) && !taken && IsTooLarge(client, path)) {
    Fail(NumberedFailure(ftp_error::kFull, u"The account is full.", number));
  } else {
    FailPage(number, taken);
  }
}

void FileControl::FailPage(std::int32_t number, bool nameTaken) {
  const Failure failure = PageFailure(number, nameTaken);
  if (number != acceptor::kUnspecified) return Fail(failure);
  FailExchange(failure.ftpError, failure.description);
}

bool FileControl::IsNameAllowed(TextView name) {
  return name.find_first_of(kRefusedCharacters) == TextView::npos;
}

bool FileControl::IsNameTaken(TextView name, TextView own) const {
  const FileRecord same = RecordNamed(name);
  return IsNameAllowed(name) && same && same->FileName != own;
}

bool FileControl::IsTooLarge(CFileUpload& client, const Text& path) const {
  return ResultAsItStood(false, [&](bool& large) {
    const FileRecord same = RecordNamed(FileNameFromPath(path));
    const double replaced = same ? same->FileSize : 0;
    const SessionValues& session = apartment_.session;
    const Text product = TextFromNumber(session.productNumber);
    const auto used = client.GetTotalUsedQuota(product, session.userName);
    const double size = static_cast<double>(apartment_.platform.files.Length(path));
    const double most = client.GetMaxQuota(product, session.userName);
    // Nobody knows when the service does not tell.
    large = used && most > 0 && *used + size - replaced > most;
  });
}

// An upload that was stopped tells nothing more, also in the middle of what belongs together.
void FileControl::Connecting() {
  Yield();
  if (IsWanted()) TellState(ConnectionState::kResolvingHost);
}

void FileControl::UploadStarted() {
  Yield();
  if (IsWanted()) TellState(ConnectionState::kConnected);
  if (IsWanted()) TellState(ConnectionState::kTransferStarting);
  RaiseUploadProgress(0);
  uploadFinished_ = false;
  downloader_.RestartWatchdog();
}

void FileControl::UploadProgress(std::int32_t percent, std::int32_t bytes) {
  Yield();
  m_lUploadedBytes = bytes;
  RaiseUploadProgress(percent);
  uploadFinished_ = false;
  Yield();
  downloader_.RestartWatchdog();
}

void FileControl::RaiseUploadProgress(std::int32_t percent) {
  if (IsWanted()) Raise(event::kProgress, TextFromNumber(percent));
  if (IsWanted() && tellsTransfers_) events_.UploadProgress(m_lUploadedBytes);
}

void FileControl::FileBytes(std::string_view bytes) {
  // However slowly, the upload goes on.
  downloader_.RestartWatchdog();
  copies_.Write(bytes);
}

void FileControl::UploadComplete() {
  Yield();
  // The server has the file: it is too late to stop.
  Raise(event::kProgress, u"100");
  if (tellsTransfers_) events_.UploadProgress(m_lUploadedBytes);
  uploadFinished_ = true;
  downloader_.StopWatchdog();
  TellState(ConnectionState::kTransferCompleted);
}

void FileControl::TellState(ConnectionState state) {
  if (tellsTransfers_) events_.StateChanged(state);
}

FileRecord FileControl::RecordUploaded(const Text& path, const Text& url) {
  FileSystem& files = apartment_.platform.files;
  auto record = std::make_shared<CUpload>();
  record->FileName = FileNameFromPath(path);
  record->FilePath = url;
  record->FileSize = GetLocalFileSize(files, path);
  record->FileDate = GetLocalFileDate(files, path);
  copies_.FinishUpload(path, url);
  // An upload that replaced a file takes over its record.
  FileRecord known = RecordNamed(Text(record->FileName));
  if (const std::size_t position = listing_.all.PositionOf(url); !known && position != 0)
    known = listing_.all.At(position);
  if (known) {
    listing_.Change(known, [&](CUpload& values) { values = *record; });
    return known;
  }
  listing_.all.Add(record);
  return record;
}

// --- Delete ---

bool FileControl::DeleteOnServer(CFileUpload& client, const CUpload& file) {
  const SessionValues& session = apartment_.session;
  const Text name = file.FileName;
  const Text url = file.FilePath;
  // What the page says does not matter; the service decides.
  ResultAsItStood(0, [&](int&) {
    uploader_.DeleteFile(UsersBaseUrl(session.serverName), name, AcceptorPath(u"DeleteAcceptor.asp"),
                         session.userName, session.password, kProductGuid);
  });
  if (client.DeleteFileForUser(name) != status::kSuccess) {
    FailExchange(ftp_error::kNotTaken, u"The file was not deleted.");
    return false;
  }
  copies_.Remove(url);
  return true;
}

// --- Rename ---

bool FileControl::RenameFile(TextView strOldFileName, TextView strNewFileName) {
  return ResultAsItStood(false, [&](bool& renamed) {
    const Operation operation(*this);
    const Text oldName(strOldFileName);
    const Text newName(Trim(strNewFileName));
    const Hourglass pointer(*this);
    const bool nested = std::exchange(renameInProgress_, true);
    ResultAsItStood(0, [&](int&) {
      renamed = Rename(oldName, newName);
      if (renamed) {
        Raise(event::kRenamed, newName);
      } else {
        Raise(event::kRenameFailed);
      }
    });
    renameInProgress_ = nested;
  });
}

bool FileControl::Rename(const Text& oldName, const Text& newName) {
  // Whatever is thrown, such as for a lack of memory: the rename has an end that is told.
  if (!ResultAsItStood(false, [&](bool& renamed) { renamed = RenameOnServer(oldName, newName); })) {
    if (operation_ && operation_->Succeeds())
      Fail(ftp_error::kAborted, u"The operation failed unexpectedly.");
    return false;
  }
  listing_.isCurrent = false;
  ResultAsItStood(0, [&](int&) {
    const auto [record, oldUrl] = RecordRenamed(oldName, newName);
    ShowRenamed(record, oldUrl, oldName, newName);
  });
  return true;
}

bool FileControl::RenameOnServer(const Text& oldName, const Text& newName) {
  // Bytes that are renamed without the service's knowledge would be lost to the user.
  const std::shared_ptr<CFileUpload> client = Client();
  if (!client) return false;
  const SessionValues& session = apartment_.session;
  try {
    uploader_.RenameFile(UsersBaseUrl(session.serverName), oldName, newName,
                         AcceptorPath(u"RenameAcceptor.asp"), session.userName, session.password,
                         kProductGuid);
  } catch (const RuntimeError& failure) {
    FailPage(failure.Number(), IsNameTaken(newName, oldName));
    return false;
  }
  if (client->RenameFile(TextFromNumber(session.productNumber), session.userName, oldName, newName) ==
      status::kSuccess)
    return true;
  FailExchange(ftp_error::kNotTaken, u"The service did not rename the file.");
  return false;
}

std::pair<FileRecord, Text> FileControl::RecordRenamed(const Text& oldName, const Text& newName) {
  const std::size_t position =
      listing_.all.PositionWhere([&](const CUpload& file) { return file.FileName == oldName; });
  if (position == 0) return {};
  const FileRecord record = listing_.all.At(position);
  const Text oldUrl = record->FilePath;
  listing_.GiveName(record, newName);
  copies_.Move(oldUrl, record->FilePath);
  return {record, oldUrl};
}

bool FileControl::IsFileNameValid(TextView szFileName) {
  return ResultAsItStood(false, [&](bool& valid) {
    valid = IsNameAllowed(szFileName);
    if (!valid) Raise(event::kNameRefused);
  });
}

bool FileControl::CheckEditedName(TextView name) {
  Operation operation(*this);
  if (!IsNameAllowed(name)) operation.Fail(ftp_error::kNameNotAllowed, u"The file's name is not allowed.");
  return IsFileNameValid(name);
}

bool FileControl::CheckFileExtension(Text& szNewString, TextView szOriExt) {
  return ResultAsItStood(false, [&](bool& agrees) {
    if (ExtensionOf(szNewString) != szOriExt) szNewString = WithExtension(szNewString, szOriExt);
    agrees = true;
  });
}

bool FileControl::CheckIfFileDoesNotExist(TextView szFileName) const {
  return !ShowsFile(szFileName) && !RecordNamed(szFileName);
}

FileRecord FileControl::RecordNamed(TextView name) const {
  const std::size_t position = listing_.all.PositionWhere(
      [&](const CUpload& file) { return EqualsIgnoringCase(Trim(Text(file.FileName)), Trim(name)); });
  return position == 0 ? nullptr : listing_.all.At(position);
}

bool FileControl::EnableRename(bool bEnableRename) {
  bRenameEnabled = bEnableRename;
  return bEnableRename;
}

// --- Download ---

Text FileControl::DownLoadFileFromServer(TextView szLocalFilePath) {
  return ResultAsItStood(Text(), [&](Text& local) {
    const Operation operation(*this);
    if (!CheckTransferAllowed() || !Client() || !CFileUpload::CanDownLoadFile()) return;
    const FileRecord selected = SelectedRecord();
    if (!selected) return Fail(ftp_error::kUnavailable, u"No file is selected.");
    const Text name = selected->FileName;
    Text target(szLocalFilePath);
    if (target.ends_with(u'\\')) target.pop_back();
    // For a file whose name is a number the path is the file itself, not its folder; hosts rely on it.
    const bool inFolder = !IsNumeric(name);
    const Text folder = inFolder ? target : target.substr(0, target.size() - FileNameFromPath(target).size());
    if (inFolder) target += u"\\" + name;
    local = target;

    const Text url = listing_.AddressLike(selected->FilePath);
    if (url.empty()) return Fail(ftp_error::kUnavailable, u"The file is not in the listing any more.");
    // The name comes from the server; it must not lead out of the folder.
    if (inFolder && !IsSafeFileName(name)) {
      Fail(ftp_error::kAborted, u"The file's name is not safe.");
      return Raise(event::kDownloadFailed);
    }
    if (std::exchange(gbConnectionFailed, false))
      return Fail(ftp_error::kAborted, u"gbConnectionFailed was set.");
    const bool starts = downloader_.CanStart(url);
    if (starts) downloader_.Prepare(target);
    // What is there would pass for the download: somebody has it open, or it is not to be changed.
    const bool free = !starts || ResultAsItStood(false, [&](bool& done) {
      FileSystem& files = apartment_.platform.files;
      if (FileExists(files, target)) files.Remove(target);
      done = true;
    });
    if (!free) {
      downloader_.Cancel();
      Fail(ftp_error::kAborted, u"The local file could not be replaced.");
      return Raise(event::kDownloadFailed);
    }
    if (Download(url, target, target, [] { return false; })) Yield();
    if (downloadFinished_ && !downloadWritten_ && !folder.empty() &&
        !FolderExists(apartment_.platform.files, folder))
      Fail(ftp_error::kAborted, u"The local folder was not found.");
    TransferEnded();
  });
}

bool FileControl::Download(const Text& url, const Text& explicitTarget, const Text& expected,
                           const std::function<bool()>& stop) {
  const RunningTransfer running(*this);
  const std::uint32_t changes = apartment_.ChangesOfCopy(expected);
  m_lDownloadedBytes = 0;
  downloadFinished_ = downloadWritten_ = downloadFailed_ = false;
  downloadRuns_ = true;
  // Whatever is thrown, such as for a lack of memory: what began here ends here.
  const bool waited = ResultAsItStood(false, [&](bool& done) {
    downloader_.Start(url, explicitTarget);
    while (!gbConnectionFailed && !downloadFinished_ && !IsStopped() && !stop()) downloader_.Wait();
    done = true;
  });
  downloadRuns_ = false;
  const bool told = std::exchange(gbConnectionFailed, false);
  // The host may have set the flag; then the transfer would go on behind the back of the next one.
  if (!downloadFinished_) downloader_.Cancel();
  // Or it would run out later, on whatever comes next.
  downloader_.StopWatchdog();
  // Whether it was written is seen once more here: nothing else will come.
  const bool there = FileExists(apartment_.platform.files, expected);
  if (downloadFinished_ && downloadWritten_ && there) return true;
  // A copy that was changed meanwhile was not written over.
  if (downloadFinished_ && explicitTarget.empty() && apartment_.ChangesOfCopy(expected) != changes)
    return there;
  // Of a failure the reason was told.
  if (downloadFailed_) return false;
  if (!waited) Fail(ftp_error::kAborted, u"The operation failed unexpectedly.");
  if (downloadFinished_) {
    Fail(ftp_error::kAborted, u"The local file could not be written.");
  } else if (IsStopped()) {
    FailStopped();
  } else if (told) {
    Fail(ftp_error::kAborted, u"gbConnectionFailed was set.");
  }
  return false;
}

void FileControl::HeaderFound(TextView statusLine, std::int32_t bytes) {
  m_lDownloadedBytes = bytes;
  if (tellsTransfers_) events_.ReplyMessage(statusLine);
}

void FileControl::Received(std::int32_t bytes) {
  m_lDownloadedBytes = bytes;
  Raise(event::kProgress, TextFromNumber(bytes));
  if (tellsTransfers_) events_.DownloadProgress(bytes);
}

void FileControl::Finished(bool written) {
  downloadFinished_ = true;
  downloadWritten_ = written;
  TellState(ConnectionState::kTransferCompleted);
}

void FileControl::Failed(std::int32_t ftpError, TextView description, bool told) {
  gbConnectionFailed = true;
  if (downloadRuns_) {
    downloadFailed_ = true;
  } else if (transferRuns_) {
    uploadTimedOut_ = true;
  }
  // Another operation may run inside.
  if (transfer_) transfer_->Fail(ftpError, description);
  if (told) Raise(event::kDownloadFailed);
}

// --- Drag and drop ---

FileControl::DragContent FileControl::ContentOfDrag() const {
  return ResultAsItStood(DragContent(), [&](DragContent& content) {
    const FileRecord selected = SelectedRecord();
    if (!selected) return;
    content.address = selected->FilePath;
    if (copies_.Has(*selected)) content.localFile = copies_.PathOf(content.address);
  });
}

void FileControl::OnStartDrag(DragData& data, std::int32_t& allowedEffects) {
  apartment_.dragIsOurs = true;
  events_.OLEStartDrag(data, allowedEffects);
}

void FileControl::OnDrop(DragData& data, const std::vector<Text>& files, std::int32_t& effect,
                         const DragPoint& at) {
  // What the host does in the event may end the drag.
  const bool own = apartment_.dragIsOurs;
  events_.OLEDragDrop(data, effect, at);
  if (own || files.empty()) return DroppedNoFiles(own);
  // The host may clear the data in an event of the walk.
  const std::vector<Text> walked(files.begin(), files.end());
  for (const Text& path : walked) {
    if (TakeStopOfDrop()) break;
    Raise(event::kFileDrop, path);
  }
  Raise(event::kFileDrop);
}

void FileControl::OnCompleteDrag(std::int32_t effect) {
  if (std::exchange(apartment_.dragIsOurs, false)) events_.OLECompleteDrag(effect);
}

}  // namespace tarnwick
