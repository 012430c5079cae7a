// Selection, renaming, deleting and what the user does.
#include <algorithm>
#include <utility>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"
#include "controls/thumbnailview/ctrlThumbNailView.h"
#include "session/TransferLists.h"
#include "support/PathHelpers.h"

namespace tarnwick {
namespace {

constexpr int kEnterKey = 13;
constexpr int kDeleteKey = 46;
constexpr int kF2Key = 113;
constexpr int kF5Key = 116;

// Equal to the address of no picture.
constexpr TextView kNoAddress = u"   ";

// Whether no file may have a name that begins like this: a dot or a blank, or the name of a device.
bool BeginsUnfit(TextView name) {
  if (name.empty() || name.front() == u'.' || name.front() == u' ') return true;
  if (name.size() > 3 && name[3] != u'.') return false;
  const Text device = LowerCase(name.substr(0, 3));
  return device == u"con" || device == u"prn" || device == u"aux" || device == u"nul";
}

}  // namespace

// --- Selection ---

void ctrlThumbNailView::UpdateSelection() {
  ResultAsItStood(0, [&](int&) {
    const FileList& shown = listing_.shown;
    if (Trim(selectedAddress_).empty() && !shown.IsEmpty()) selectedAddress_ = shown.At(1)->FilePath;
    if (firstIndex_ != selectionFirstIndex_ && !keepSelection_ && !shown.IsEmpty()) {
      const auto first = static_cast<std::size_t>(page_.ScrollValue());
      if (first < shown.Count()) selectedAddress_ = shown.At(first + 1)->FilePath;
      selectionFirstIndex_ = firstIndex_;
    }
    if (selectedAddress_.empty()) selectedAddress_ = kNoAddress;
    int selected = SlotOf(selectedAddress_);
    // One slot always looks selected. Where that is not the selected picture, which is on another page then,
    // nothing deletes or renames.
    if (selected == 0 && !shown.IsEmpty()) selected = 1;
    for (int slot = 1; slot <= kSlotCount; ++slot) page_.SetSelected(slot, slot == selected);
    iImgNo = static_cast<std::int16_t>(selected);
    // A page that is filled takes the focus from nobody.
    if (page_.HasFocus()) FocusGrid();
  });
}

void ctrlThumbNailView::FocusGrid() {
  if (!listing_.all.IsEmpty() && editedName_.empty()) page_.Focus();
}

int ctrlThumbNailView::SlotOf(TextView address) const {
  if (Trim(address).empty()) return 0;
  const auto slot = std::ranges::find(addresses_, address);
  return slot == addresses_.end() ? 0 : static_cast<int>(slot - addresses_.begin()) + 1;
}

FileRecord ctrlThumbNailView::SelectedRecord() const {
  const std::size_t position = listing_.shown.PositionOf(selectedAddress_);
  return position == 0 ? nullptr : listing_.shown.At(position);
}

bool ctrlThumbNailView::ShowsFile(TextView name) const {
  return listing_.shown.PositionWhere(
             [&](const CUpload& file) { return EqualsIgnoringCase(Text(file.FileName), name); }) != 0;
}

void ctrlThumbNailView::UploadedFileSetFocus(TextView szFileName) {
  ResultAsItStood(0, [&](int&) {
    const std::size_t position =
        listing_.shown.PositionWhere([&](const CUpload& file) { return file.FileName == szFileName; });
    // Another one than what was uploaded last.
    if (position != 0) {
      keepSelection_ = false;
      ShowItem(position);
    }
    page_.Focus();
  });
}

void ctrlThumbNailView::RaiseSelection() {
  Raise(event::kClickBegins);
  Raise(event::kCurrentItem, Text(selectedAddress_));
}

// --- Operations ---

void ctrlThumbNailView::ShowUploaded(const FileRecord& record) {
  FileList& shown = listing_.shown;
  if (shown.IsEmpty()) NoteAccount();
  if (ShowsOtherAccount()) return;
  const Text name = record->FileName;
  // The shown record may be one of an older listing.
  std::size_t position = shown.PositionWhere([&](const CUpload& file) {
    return &file == record.get() || EqualsIgnoringCase(Text(file.FileName), name);
  });
  if (position != 0) {
    shown.Remove(position);
  } else if (Passes(*record)) {
    position = shown.Count() + 1;
  }
  if (position == 0) return;
  shown.Insert(position, record);
  keepSelection_ = true;
  ShowItem(position);
}

void ctrlThumbNailView::DeleteFile() {
  ResultAsItStood(0, [&](int&) {
    if (deleteRuns_) return;
    const Operation operation(*this);
    const Hourglass pointer(*this);
    const std::shared_ptr<CFileUpload> client = Client();
    if (!client) return;
    if (!CFileUpload::CanDeleteFile()) {
      Fail(ftp_error::kNotAllowed, u"The account may not delete files.");
      return Raise(event::kNotAllowed);
    }
    const FileRecord record = SlotOf(selectedAddress_) != 0 ? SelectedRecord() : nullptr;
    if (!record) Fail(ftp_error::kUnavailable, u"No file on the page is selected.");
    if (!record || !CheckShownChangeable()) return Raise(event::kNotSelected);
    deleteRuns_ = true;
    const bool deleted = ResultAsItStood(false, [&](bool& gone) {
      gone = DeleteOnServer(*client, *record);
      if (gone) RemoveFromTransferLists(apartment_, Text(record->FileName));
    });
    deleteRuns_ = false;
    if (!deleted) return;
    Raise(event::kDeleted);
    if (IsClosed()) return;
    keepSelection_ = false;
    if (listing_.shown.IsEmpty()) {
      selectedAddress_.clear();
      SetScrollRange();
      ShowPage(0);
      return UpdateSelection();
    }
    ShowFrom(firstIndex_, std::nullopt);
    RaiseSelection();
  });
}

void ctrlThumbNailView::ShowRenamed(const FileRecord& record, const Text& oldUrl, const Text& oldName,
                                    const Text& newName) {
  FileList& shown = listing_.shown;
  const std::size_t position = shown.PositionWhere(
      [&](const CUpload& file) { return &file == record.get() || file.FileName == oldName; });
  if (position == 0) return;
  const FileRecord renamed = shown.At(position);
  // A record of an older listing is not in the list of all files.
  const Text before = renamed == record ? oldUrl : renamed->FilePath;
  if (renamed != record) listing_.GiveName(renamed, newName);
  if (selectedAddress_ == before) selectedAddress_ = renamed->FilePath;
  for (int slot = 1; slot <= kSlotCount; ++slot) {
    if (AddressOf(slot) != before) continue;
    AddressOf(slot) = renamed->FilePath;
    page_.SetCaption(slot, FormatLabelText(newName));
    page_.SetTip(slot, FormatTip(*renamed));
  }
}

void ctrlThumbNailView::SetLabelText(TextView szString) {
  if (const int slot = SlotOf(selectedAddress_)) page_.SetCaption(slot, FormatLabelText(szString));
}

void ctrlThumbNailView::SetCaptionOf(TextView name, TextView caption) {
  for (int slot = 1; slot <= kSlotCount; ++slot)
    if (FileNameFromUrl(AddressOf(slot)) == name) page_.SetCaption(slot, FormatLabelText(caption));
}

void ctrlThumbNailView::ValidateFileName(Text& NewString) {
  const Text edited = std::exchange(editedName_, Text());
  if (edited.empty())
    return GiveNewName(NewString, SlotOf(selectedAddress_) != 0 ? SelectedFileName() : Text());
  page_.HideEditor();
  GiveNewName(NewString, edited);
}

void ctrlThumbNailView::GiveNewName(Text& NewString, const Text& oldName) {
  ResultAsItStood(0, [&](int&) {
    const Operation operation(*this);
    const auto keepName = [&](std::int16_t code) {
      SetCaptionOf(oldName, oldName);
      Raise(code);
    };
    NewString = Text(Trim(NewString));
    if (BeginsUnfit(NewString)) {
      Fail(ftp_error::kNameNotAllowed, u"The file's name is not allowed.");
      return keepName(event::kNameUnfit);
    }
    if (oldName.empty()) Fail(ftp_error::kUnavailable, u"No file is selected.");
    if (oldName.empty() || !CheckShownChangeable()) return keepName(event::kRenameFailed);
    CheckFileExtension(NewString, ExtensionOf(oldName));
    // The caption may show what was typed, such as the name without its extension.
    if (NewString == oldName) return keepName(event::kRenamed);
    if (listing_.shown.PositionWhere([&](const CUpload& file) {
          return EqualsIgnoringCase(Trim(Text(file.FileName)), NewString);
        }) != 0) {
      Fail(ftp_error::kNameNotAllowed, u"The account has a file of that name.");
      return keepName(event::kNameTaken);
    }
    const Hourglass pointer(*this);
    if (!Rename(oldName, NewString)) return keepName(event::kRenameFailed);
    Raise(event::kRenamed);
  });
}

// --- What the user does ---

void ctrlThumbNailView::OnSlotPressed(int slot, bool rightButton) {
  const Text pressed = AddressOf(slot);
  if (pressed.empty()) return OnBackgroundPressed(rightButton);
  keepSelection_ = false;
  selectionFirstIndex_ = firstIndex_;
  selectedAddress_ = pressed;
  UpdateSelection();
  RaiseSelection();
  if (rightButton) Raise(event::kContextMenu, Text(selectedAddress_));
}

void ctrlThumbNailView::OnBackgroundPressed(bool rightButton) {
  if (rightButton) Raise(event::kContextMenu, Text(selectedAddress_));
}

void ctrlThumbNailView::OnKeyDown(int keyCode) {
  switch (keyCode) {
    case kDeleteKey:
      RaiseSelection();
      return Raise(event::kDeleteKey, Text(selectedAddress_));
    case kF5Key:
      return Raise(event::kRefreshKey);
    case kF2Key:
      if (!bRenameEnabled) return;
      Raise(event::kRenameKey);
      if (const FileRecord record = SelectedRecord();
          record && SlotOf(selectedAddress_) != 0 && !IsClosed()) {
        editedName_ = record->FileName;
        editedSlot_ = SlotOf(selectedAddress_);
        page_.ShowEditor(editedSlot_, editedName_);
      }
      return;
    case kEnterKey:
      RaiseSelection();
      return Raise(event::kClickEnds, Text(selectedAddress_));
    default:
      return;
  }
}

void ctrlThumbNailView::OnLinkClicked() {
  Raise(event::kQuickStart, u"Show QST");
}

void ctrlThumbNailView::OnSwitchView() {
  Raise(event::kSwitchView, u"5554");
}

void ctrlThumbNailView::OnEditorEntered() {
  if (editedName_.empty()) return;
  Text name = page_.EditorText();
  // Hiding the editor takes the focus from it, which would end the editing.
  const Text oldName = std::exchange(editedName_, Text());
  const bool valid = CheckEditedName(name);
  SetCaptionOf(oldName, valid ? name : oldName);
  page_.HideEditor();
  page_.Focus();
  if (valid) GiveNewName(name, oldName);
}

void ctrlThumbNailView::OnEditorLeft() {
  if (std::exchange(editedName_, Text()).empty()) return;
  page_.HideEditor();
}

// --- Drag and drop ---

void ctrlThumbNailView::OnFilesEnter() {
  Raise(event::kDragOver, Text(selectedAddress_));
}

void ctrlThumbNailView::DroppedNoFiles(bool) {
  Raise(event::kOwnDrop);
}

bool ctrlThumbNailView::TakeStopOfDrop() {
  return std::exchange(apartment_.abortTransfer, false);
}

}  // namespace tarnwick
