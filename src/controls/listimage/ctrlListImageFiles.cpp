// The operations on files: upload, delete, rename, download.
#include <algorithm>
#include <utility>

#include "controls/listimage/FileNames.h"
#include "controls/listimage/ctrlListImage.h"
#include "platform/FileSystem.h"
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

class ctrlListImage::RunningTransfer {
 public:
  explicit RunningTransfer(ctrlListImage& control) : control_(control) {
    control_.transferRuns_ = control_.m_bTransferInProgress = true;
    control_.Fail(ftp_error::kSuccess, u"");
  }
  ~RunningTransfer() { control_.transferRuns_ = control_.m_bTransferInProgress = false; }
  RunningTransfer(const RunningTransfer&) = delete;
  RunningTransfer& operator=(const RunningTransfer&) = delete;

 private:
  ctrlListImage& control_;
};

class ctrlListImage::Hourglass {
 public:
  explicit Hourglass(ctrlListImage& control) : control_(control) {
    if (++control_.hourglasses_ == 1) control_.view_.SetHourglass(true);
  }
  // Operations nest when the host starts one in an event; the last one restores the pointer.
  ~Hourglass() {
    if (--control_.hourglasses_ == 0) control_.view_.SetHourglass(false);
  }
  Hourglass(const Hourglass&) = delete;
  Hourglass& operator=(const Hourglass&) = delete;

 private:
  ctrlListImage& control_;
};

void ctrlListImage::Fail(std::int32_t ftpError, TextView description) {
  m_LastError = ftpError;
  m_strLastErrorDesc = description;
}

bool ctrlListImage::RefusesTransfer() {
  if (transferRuns_) Fail(ftp_error::kTransferInProgress, u"A transfer is in progress.");
  return transferRuns_ || closed_;
}

// --- Upload ---

bool ctrlListImage::UploadImage(TextView szLocalPath) {
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
      // What is on the server is registered, whatever the host made of the control meanwhile.
      if (SendFile(path)) url = client->SaveUploadFile(path);
      downloader_.StopWatchdog();
    }
    if (url.empty()) return;
    ShowUploaded(path, url);
    uploaded = true;
    RaiseCurrentItem();
  });
}

bool ctrlListImage::SendFile(const Text& path) {
  const SessionValues& session = apartment_.session;
  uploadFinished_ = false;
  m_lUploadedBytes = 0;
  downloader_.RestartWatchdog();
  try {
    uploader_.UploadFile(path, UsersBaseUrl(session.serverName), AcceptorPath(u"UploadAcceptor.asp"), 0,
                         Text(session.userName), Text(session.password), kProductGuid, *this);
  } catch (const RuntimeError& failure) {
    const std::int32_t number = failure.Number();
    if (number != acceptor::kNothingChanged && number != kInvalidProperty) {
      Fail(number == acceptor::kUnspecified ? ftp_error::kConnectionLost : ftp_error::kNotTaken,
           u"The file was not uploaded (" + TextFromNumber(number) + u").");
      return false;
    }
  }
  Yield();
  return uploadFinished_;
}

void ctrlListImage::ActionComplete() {
  Yield();
}

void ctrlListImage::Connecting() {
  Yield();
  events_.StateChanged(ConnectionState::kResolvingHost);
}

void ctrlListImage::Initializing() {
  Yield();
}

void ctrlListImage::ServerProcess() {
  Yield();
}

void ctrlListImage::UploadStarted() {
  Yield();
  events_.StateChanged(ConnectionState::kConnected);
  events_.StateChanged(ConnectionState::kTransferStarting);
  RaiseUploadProgress(0);
  uploadFinished_ = false;
  downloader_.RestartWatchdog();
}

void ctrlListImage::UploadProgress(std::int32_t percent, std::int32_t bytes) {
  Yield();
  m_lUploadedBytes = bytes;
  RaiseUploadProgress(percent);
  uploadFinished_ = false;
  Yield();
  downloader_.RestartWatchdog();
}

void ctrlListImage::UploadComplete() {
  Yield();
  RaiseUploadProgress(100);
  uploadFinished_ = true;
  downloader_.StopWatchdog();
  events_.StateChanged(ConnectionState::kTransferCompleted);
}

void ctrlListImage::RaiseUploadProgress(std::int32_t percent) {
  Raise(event::kProgress, TextFromNumber(percent));
  events_.UploadProgress(m_lUploadedBytes);
}

