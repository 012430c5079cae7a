// What both controls are: a view of the account's files that uploads, renames and downloads them, tells its
// host by events and takes part in drag and drop. Each control adds what it shows and how it is used.
//
// No public operation throws; a failure is told by the result and by the events. Events and passes of the
// message pump run code of the host, which may call the control again. The surface keeps the object alive as
// long as one of its members runs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <string_view>
#include <utility>
#include <vector>

#include "base/Text.h"
#include "controls/ControlEvents.h"
#include "controls/ControlView.h"
#include "controls/LocalCopies.h"
#include "controls/PageFailures.h"
#include "service/CFileUpload.h"
#include "session/Apartment.h"
#include "transfer/FtpErrors.h"
#include "transfer/Transfers.h"

namespace tarnwick {

// Numbers with which Init fails to the host.
namespace init_error {
inline constexpr std::int32_t kNoClient = 91;         // mobjFileupload is not set
inline constexpr std::int32_t kListingFailed = 1004;  // the service did not list the files
}  // namespace init_error

// The library's own text for a filter that no file passes.
inline constexpr std::uint16_t kNoHitsString = 4001;

// What a control works with beside its view; all of it outlives the control.
struct ControlParts {
  Apartment& apartment;
  ControlEvents& events;
  Uploader& uploader;
  Downloader& downloader;
};

class FileControl : private UploadEvents, private DownloadEvents {
 public:
  ~FileControl() override;
  FileControl(const FileControl&) = delete;
  FileControl& operator=(const FileControl&) = delete;

  // --- Fields that the host reads and writes ---

  // The service client; may be null.
  std::shared_ptr<CFileUpload> mobjFileupload;
  // An FtpErrors value and its text, of the operation that ended last: an upload, a download, a delete, a
  // rename, a listing, or the fetching of a page's pictures. Inside an operation it tells how that stands.
  std::int32_t m_LastError = 0;
  Text m_strLastErrorDesc;
  // A transfer runs. What a host writes here does not stop it.
  bool m_bTransferInProgress = false;
  // Bytes of the transfer that runs or ran last.
  std::int32_t m_lDownloadedBytes = 0;
  std::int32_t m_lUploadedBytes = 0;
  // Ends the wait of a download, or keeps the next one from beginning; either clears it. An upload that is
  // silent for too long sets it until its own end.
  bool gbConnectionFailed = false;
  bool bRenameEnabled = false;

  // --- Selection ---

  // Name of the (first) selected file, empty when there is none.
  Text SelectedFileName() const;
  // Its address; nullopt when there is none.
  std::optional<Text> GetSelectedFilesHttpPath() const;
  // Hands name, size and date of the first cached record whose address is `FileName`, or ends in that name,
  // to `colFiles` in a new record.
  void GetFileDetails(TextView FileName,
                      const std::function<void(const std::shared_ptr<CUpload>&)>& colFiles);
  // Gives the control the focus and selects the file of that name (letter case counts), and no other one. The
  // thumbnails may have to fill a page for that, which pumps messages and raises events.
  virtual void UploadedFileSetFocus(TextView szFileName) = 0;

  // --- Operations ---

  // Fills the control from the service, which it asks without pumping messages. May throw an init_error.
  // Filling the page of the thumbnails, here and by ChangeFileFilter, pumps messages and raises events while
  // pictures are fetched.
  virtual bool Init(TextView szFileFilter) = 0;
  virtual void ChangeFileFilter(TextView szFileFilter) = 0;

  // Sends the file to the account, registers it and shows it. Pumps messages meanwhile, and raises events.
  bool UploadImage(TextView szLocalPath);

  // Deletes what is selected. Pumps messages after each file, and raises events.
  virtual void DeleteFile() = 0;

  // Blocks without pumping messages, then raises one event.
  bool RenameFile(TextView strOldFileName, TextView strNewFileName);

