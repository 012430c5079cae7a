// The list control: shows the files of the account as a list with name, address and size, and uploads,
// deletes, renames and downloads them. This class is all of its rules; the window (ListView) draws and tells
// what the user does, the surface is the control that hosts see.
//
// No public operation throws but Init; a failure is told by the result and by the events. Events and passes
// of the message pump run code of the host, which may call the control again. The surface keeps the object
// alive as long as one of its members runs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <vector>

#include "controls/listimage/ControlEvents.h"
#include "controls/listimage/ListView.h"
#include "service/CFileUpload.h"
#include "support/Apartment.h"
#include "support/Text.h"
#include "transfer/Transfers.h"

namespace tarnwick {

// FtpErrors that the control sets.
namespace ftp_error {
inline constexpr std::int32_t kSuccess = 32;
inline constexpr std::int32_t kConnectionLost = 43;
inline constexpr std::int32_t kNotTaken = 44;
inline constexpr std::int32_t kAborted = 45;
inline constexpr std::int32_t kTimeout = 58;
inline constexpr std::int32_t kTransferInProgress = 59;
}  // namespace ftp_error

// Numbers with which Init fails to the host.
namespace list_error {
inline constexpr std::int32_t kNoClient = 91;         // mobjFileupload is not set
inline constexpr std::int32_t kListingFailed = 1004;  // the service did not list the files
}  // namespace list_error

// Entries, counted from 1, of the image lists with the large and the small pictures.
struct ItemPicture {
  int large = 0;
  int small = 0;
};

class ctrlListImage : private UploadEvents, private DownloadEvents {
 public:
  // What the control works with; all of it outlives the control.
  struct Parts {
    Apartment& apartment;
    ListView& view;
    ControlEvents& events;
    Uploader& uploader;
    Downloader& downloader;
  };

  // Has a service client of its own from the start.
  explicit ctrlListImage(const Parts& parts);
  // The next control lists from the server again.
  ~ctrlListImage() override;
  ctrlListImage(const ctrlListImage&) = delete;
  ctrlListImage& operator=(const ctrlListImage&) = delete;

  // --- Fields that the host reads and writes ---

  // The service client; may be null.
  std::shared_ptr<CFileUpload> mobjFileupload;
  // An FtpErrors value and its text, of the transfer that ran last or was refused.
  std::int32_t m_LastError = 0;
  Text m_strLastErrorDesc;
  // A transfer runs. What a host writes here does not stop it.
  bool m_bTransferInProgress = false;
  // Bytes of the transfer that runs or ran last.
  std::int32_t m_lDownloadedBytes = 0;
  std::int32_t m_lUploadedBytes = 0;
  // Ends the wait of a download; the end of the wait clears it.
  bool gbConnectionFailed = false;
  bool bRenameEnabled = false;
  // The control stores these for the host and does nothing with them.
  Text m_strWinsockBuffer;
  Text m_strDataBuffer;
  Text m_strLocalFilePath;
  std::int16_t m_intLocalFileID = 0;
  bool m_bUploadFile = false;
  Text m_strLastServerResponse;
  bool m_bFileIsOpened = false;
  bool gbUploadImage = false;
  Text gszDownloadPath;
  bool gbDownload = false;
  bool bConnectedToFtp = false;
  std::int16_t OLEDropMode = 0;
  std::int32_t OLEDragMode = 0;

  // --- Listing ---

  // Fills the list from the service, or from the records of the last listing while they are current. Filters
  // are "*", "gif" and "jpg" in exactly this spelling; any other shows nothing. Throws a list_error; the list
  // is then as it was.
  bool Init(TextView szFileFilter);

  // Shows the cached records again through another filter: "gif" and "jpg" in any letter case, else all.
  void ChangeFileFilter(TextView szFileFilter);

  // Hands name, size and date of the first cached record whose address is `FileName`, or ends in that name,
  // to `colFiles` in a new record.
  void GetFileDetails(TextView FileName,
                      const std::function<void(const std::shared_ptr<CUpload>&)>& colFiles);

  // --- Selection ---

  // Name of the first selected item, empty when there is none.
  Text SelectedFileName() const;
  // Its address; nullopt when there is none.
  std::optional<Text> GetSelectedFilesHttpPath() const;
  // Names of all selected items in list order.
  std::vector<Text> GetFileNames() const;
  void SetMultiSelectProperty(bool bVal);
  void ListViewSetFocus();
  // Also selects the item of that name (letter case counts), and no other one.
  void UploadedFileSetFocus(TextView szFileName);

  // --- Operations ---

  // Sends the file to the account, registers it and shows it. Pumps messages meanwhile.
  bool UploadImage(TextView szLocalPath);

  // Deletes every selected item's file.
  void DeleteFile();

  bool RenameFile(TextView strOldFileName, TextView strNewFileName);

  // Fetches the selected file. `szLocalFilePath` is the folder to put it in, or, when the file's name is a
  // number, the file to write. Returns the path of the file, whether or not it could be fetched; empty when
  // nothing could be attempted. Pumps messages until the end of the transfer.
  Text DownLoadFileFromServer(TextView szLocalFilePath);

  // Whether the name holds none of \ / : * ? " < > | # %.
  bool IsFileNameValid(TextView szFileName);

  // Gives the new name the extension `szOriExt` (with its dot; letter case counts) in place of its own. True.
  bool CheckFileExtension(Text& szNewString, TextView szOriExt);

  // Whether neither an item nor a cached record has the name, in any letter case.
  bool CheckIfFileDoesNotExist(TextView szFileName) const;