void ctrlListImage::ShowUploaded(const Text& path, const Text& url) {
  FileSystem& files = apartment_.platform.files;
  FileList& all = apartment_.allFiles;
  auto record = std::make_shared<CUpload>();
  record->FileName = FileNameFromPath(path);
  record->FilePath = url;
  record->FileSize = GetLocalFileSize(files, path);
  record->FileDate = GetLocalFileDate(files, path);

  // An upload that replaced a file takes over its record and its item.
  std::size_t position = PositionOf(record->FileName);
  if (position == 0) position = all.PositionOf(url);
  if (position != 0) {
    *all.At(position) = *record;
    record = all.At(position);
    SetAddress(position, url);
  } else {
    all.Add(record, url);
  }
  const auto same = std::ranges::find_if(items_, [&](const Item& item) {
    return item.record == record || EqualsIgnoringCase(item.record->FileName, record->FileName);
  });
  if (same != items_.end()) {
    *same = {record, true};
    view_.RefreshItem(static_cast<std::size_t>(same - items_.begin()));
  } else if (ShowsWhenUploaded(record->FileName)) {
    items_.push_back({record, true});
    view_.AppendItem();
  }
  reselect_ = true;
  ShowListOrLabel();
  UploadedFileSetFocus(record->FileName);
}

// --- Delete ---

void ctrlListImage::DeleteFile() {
  ResultAsItStood(0, [&](int&) {
    // In an event of a delete there is nothing more to delete: what is selected is under way.
    if (deleteRuns_) return;
    const Hourglass pointer(*this);
    if (items_.empty() || !mobjFileupload) return;
    if (!CFileUpload::CanDeleteFile()) return Raise(event::kNotAllowed);
    deleteRuns_ = true;
    ResultAsItStood(0, [&](int&) { DeleteSelected(); });
    deleteRuns_ = false;
    if (closed_) return;
    apartment_.listingIsCurrent = false;
    Fill([](const CUpload&) { return false; });
    try {
      Init(currentFilter_);
    } catch (const RuntimeError&) {
      // The files are gone; that the rest could not be listed again is no failure of the delete.
      ShowListOrLabel();
    }
    if (items_.empty()) return;
    SelectAlone(0);
    OnSelectionChanged();
  });
}

void ctrlListImage::DeleteSelected() {
  const SessionValues& session = apartment_.session;
  const std::uint32_t filling = filling_;
  // Where the last record was. The next one follows, so that many deletes stay one walk through the records.
  std::size_t position = 1;
  // The host may fill the list anew or take the client away in any event; the rest then stays.
  for (std::size_t i = 0; i < items_.size() && filling == filling_ && !closed_; ++i) {
    if (!view_.IsSelected(i)) {
      Raise(event::kNotSelected);
      continue;
    }
    const std::shared_ptr<CFileUpload> client = mobjFileupload;
    if (!client) return;
    const Text name = items_[i].record->FileName;
    // What the page says does not matter; the service decides below.
    ResultAsItStood(0, [&](int&) {
      uploader_.DeleteFile(UsersBaseUrl(session.serverName), name, AcceptorPath(u"DeleteAcceptor.asp"),
                           session.userName, session.password, kProductGuid);
    });
    if (client->DeleteFileForUser(name) != status::kSuccess) continue;
    position = RemoveRecord(name, position);
    Raise(event::kDeleted);
    RaiseCurrentItem();
  }
}

std::size_t ctrlListImage::RemoveRecord(TextView name, std::size_t from) {
  FileList& all = apartment_.allFiles;
  const std::size_t count = all.Count();
  for (std::size_t step = 0; step < count; ++step) {
    const std::size_t position = (from - 1 + step) % count + 1;
    if (Trim(all.At(position)->FileName) != Trim(name)) continue;
    all.Remove(position);
    return position;
  }
  return from;
}

// --- Rename ---

bool ctrlListImage::RenameFile(TextView strOldFileName, TextView strNewFileName) {
  return ResultAsItStood(false, [&](bool& renamed) {
    const Text oldName(strOldFileName);
    const Text newName(Trim(strNewFileName));
    const Hourglass pointer(*this);
    const bool nested = std::exchange(renameInProgress_, true);
    renamed = RenameOnServer(oldName, newName);
    if (renamed) {
      apartment_.listingIsCurrent = false;
      reselect_ = true;
      ResultAsItStood(0, [&](int&) { ShowRenamed(oldName, newName); });
      Raise(event::kRenamed, newName);
    } else {
      Raise(event::kRenameFailed);
    }
    renameInProgress_ = nested;
  });
}

