// The thumbnail control: shows the pictures of the account four at a time, and renames, deletes, uploads and
// downloads them. This class is all of its rules; the window (ThumbnailPage) draws and tells what the user
// does, the surface is the control that hosts see.
#pragma once

#include <array>

#include "controls/FileControl.h"
#include "controls/thumbnailview/ThumbnailPage.h"
#include "controls/thumbnailview/ThumbnailPageUser.h"
#include "support/CImageHeight.h"

namespace tarnwick {

// The caption for a file's name: at most 20 characters, and "&&" for each "&".
Text FormatLabelText(TextView name);

// All of a file's name, its size and its date, in lines.
Text FormatTip(const CUpload& file);

class ctrlThumbNailView final : public FileControl, public ThumbnailPageUser {
 public:
  ctrlThumbNailView(const ControlParts& parts, ThumbnailPage& page);
  // Takes the lists of all controls of the apartment along: the next one lists from the server again.
  ~ctrlThumbNailView() override;

  // Number of the slot that looks selected, counted from 1; 0 when there is none.
  std::int16_t iImgNo = 0;

  // Lists the account, unless it was listed already, and shows its first page. Filters are "*", and the last
  // three characters of names in lower case, such as "gif" and "jpg"; any other shows nothing. False when
  // there is no client or the service did not list the files.
  bool Init(TextView szFileFilter) override;
  // Shows the first page of the listing through another filter.
  void ChangeFileFilter(TextView szFileFilter) override;

  void PictureSetFocus() { page_.Focus(); }
  // Shows the page of the picture too.
  void UploadedFileSetFocus(TextView szFileName) override;

  // Deletes the selected picture.
  void DeleteFile() override;

  // Does nothing: hosts start a rename by F2. False.
  static bool EditFileLabel() { return false; }
  // The caption of the selected slot.
  void SetLabelText(TextView szString);
  // Gives the selected picture, or the one that the editor was opened for, another name, whose extension
  // becomes the old one. Tells the outcome by events.
  void ValidateFileName(Text& NewString);

  // --- What the user does ---

  void OnSlotPressed(int slot, bool rightButton) override;
  void OnBackgroundPressed(bool rightButton) override;
  void OnKeyDown(int keyCode) override;
  void OnScrollChanged(int value) override;
  void OnScrollDragged(int value) override;
  void OnLinkClicked() override;
  void OnSwitchView() override;
  void OnEditorEntered() override;
  void OnEditorLeft() override;
  void OnPictureUnreadable(int slot) override;
  Text NameOf(int slot) const override;
  Text PlaceOfPage() const override;
  void OnFilesEnter() override;

 private:
  FileRecord SelectedRecord() const override;
  bool ShowsFile(TextView name) const override;
  void ShowUploaded(const FileRecord& record) override;
  void ShowRenamed(const FileRecord& record, const Text& oldUrl, const Text& oldName,
                   const Text& newName) override;
  void TransferEnded() override;
  void DroppedNoFiles(bool own) override;
  bool TakeStopOfDrop() override;

  bool List();
  // Fills the list of shown files through `filter` and shows its first page.
  void Show(const Text& filter);
  bool Passes(const CUpload& file) const;
  int SetScrollRange();
  void SetScrollValue(int value);

  // Shows the page that starts at item `first`, counted from 0. In a page that is being filled it only says
  // which one is to follow.
  void ShowPage(int first);
  void FillPage(int first);
  // False when the page is not wanted any more.
  bool FillSlot(int slot, const CUpload& record);
  bool Fetch(int slot, const CUpload& record, const Text& copy);
  bool ShowPicture(int slot, const Text& copy);
  bool IsReplaced() const { return nextPage_.has_value() || IsClosed(); }
  void UpdateSelection();
  // Gives the grid the focus, unless a name is edited in it.
  void FocusGrid();
  // Shows the page with the item at that position, counted from 1, and selects it.
  void ShowItem(std::size_t position);
  // Shows the page that begins at `first`, or the last one, and selects an item, its first one without one.
  void ShowFrom(int first, std::optional<std::size_t> position);

  const Text& AddressOf(int slot) const { return addresses_[static_cast<std::size_t>(slot - 1)]; }
  Text& AddressOf(int slot) { return addresses_[static_cast<std::size_t>(slot - 1)]; }
  // 0 when the picture is not on the page.
  int SlotOf(TextView address) const;
  void RaiseSelection();
  // Sets the caption of the slot with the picture of that name, if it is on the page.
  void SetCaptionOf(TextView name, TextView caption);
  // The steps of ValidateFileName.
  void GiveNewName(Text& name, const Text& oldName);

  ThumbnailPage& page_;
  // Kept, because it holds the memory that it reads into.
  CImageHeight header_;
  // Address of the picture that each slot shows or waits for, empty for none.
  std::array<Text, kSlotCount> addresses_;
  // Address of the selected picture.
  Text selectedAddress_;
  int firstIndex_ = 0;
  int selectionFirstIndex_ = 0;
  int previousScroll_ = 0;
  bool scrolledBack_ = false;
  // The picture that was uploaded stays selected while pages change.
  bool keepSelection_ = false;

  bool fillRuns_ = false;
  // The page that takes the place of the one that is being filled, and the stops before it was asked for.
  std::optional<int> nextPage_;
  Stops stopsBeforeNext_;
  // A page could not fetch its pictures because of a transfer of the host's.
  bool fillIsOwed_ = false;
  // From the first download of a page to the end of its filling; its outcome is that of the downloads.
  struct Fetching {
    explicit Fetching(FileControl& control) : operation(control), transfer(control) {}
    Operation operation;
    RunningTransfer transfer;
  };
  std::optional<Fetching> busy_;

  bool deleteRuns_ = false;
  // The name that the editor started from, empty while it is hidden, and the slot that it stands in.
  Text editedName_;
  int editedSlot_ = 0;
};

}  // namespace tarnwick