  void StartLabelExit();
  // Allows or forbids label editing and returns the argument.
  bool EnableRename(bool bEnableRename);
  void OLEDrag();

  // Ends a running wait at its next pass, as if the connection had failed; nothing starts any more. For a
  // control that its container closes while an operation runs.
  void Close();

  // --- What the view asks ---

  std::size_t ItemCount() const { return items_.size(); }
  // Columns count from 0: name, address, size. Empty outside the list.
  Text ItemText(std::size_t index, int column) const;
  ItemPicture PictureOf(std::size_t index) const;
  // The first item from `start` on, then from the top, whose name starts with `prefix` in any letter case.
  std::optional<std::size_t> FindItem(TextView prefix, std::size_t start) const;

  // --- What the user does ---

  // A key was pressed, and the list has done with it what lists do.
  void OnKeyDown(std::int32_t keyCode);
  // Enter in the list, not in a label edit.
  void OnEnter();
  // Another item was selected in other ways than by the arrow keys or a click.
  void OnSelectionChanged();
  void OnClick();
  // Any mouse button, on an item or beside them.
  void OnMouseButton();
  // Whether the user may edit the label.
  bool OnBeforeLabelEdit() const;
  // The label edit of an item ended with a text; an edit that was cancelled is not told. True when the item
  // has a new name now, which need not be that text.
  bool OnAfterLabelEdit(std::size_t index, TextView newText);

  // --- Drag and drop ---

  // What a drag of the list offers: the address of the first selected item, and its local copy when there is
  // one.
  struct DragContent {
    Text address;
    Text localFile;
  };
  DragContent ContentOfDrag() const;
  // The host may change the data and the effects.
  void OnStartDrag(DragData& data, std::int32_t& allowedEffects);
  void OnSetData(DragData& data, std::int16_t format);
  void OnGiveFeedback(std::int32_t& effect, bool& defaultCursors);
  void OnDragOver(DragData& data, std::int32_t& effect, const DragPoint& at, std::int16_t state);
  // `files` are the paths of the dropped files, empty when the data holds none; they last as long as the
  // call.
  void OnDrop(DragData& data, const std::vector<Text>& files, std::int32_t& effect, const DragPoint& at);
  void OnCompleteDrag(std::int32_t effect);

 private:
  // One line of the list. The record is shared with the list of all files.
  struct Item {
    std::shared_ptr<CUpload> record;
    // Shown since an upload, which spells the size in its own way until the list is filled again.
    bool uploaded = false;
  };
  // Marks a transfer as running, and shows the hourglass, as long as they live.
  class RunningTransfer;
  class Hourglass;

  // What the transfer components tell while they work.
  void ActionComplete() override;
  void Connecting() override;
  void Initializing() override;
  void ServerProcess() override;
  void UploadStarted() override;
  void UploadProgress(std::int32_t percent, std::int32_t bytes) override;
  void UploadComplete() override;
  void RaiseUploadProgress(std::int32_t percent);
  void Resolving() override;
  void Connected() override;
  void TransferStarting() override;
  void ReplyLine(TextView line) override;
  void Received(std::int32_t bytes) override;
  void Finished() override;
  void Failed(std::int32_t ftpError, TextView description, bool told) override;

  // `description` is none of the texts that the host can change in the event.
  void Raise(std::int16_t code, TextView description = {});
  void RaiseCurrentItem();
  void Yield() { apartment_.platform.pump.Yield(); }

  // Whether a transfer must not start now; tells the host why.
  bool RefusesTransfer();
  void Fail(std::int32_t ftpError, TextView description);
  std::optional<std::size_t> Selected() const { return NextSelected(0); }
  std::optional<std::size_t> NextSelected(std::size_t from) const;
  // Address of the first selected item, empty when there is none.
  Text SelectedKey() const;
  void SelectAlone(std::size_t index);

  // Puts the records that `shows` lets pass into the list.
  void Fill(const std::function<bool(const CUpload&)>& shows);
  void ShowListOrLabel() { view_.ShowList(!apartment_.allFiles.IsEmpty()); }
  bool ShowsWhenUploaded(TextView name) const;

  bool SendFile(const Text& path);
  void ShowUploaded(const Text& path, const Text& url);
  void DeleteSelected();
  // Removes the record of that name, searching from `from` on and then from the start. Returns where it was.
  std::size_t RemoveRecord(TextView name, std::size_t from);
  bool RenameOnServer(const Text& oldName, const Text& newName);
  void ShowRenamed(const Text& oldName, const Text& newName);
  // Position of the record of that name in the list of all files, in any letter case; 0 when there is none.
  std::size_t PositionOf(TextView name) const;
  // Gives the record at `position` of all files another address.
  void SetAddress(std::size_t position, const Text& url);
  // Until the download is over; whether it left the file.
  bool WaitFor(const Text& target);

  Apartment& apartment_;
  ListView& view_;
  ControlEvents& events_;
  Uploader& uploader_;
  Downloader& downloader_;

  std::vector<Item> items_;
  // Counts the fillings, so that a walk through the items sees that they are others now.
  std::uint32_t filling_ = 0;
  Text currentFilter_ = u"*";
  bool reselect_ = false;
  bool transferRuns_ = false;
  bool uploadFinished_ = false;
  bool downloadFinished_ = false;
  bool deleteRuns_ = false;
  bool renameInProgress_ = false;
  bool dragFromList_ = false;
  bool closed_ = false;
  int hourglasses_ = 0;
};

}  // namespace tarnwick