bool ctrlListImage::RenameOnServer(const Text& oldName, const Text& newName) {
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

void ctrlListImage::ShowRenamed(const Text& oldName, const Text& newName) {
  // Record and item are one object as a rule, but the item of an older listing has a record of its own.
  const auto item =
      std::ranges::find_if(items_, [&](const Item& shown) { return shown.record->FileName == oldName; });
  std::size_t position = 1;
  while (position <= apartment_.allFiles.Count() && apartment_.allFiles.At(position)->FileName != oldName)
    ++position;
  const auto rename = [&](CUpload& record) {
    const std::size_t folder = record.FilePath.size() - FileNameFromUrl(record.FilePath).size();
    record.FilePath = record.FilePath.substr(0, folder) + newName;
    record.FileName = newName;
  };
  const CUpload* renamed = nullptr;
  if (position <= apartment_.allFiles.Count()) {
    CUpload& record = *apartment_.allFiles.At(position);
    rename(record);
    SetAddress(position, record.FilePath);
    renamed = &record;
  }
  if (item == items_.end()) return;
  if (item->record.get() != renamed) rename(*item->record);
  view_.RefreshItem(static_cast<std::size_t>(item - items_.begin()));
}

void ctrlListImage::SetAddress(std::size_t position, const Text& url) {
  // The address is the record's key as well. Another record that has it already keeps it.
  FileList& all = apartment_.allFiles;
  std::shared_ptr<CUpload> record = all.Take(position);
  record->FilePath = url;
  const bool taken = all.PositionOf(url) != 0;
  all.Insert(position, std::move(record), taken ? TextView() : TextView(url));
}

bool ctrlListImage::IsFileNameValid(TextView szFileName) {
  return ResultAsItStood(false, [&](bool& valid) {
    valid = szFileName.find_first_of(kRefusedCharacters) == TextView::npos;
    if (!valid) Raise(event::kNameRefused);
  });
}

bool ctrlListImage::CheckFileExtension(Text& szNewString, TextView szOriExt) {
  return ResultAsItStood(false, [&](bool& agrees) {
    if (ExtensionOf(szNewString) != szOriExt) szNewString = WithExtension(szNewString, szOriExt);
    agrees = true;
  });
}

bool ctrlListImage::CheckIfFileDoesNotExist(TextView szFileName) const {
  return std::ranges::none_of(
             items_,
             [&](const Item& item) { return EqualsIgnoringCase(item.record->FileName, szFileName); }) &&
         PositionOf(szFileName) == 0;
}

std::size_t ctrlListImage::PositionOf(TextView name) const {
  for (std::size_t i = 1; i <= apartment_.allFiles.Count(); ++i)
    if (EqualsIgnoringCase(Trim(apartment_.allFiles.At(i)->FileName), Trim(name))) return i;
  return 0;
}

// --- Download ---

Text ctrlListImage::DownLoadFileFromServer(TextView szLocalFilePath) {
  return ResultAsItStood(Text(), [&](Text& local) {
    if (RefusesTransfer() || !mobjFileupload || !CFileUpload::CanDownLoadFile()) return;
    const auto selected = Selected();
    if (!selected) return;
    const Text name = items_[*selected].record->FileName;
    const Text key = items_[*selected].record->FilePath;
    Text target(szLocalFilePath);
    if (target.ends_with(u'\\')) target.pop_back();
    // For a file whose name is a number the path is the file itself, not its folder; hosts rely on it.
    const bool inFolder = !IsNumeric(name);
    if (inFolder) target += u"\\" + name;
    local = target;

    Text url;
    const FileList& all = apartment_.allFiles;
    for (std::size_t i = 1; i <= all.Count() && url.empty(); ++i)
      if (all.At(i)->FilePath.find(key) != Text::npos) url = all.At(i)->FilePath;
    if (url.empty()) return;
    // The name comes from the server; it must not lead out of the folder.
    if (inFolder && !IsSafeFileName(name)) {
      Fail(ftp_error::kAborted, u"The file's name is not safe.");
      return Raise(event::kDownloadFailed);
    }

    const RunningTransfer running(*this);
    m_lDownloadedBytes = 0;
    downloadFinished_ = false;
    FileSystem& files = apartment_.platform.files;
    if (FileExists(files, target)) files.Remove(target);
    downloader_.Start(url, target);
    if (WaitFor(target)) {
      Yield();
    } else if (downloadFinished_) {
      Fail(ftp_error::kAborted, u"The file could not be written.");
    }
  });
}

void ctrlListImage::Resolving() {
  events_.StateChanged(ConnectionState::kResolvingHost);
}

void ctrlListImage::Connected() {
  events_.StateChanged(ConnectionState::kConnected);
}

void ctrlListImage::TransferStarting() {
  events_.StateChanged(ConnectionState::kTransferStarting);
}

void ctrlListImage::ReplyLine(TextView line) {
  events_.ReplyMessage(line);
}

void ctrlListImage::Received(std::int32_t bytes) {
  m_lDownloadedBytes = bytes;
  Raise(event::kProgress, TextFromNumber(bytes));
  events_.DownloadProgress(bytes);
}

void ctrlListImage::Finished() {
  downloadFinished_ = true;
  events_.StateChanged(ConnectionState::kTransferCompleted);
}

void ctrlListImage::Failed(std::int32_t ftpError, TextView description, bool told) {
  gbConnectionFailed = true;
  Fail(ftpError, description);
  if (told) Raise(event::kDownloadFailed);
}

bool ctrlListImage::WaitFor(const Text& target) {
  while (!gbConnectionFailed && !downloadFinished_ && !closed_) downloader_.Wait();
  gbConnectionFailed = false;
  // The host may have set the flag; then the transfer would go on behind the back of the next one.
  if (!downloadFinished_) downloader_.Cancel();
  // Or it would run out later, on whatever comes next.
  downloader_.StopWatchdog();
  if (!downloadFinished_) return false;
  // The writer tells of no failure; whether it wrote is seen here, and nothing else will come.
  return FileExists(apartment_.platform.files, target);
}

}  // namespace tarnwick
