// The list control: shows the files of the account as a list with name, address and size, and uploads,
// deletes, renames and downloads them. This class is all of its rules; the window (ListView) draws and tells
// what the user does, the surface is the control that hosts see.
#pragma once

#include "controls/FileControl.h"
#include "controls/listimage/ListView.h"
#include "controls/listimage/ListViewUser.h"

namespace tarnwick {

class ctrlListImage final : public FileControl, public ListViewUser {
 public:
  ctrlListImage(const ControlParts& parts, ListView& view);
  // The next control lists from the server again.
  ~ctrlListImage() override;

  // --- Listing ---

  // Fills the list from the service, or from the records of the last listing while they are current. Filters
  // are "*", "gif" and "jpg" in exactly this spelling; any other shows nothing. Throws an init_error; the
  // list is then as it was.
  bool Init(TextView szFileFilter) override;

  // Shows the cached records again through another filter: "gif" and "jpg" in any letter case, else all.
  void ChangeFileFilter(TextView szFileFilter) override;

  // --- Selection ---

  // Names of all selected items in list order.
  std::vector<Text> GetFileNames() const;
  void SetMultiSelectProperty(bool bVal) { view_.SetMultiSelect(bVal); }
  void ListViewSetFocus() { view_.Focus(); }
  void UploadedFileSetFocus(TextView szFileName) override;

  // --- Operations ---

  // Deletes every selected item's file.
  void DeleteFile() override;
  void StartLabelExit() { view_.EndLabelEdit(); }

  // --- What the view asks ---

  std::size_t ItemCount() const { return items_.size(); }
  Text ItemText(std::size_t index, int column) const override;
  ItemPicture PictureOf(std::size_t index) const override;
  std::optional<std::size_t> FindItem(TextView prefix, std::size_t start) const override;

  // --- What the user does ---

  void OnKeyDown(std::int32_t keyCode) override;
  void OnEnter() override;
  void OnSelectionChanged() override;
  void OnClick() override;
  void OnMouseButton() override;
  bool OnBeforeLabelEdit() const override;
  bool OnAfterLabelEdit(std::size_t index, TextView newText) override;

 private:
  // One line of the list. The record is shared with the list of all files.
  struct Item {
    FileRecord record;
    // Shown since an upload, which spells the size in its own way until the list is filled again.
    bool uploaded = false;
  };

  FileRecord SelectedRecord() const override;
  bool ShowsFile(TextView name) const override;
  void ShowUploaded(const FileRecord& record) override;
  void ShowRenamed(const FileRecord& record, const Text& oldUrl, const Text& oldName,
                   const Text& newName) override;
  void DroppedNoFiles(bool own) override;

  std::optional<std::size_t> Selected() const { return NextSelected(0); }
  std::optional<std::size_t> NextSelected(std::size_t from) const;

  // Puts the records that `shows` lets pass into the list.
  void Fill(const std::function<bool(const CUpload&)>& shows);
  void ShowListOrLabel();
  // Says so when there are files, but the filter lets none pass.
  void ShowHint();
  bool ShowsWhenUploaded(TextView name) const;

  void DeleteSelected();
  // Removes the record of that name, searching from `from` on and then from the start. Returns where it was.
  std::size_t RemoveRecord(TextView name, std::size_t from);

  ListView& view_;
  std::vector<Item> items_;
  // Counts the fillings, so that a walk through the items sees that they are others now.
  std::uint32_t filling_ = 0;
  Text currentFilter_ = u"*";
  bool reselect_ = false;
  bool deleteRuns_ = false;
};

}  // namespace tarnwick
