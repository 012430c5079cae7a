#include "controls/FileControl.h"

#include <utility>

#include "controls/FileNames.h"
#include "support/PathHelpers.h"
#include "support/RuntimeError.h"
#include "transfer/AcceptorPages.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {
namespace {

// An error of the upload component after which the file is on the server all the same, like
// acceptor::kNothingChanged.
constexpr std::int32_t kInvalidProperty = 380;

constexpr TextView kRefusedCharacters = u"\\/:*?\"<>|#%";

}  // namespace

FileControl::RunningTransfer::RunningTransfer(FileControl& control)
    : control_(control), nested_(control.transferRuns_) {
  control_.transferRuns_ = control_.m_bTransferInProgress = true;
  control_.Fail(ftp_error::kSuccess, u"");
}

FileControl::RunningTransfer::~RunningTransfer() {
  control_.transferRuns_ = control_.m_bTransferInProgress = nested_;
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
      events_(parts.events),
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
  // A wait must end even when the control is opened again before it looks. It clears the flag.
  if (downloadRuns_) gbConnectionFailed = true;
  downloader_.SetEvents(nullptr);
  downloader_.Cancel();
}

void FileControl::Open() {
  closed_ = false;
  downloader_.SetEvents(this);
}

void FileControl::Fail(std::int32_t ftpError, TextView description) {
  m_LastError = ftpError;
  m_strLastErrorDesc = description;
}

bool FileControl::RefusesTransfer() {
  if (transferRuns_) Fail(ftp_error::kTransferInProgress, u"A transfer is in progress.");
  return transferRuns_ || closed_;
}

// --- Listing ---

bool FileControl::ListAccount() {
  FileList& all = apartment_.allFiles;
  const std::shared_ptr<CFileUpload> client = mobjFileupload;
  const bool listed = client && client->ListFilesForUser([&](const std::shared_ptr<CUpload>& record,
                                                             TextView key) { all.Add(record, key); });
  // Half a listing would pass for the account.
  if (!listed) all.Clear();
  return listed;
}

// --- Selection ---

Text FileControl::SelectedFileName() const {
  const auto record = SelectedRecord();
  return record ? record->FileName : Text();
}

Text FileControl::SelectedKey() const {
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
    for (std::size_t i = 1; i <= apartment_.allFiles.Count(); ++i) {
      const CUpload& record = *apartment_.allFiles.At(i);
      if (record.FilePath != FileName && FileNameFromUrl(record.FilePath) != FileName) continue;
      auto details = std::make_shared<CUpload>(record);
      details->FilePath.clear();
      colFiles(details);
      return;
    }
  });
}

// --- Upload ---

bool FileControl::UploadImage(TextView szLocalPath) {
  return ResultAsItStood(false, [&](bool& uploaded) {
    if (RefusesTransfer()) return;
    const Text path(szLocalPath);
    const Hourglass pointer(*this);
    const std::shared_ptr<CFileUpload> client = mobjFileupload;
    if (!client) return;
    const std::int32_t answer = client->CanUploadFile();
    if (answer == status::kNegative) return Raise(event::kUploadRefused);
    if (answer == status::kFailure) return Raise(event::kNotAllowed);
    Text url;
    {
      const RunningTransfer running(*this);
      const AccountKey account = apartment_.session.Account();
      // What is on the server is registered, whatever the host made of the control meanwhile, but not with
      // another user.
      if (SendFile(path)) {
        if (apartment_.session.Account() == account) url = client->SaveUploadFile(path);
        if (url.empty()) Fail(ftp_error::kNotTaken, u"The file was not registered.");
      }
      downloader_.StopWatchdog();
    }
    TransferEnded();
    if (url.empty()) return copyWriter_.reset();
    ShowUploaded(RecordUploaded(path, url));
    uploaded = true;
    RaiseCurrentItem();
  });
}

bool FileControl::SendFile(const Text& path) {
  const SessionValues& session = apartment_.session;
  uploadFinished_ = false;
  m_lUploadedBytes = 0;
  downloader_.RestartWatchdog();
  BeginLocalCopy(path);
  try {
    uploader_.UploadFile(path, UsersBaseUrl(session.serverName), AcceptorPath(u"UploadAcceptor.asp"), 0,
                         Text(session.userName), Text(session.password), kProductGuid, *this);
  } catch (const RuntimeError& failure) {
    const std::int32_t number = failure.Number();
    if (number != acceptor::kNothingChanged && number != kInvalidProperty) {
      FailUpload(number == acceptor::kUnspecified ? ftp_error::kConnectionLost : ftp_error::kNotTaken,
                 u"The file was not uploaded (" + TextFromNumber(number) + u").");
      return false;
    }
  }
  Yield();
  if (!uploadFinished_) FailUpload(ftp_error::kNotTaken, u"The file was not uploaded.");
  return uploadFinished_;
}