  // Fetches the selected file. `szLocalFilePath` is the folder to put it in, or, when the file's name is a
  // number, the file to write. Returns the path of the file, whether or not it could be fetched; empty when
  // nothing could be attempted. Pumps messages until the end of the transfer, and raises events.
  Text DownLoadFileFromServer(TextView szLocalFilePath);

  // Whether the name holds none of \ / : * ? " < > | # %. Raises event::kNameRefused when it does.
  bool IsFileNameValid(TextView szFileName);

  // Gives the new name the extension `szOriExt` (with its dot; letter case counts) in place of its own. True.
  bool CheckFileExtension(Text& szNewString, TextView szOriExt);

  // Whether neither a file that is shown nor a cached record has the name, in any letter case.
  bool CheckIfFileDoesNotExist(TextView szFileName) const;

  // Allows or forbids renaming in place and returns the argument.
  bool EnableRename(bool bEnableRename);
  // Drags the selected file out. Pumps messages until the drop, and raises events.
  void OLEDrag() { controlView_.StartDrag(); }

  // Ends the transfer that runs, at once where it waits: a download leaves no file, an upload whose last byte
  // has not left puts none on the server.
  void EndTransfer() { ++closings_; }
  // The same, and no transfer starts until Open. For a control that its container lets go of while one runs.
  void Close();
  // The control is in a container (again).
  void Open();

  // --- Drag and drop ---

  // What a drag of the control offers: the address of the selected file, and its local copy when there is
  // one.
  struct DragContent {
    Text address;
    Text localFile;
  };
  DragContent ContentOfDrag() const;
  // The host may change the data and the effects.
  void OnStartDrag(DragData& data, std::int32_t& allowedEffects);
  void OnSetData(DragData& data, std::int16_t format) { events_.OLESetData(data, format); }
  void OnGiveFeedback(std::int32_t& effect, bool& defaultCursors) {
    events_.OLEGiveFeedback(effect, defaultCursors);
  }
  void OnDragOver(DragData& data, std::int32_t& effect, const DragPoint& at, std::int16_t state) {
    events_.OLEDragOver(data, effect, at, state);
  }
  // Files are dragged over the control's edge.
  virtual void OnFilesEnter() {}
  // `files` are the paths of the dropped files, empty when the data holds none. The host may clear
  // the data in the events.
  void OnDrop(DragData& data, const std::vector<Text>& files, std::int32_t& effect, const DragPoint& at);
  void OnCompleteDrag(std::int32_t effect);

 protected:
  // Whether a control tells its host by StateChanged, the two progress events and ReplyMessage.
  enum class TransferEvents { kTold, kSilent };

  // Has a service client of its own from the start.
  FileControl(const ControlParts& parts, ControlView& view, TransferEvents transferEvents);

  // An operation keeps its outcome, which m_LastError tells when it ends, whatever ran inside it. The other
  // two mark a transfer as running, and show the hourglass, as long as they live.
  class Operation;
  class RunningTransfer;
  class Hourglass;

  // --- What each control does in its own way ---

  // Record of the (first) selected file; null when there is none.
  virtual FileRecord SelectedRecord() const = 0;
  // Whether a file of that name is shown, in any letter case.
  virtual bool ShowsFile(TextView name) const = 0;
  // The record is new in the list of all files, or, when an upload replaced a file, has new values.
  virtual void ShowUploaded(const FileRecord& record) = 0;
  // The file has another name now, also in the list of all files, where `record` is it and `oldUrl` was its
  // address (null and empty when it is not there).
  virtual void ShowRenamed(const FileRecord& record, const Text& oldUrl, const Text& oldName,
                           const Text& newName) = 0;
  // A drop without files, or of the control's own drag (`own`).
  virtual void DroppedNoFiles(bool own) = 0;
  // A transfer that the host started is over.
  virtual void TransferEnded() {}
  // Whether the walk through dropped files ends here; uses up what told it to.
  virtual bool TakeStopOfDrop() { return false; }

  // --- For the controls ---

  // `description` is none of the texts that the host can change in the event.
  void Raise(std::int16_t code, TextView description = {}) { events_.FileManagerEvent(code, description); }
  // Address of the (first) selected file, empty when there is none.
  Text SelectedAddress() const;
  void RaiseCurrentItem() { Raise(event::kCurrentItem, SelectedAddress()); }
  void Yield() { apartment_.platform.pump.Yield(); }
  bool IsClosed() const { return closed_; }

  bool TransferRuns() const { return transferRuns_; }
  // Whether the transfer that runs was told to stop.
  bool IsStopped() const { return IsAborted() || closings_ != closingsBefore_; }
  // Whether AbortFileTransfer(True) was called since the transfer began.
  bool IsAborted() const { return apartment_.aborts != abortsBefore_; }
  // How often the container and the host have told transfers to stop so far.
  struct Stops {
    std::uint32_t closings = 0;
    std::uint32_t aborts = 0;
  };
  Stops StopsSoFar() const { return {closings_, apartment_.aborts}; }
  // For the transfer that runs only stops after these are meant.
  void IgnoreStops(const Stops& earlier) {
    closingsBefore_ = earlier.closings;
    abortsBefore_ = earlier.aborts;
  }
  // Notes the outcome of the operation that runs, for m_LastError.
  void Fail(std::int32_t ftpError, TextView description);
  void Fail(const Failure& failure) { Fail(failure.ftpError, failure.description); }
  // Notes that the exchange with the server that ended last failed: why it was not safe, or what is given
  // here.
  void FailExchange(std::int32_t ftpError, TextView description);
  // Notes why what was told to stop has no result.
  void FailStopped();
  // Whether a transfer may start now; else the reason is noted.
  bool CheckTransferAllowed();
  // The client; null, with the reason noted, when there is none.
  std::shared_ptr<CFileUpload> Client();
  // Whether what is shown may be changed; else, when another user has been logged on since, the reason is
  // noted.
  bool CheckShownChangeable();
  // Adds the account's files to the list of all files; false, with that list empty, when the service did not
  // tell them all or there is no client.
  bool ListAccount();
  // What is shown from here on is the account of now.
  void NoteAccount() { shownAccount_ = apartment_.session.Account(); }
  // Whether another user has been logged on since: what is shown must not be changed in his account.
  bool ShowsOtherAccount() const { return apartment_.session.Account() != shownAccount_; }
  // Fetches `url` into the user's folder, and to `explicitTarget` first unless that is empty. Waits, pumping,
  // for its end or until `stop` says so. Whether the file is at `expected` then; else the reason is noted,
  // unless `stop` was it.
  bool Download(const Text& url, const Text& explicitTarget, const Text& expected,
                const std::function<bool()>& stop);
  // Deletes a file by its page and the service, and its local copy. Whether the service took it out.
  bool DeleteOnServer(CFileUpload& client, const CUpload& file);
  // What IsFileNameValid says of a name that the user typed; a refusal is the outcome of the rename.
  bool CheckEditedName(TextView name);
  // Renames a file on the server and wherever it is known here, without an event.
  bool Rename(const Text& oldName, const Text& newName);
  bool RenameRuns() const { return renameInProgress_; }
  // The record of that name in the list of all files, in any letter case; null when there is none.
  FileRecord RecordNamed(TextView name) const;

  Apartment& apartment_;
  Listing& listing_;
  ControlEvents& events_;
  LocalCopies copies_;

 private:
  // What the transfer components tell while they work.
  void ActionComplete() override { Yield(); }
  void Connecting() override;
  void Initializing() override { Yield(); }
  void ServerProcess() override { Yield(); }
  void UploadStarted() override;
  void FileBytes(std::string_view bytes) override;
  void UploadProgress(std::int32_t percent, std::int32_t bytes) override;
  void UploadComplete() override;
  bool IsWanted() const override { return !IsStopped(); }
  void RaiseUploadProgress(std::int32_t percent);
  void Resolving() override { TellState(ConnectionState::kResolvingHost); }
  void Connected() override { TellState(ConnectionState::kConnected); }
  void TransferStarting() override { TellState(ConnectionState::kTransferStarting); }
  void HeaderFound(TextView statusLine, std::int32_t bytes) override;
  void Received(std::int32_t bytes) override;
  void Finished(bool written) override;
  void Failed(std::int32_t ftpError, TextView description, bool told) override;
  void TellState(ConnectionState state);