void FileControl::FailUpload(std::int32_t ftpError, TextView description) {
  // The watchdog has told why.
  if (m_LastError != ftp_error::kTimeout) Fail(ftpError, description);
}

void FileControl::Connecting() {
  Yield();
  TellState(ConnectionState::kResolvingHost);
}

void FileControl::UploadStarted() {
  Yield();
  TellState(ConnectionState::kConnected);
  TellState(ConnectionState::kTransferStarting);
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

void FileControl::UploadComplete() {
  Yield();
  RaiseUploadProgress(100);
  uploadFinished_ = true;
  downloader_.StopWatchdog();
  TellState(ConnectionState::kTransferCompleted);
}

void FileControl::RaiseUploadProgress(std::int32_t percent) {
  Raise(event::kProgress, TextFromNumber(percent));
  if (tellsTransfers_) events_.UploadProgress(m_lUploadedBytes);
}

void FileControl::TellState(ConnectionState state) {
  if (tellsTransfers_) events_.StateChanged(state);
}

std::shared_ptr<CUpload> FileControl::RecordUploaded(const Text& path, const Text& url) {
  FileSystem& files = apartment_.platform.files;
  FileList& all = apartment_.allFiles;
  auto record = std::make_shared<CUpload>();
  record->FileName = FileNameFromPath(path);
  record->FilePath = url;
  record->FileSize = GetLocalFileSize(files, path);
  record->FileDate = GetLocalFileDate(files, path);
  FinishLocalCopy(path, url);
  // An upload that replaced a file takes over its record.
  std::size_t position = PositionOf(record->FileName);
  if (position == 0) position = all.PositionOf(url);
  if (position == 0) {
    all.Add(record, url);
    return record;
  }
  std::shared_ptr<CUpload> known = all.At(position);
  *known = *record;
  SetAddress(all, position, url);
  return known;
}

// --- Delete ---

bool FileControl::DeleteOnServer(CFileUpload& client, const CUpload& file) {
  const SessionValues& session = apartment_.session;
  const Text name = file.FileName;
  const Text copy = LocalCopyOf(file.FilePath);
  // What the page says does not matter; the service decides.
  ResultAsItStood(0, [&](int&) {
    uploader_.DeleteFile(UsersBaseUrl(session.serverName), name, AcceptorPath(u"DeleteAcceptor.asp"),
                         session.userName, session.password, kProductGuid);
  });
  if (client.DeleteFileForUser(name) != status::kSuccess) {
    Fail(ftp_error::kNotTaken, u"The file was not deleted.");
    return false;
  }
  RemoveLocalCopy(copy);
  return true;
}

// --- Rename ---

bool FileControl::RenameFile(TextView strOldFileName, TextView strNewFileName) {
  return ResultAsItStood(false, [&](bool& renamed) {
    const Text oldName(strOldFileName);
    const Text newName(Trim(strNewFileName));
    const Hourglass pointer(*this);
    const bool nested = std::exchange(renameInProgress_, true);
    renamed = Rename(oldName, newName);
    if (renamed) {
      Raise(event::kRenamed, newName);
    } else {
      Raise(event::kRenameFailed);
    }
    renameInProgress_ = nested;
  });
}

bool FileControl::Rename(const Text& oldName, const Text& newName) {
  if (!RenameOnServer(oldName, newName)) return false;
  apartment_.listingIsCurrent = false;
  ResultAsItStood(0, [&](int&) { ShowRenamed(RecordRenamed(oldName, newName), oldName, newName); });
  return true;
}

bool FileControl::RenameOnServer(const Text& oldName, const Text& newName) {
  return ResultAsItStood(false, [&](bool& renamed) {
    // Bytes that are renamed without the service's knowledge would be lost to the user.
    const std::shared_ptr<CFileUpload> client = mobjFileupload;
    if (!client) return;
    const SessionValues& session = apartment_.session;
    uploader_.RenameFile(UsersBaseUrl(session.serverName), oldName, newName,
                         AcceptorPath(u"RenameAcceptor.asp"), session.userName, session.password,
                         kProductGuid);
    renamed = client->RenameFile(TextFromNumber(session.productNumber), session.userName, oldName, newName) ==
              status::kSuccess;
  });
}

std::shared_ptr<CUpload> FileControl::RecordRenamed(const Text& oldName, const Text& newName) {
  FileList& all = apartment_.allFiles;
  for (std::size_t i = 1; i <= all.Count(); ++i) {
    std::shared_ptr<CUpload> record = all.At(i);
    if (record->FileName != oldName) continue;
    const Text oldCopy = LocalCopyOf(record->FilePath);
    FileList& shown = apartment_.shownFiles;
    const std::size_t shownAt = shown.PositionOf(record->FilePath);
    GiveName(*record, newName);
    SetAddress(all, i, record->FilePath);
    if (shownAt != 0 && shown.At(shownAt) == record) SetAddress(shown, shownAt, record->FilePath);
    MoveLocalCopy(oldCopy, LocalCopyOf(record->FilePath));
    return record;
  }
  return nullptr;
}

void FileControl::GiveName(CUpload& record, const Text& newName) {
  const std::size_t folder = record.FilePath.size() - FileNameFromUrl(record.FilePath).size();
  record.FilePath = record.FilePath.substr(0, folder) + newName;
  record.FileName = newName;
}

void FileControl::SetAddress(FileList& list, std::size_t position, const Text& url) {
  std::shared_ptr<CUpload> record = list.Take(position);
  record->FilePath = url;
  const bool taken = list.PositionOf(url) != 0;
  list.Insert(position, std::move(record), taken ? TextView() : TextView(url));
}

bool FileControl::IsFileNameValid(TextView szFileName) {
  return ResultAsItStood(false, [&](bool& valid) {
    valid = szFileName.find_first_of(kRefusedCharacters) == TextView::npos;
    if (!valid) Raise(event::kNameRefused);
  });
}

bool FileControl::CheckFileExtension(Text& szNewString, TextView szOriExt) {
  return ResultAsItStood(false, [&](bool& agrees) {
    if (ExtensionOf(szNewString) != szOriExt) szNewString = WithExtension(szNewString, szOriExt);
    agrees = true;
  });
}

bool FileControl::CheckIfFileDoesNotExist(TextView szFileName) const {
  return !ShowsFile(szFileName) && PositionOf(szFileName) == 0;
}

std::size_t FileControl::PositionOf(TextView name) const {
  for (std::size_t i = 1; i <= apartment_.allFiles.Count(); ++i)
    if (EqualsIgnoringCase(Trim(apartment_.allFiles.At(i)->FileName), Trim(name))) return i;
  return 0;
}

bool FileControl::EnableRename(bool bEnableRename) {
  bRenameEnabled = bEnableRename;
  return bEnableRename;
}

// --- Local copies ---

Text FileControl::LocalCopyOf(TextView url) const {
  // The name comes from the server; it must not lead out of the folder.
  const TextView name = FileNameFromUrl(url);
  if (apartment_.UserFolderPath.empty() || !IsSafeFileName(name)) return {};
  return apartment_.UserFolderPath + u"\\" + Text(name);
}

void FileControl::BeginLocalCopy(const Text& path) {
  copyPath_ = LocalCopyOf(FileNameFromPath(path));
  copyWriter_ = ResultAsItStood(std::unique_ptr<FileWriter>(), [&](std::unique_ptr<FileWriter>& writer) {
    if (!copyPath_.empty() && copyPath_ != path) writer = apartment_.platform.files.Create(copyPath_);
  });
}

void FileControl::FileBytes(std::string_view bytes) {
  // However slowly, the upload goes on.
  downloader_.RestartWatchdog();
  if (!copyWriter_) return;
  // A full disk here is no reason to lose the upload.
  const bool written = ResultAsItStood(false, [&](bool& done) {
    copyWriter_->Write(bytes);
    done = true;
  });
  if (!written) copyWriter_.reset();
}

void FileControl::FinishLocalCopy(const Text& path, const Text& url) {
  const std::unique_ptr<FileWriter> writer = std::move(copyWriter_);
  const Text copy = LocalCopyOf(url);
  if (copy.empty() || copy == path) return;
  // The copy of the picture that was there before must not be shown for the new one, whatever comes now. Some
  // file systems write a file out before it may replace another, too, which takes as long as the upload.
  RemoveLocalCopy(copy);
  const bool finished = writer && copy == copyPath_ && ResultAsItStood(false, [&](bool& done) {
                          writer->Commit();
                          done = true;
                        });
  if (!finished) CopyLocalFile(apartment_.platform.files, path, copy);
}

void FileControl::MoveLocalCopy(const Text& from, const Text& to) {
  // The file system takes both for one.
  if (EqualsIgnoringCase(from, to)) return;
  FileSystem& files = apartment_.platform.files;
  // What is there under the new name is another picture's.
  if (from.empty() || !FileExists(files, from)) {
    RemoveLocalCopy(to);
    return;
  }
  if (!to.empty()) CopyLocalFile(files, from, to);
  RemoveLocalCopy(from);
}

void FileControl::RemoveLocalCopy(const Text& copy) {
  if (!copy.empty()) ResultAsItStood(0, [&](int&) { apartment_.platform.files.Remove(copy); });
}

// --- Download ---

Text FileControl::DownLoadFileFromServer(TextView szLocalFilePath) {
  return ResultAsItStood(Text(), [&](Text& local) {
    if (RefusesTransfer() || !mobjFileupload || !CFileUpload::CanDownLoadFile()) return;
    const std::shared_ptr<CUpload> selected = SelectedRecord();
    if (!selected) return;
    const Text name = selected->FileName;
    Text target(szLocalFilePath);
    if (target.ends_with(u'\\')) target.pop_back();
    // For a file whose name is a number the path is the file itself, not its folder; hosts rely on it.
    const bool inFolder = !IsNumeric(name);
    if (inFolder) target += u"\\" + name;
    local = target;

    Text url;
    const FileList& all = apartment_.allFiles;
    for (std::size_t i = 1; i <= all.Count() && url.empty(); ++i)
      if (all.At(i)->FilePath.find(selected->FilePath) != Text::npos) url = all.At(i)->FilePath;
    if (url.empty()) return;
    // The name comes from the server; it must not lead out of the folder.
    if (inFolder && !IsSafeFileName(name)) {
      Fail(ftp_error::kAborted, u"The file's name is not safe.");
      return Raise(event::kDownloadFailed);
    }
    // What is there would pass for the download: somebody has it open, or it is not to be changed.
    const bool free = ResultAsItStood(false, [&](bool& done) {
      FileSystem& files = apartment_.platform.files;
      if (FileExists(files, target)) files.Remove(target);
      done = true;
    });
    if (!free) {
      Fail(ftp_error::kAborted, u"The local file could not be replaced.");
      return Raise(event::kDownloadFailed);
    }
    if (Download(url, target, target, [] { return false; })) Yield();
    TransferEnded();
  });
}

bool FileControl::Download(const Text& url, const Text& explicitTarget, const Text& expected,
                           const std::function<bool()>& stop) {
  const RunningTransfer running(*this);
  m_lDownloadedBytes = 0;
  downloadFinished_ = false;
  downloadRuns_ = true;
  downloader_.Start(url, explicitTarget);
  while (!gbConnectionFailed && !downloadFinished_ && !closed_ && !stop()) downloader_.Wait();
  downloadRuns_ = false;
  gbConnectionFailed = false;
  // The host may have set the flag; then the transfer would go on behind the back of the next one.
  if (!downloadFinished_) downloader_.Cancel();
  // Or it would run out later, on whatever comes next.
  downloader_.StopWatchdog();
  if (!downloadFinished_) return false;
  // The writer tells of no failure; whether it wrote is seen here, and nothing else will come.
  if (FileExists(apartment_.platform.files, expected)) return true;
  Fail(ftp_error::kAborted, u"The file could not be written.");
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

void FileControl::Finished() {
  downloadFinished_ = true;
  TellState(ConnectionState::kTransferCompleted);
}

void FileControl::Failed(std::int32_t ftpError, TextView description, bool told) {
  gbConnectionFailed = true;
  Fail(ftpError, description);
  if (told) Raise(event::kDownloadFailed);
}

// --- Drag and drop ---

FileControl::DragContent FileControl::ContentOfDrag() const {
  return ResultAsItStood(DragContent(), [&](DragContent& content) {
    content.address = SelectedKey();
    Text copy = LocalCopyOf(content.address);
    if (!copy.empty() && FileExists(apartment_.platform.files, copy)) content.localFile = std::move(copy);
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
    if (StopsDrop()) break;
    Raise(event::kFileDrop, path);
  }
  Raise(event::kFileDrop);
}

void FileControl::OnCompleteDrag(std::int32_t effect) {
  if (std::exchange(apartment_.dragIsOurs, false)) events_.OLECompleteDrag(effect);
}

}  // namespace tarnwick