  // Sends and registers the file with the account; its address, empty on failure.
  Text SendAndRegister(CFileUpload& client, const Text& path, const AccountKey& account);
  bool SendFile(CFileUpload& client, const Text& path);
  // Notes why the upload component failed with that number.
  void FailUpload(CFileUpload& client, const Text& path, std::int32_t number);
  // Notes why a page failed with that number.
  void FailPage(std::int32_t number, bool nameTaken);
  static bool IsNameAllowed(TextView name);
  // Whether the name is allowed, but another file than the one that is called `own` has it.
  bool IsNameTaken(TextView name, TextView own) const;
  // Whether the account has no room for the file. Asks the service.
  bool IsTooLarge(CFileUpload& client, const Text& path) const;
  FileRecord RecordUploaded(const Text& path, const Text& url);
  bool RenameOnServer(const Text& oldName, const Text& newName);
  // The record and the address that it had.
  std::pair<FileRecord, Text> RecordRenamed(const Text& oldName, const Text& newName);

  ControlView& controlView_;
  Uploader& uploader_;
  Downloader& downloader_;
  const bool tellsTransfers_;

  // The operation that runs innermost, and the one whose transfer runs; null when there is none.
  Operation* operation_ = nullptr;
  Operation* transfer_ = nullptr;
  bool transferRuns_ = false;
  bool uploadFinished_ = false;
  // The watchdog ran out in the upload that runs.
  bool uploadTimedOut_ = false;
  bool downloadRuns_ = false;
  // Of the download that runs: it is over, its file is there, its failure was told.
  bool downloadFinished_ = false;
  bool downloadWritten_ = false;
  bool downloadFailed_ = false;
  bool renameInProgress_ = false;
  bool closed_ = false;
  // How often the container ended transfers; that, and the apartment's aborts, when the one that runs began.
  std::uint32_t closings_ = 0;
  std::uint32_t closingsBefore_ = 0;
  std::uint32_t abortsBefore_ = 0;
  // Whose files are shown.
  AccountKey shownAccount_;
  int hourglasses_ = 0;
};

class FileControl::Operation {
 public:
  // A success until it fails.
  explicit Operation(FileControl& control);
  ~Operation();
  Operation(const Operation&) = delete;
  Operation& operator=(const Operation&) = delete;

  void Fail(std::int32_t ftpError, TextView description);
  void Succeed() { Fail(ftp_error::kSuccess, {}); }
  bool Succeeds() const { return ftpError_ == ftp_error::kSuccess; }

 private:
  FileControl& control_;
  // What runs around it; null when nothing does.
  Operation* const outer_;
  const int exceptions_ = std::uncaught_exceptions();
  std::int32_t ftpError_ = ftp_error::kSuccess;
  Text description_;
};

class FileControl::RunningTransfer {
 public:
  explicit RunningTransfer(FileControl& control);
  ~RunningTransfer();
  RunningTransfer(const RunningTransfer&) = delete;
  RunningTransfer& operator=(const RunningTransfer&) = delete;

 private:
  FileControl& control_;
  // What was so before: one may run around this one, such as the filling of a page around its downloads.
  const bool nested_;
  Operation* const transfer_;
  const std::uint32_t closings_;
  const std::uint32_t aborts_;
};

class FileControl::Hourglass {
 public:
  explicit Hourglass(FileControl& control);
  // Operations nest when the host starts one in an event; the last one restores the pointer.
  ~Hourglass();
  Hourglass(const Hourglass&) = delete;
  Hourglass& operator=(const Hourglass&) = delete;

 private:
  FileControl& control_;
};

}  // namespace tarnwick
