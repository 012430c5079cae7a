// What the operations on files do to the list.
#include <algorithm>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"
#include "controls/listimage/ctrlListImage.h"

namespace tarnwick {

// --- Upload ---

bool ctrlListImage::ShowsFile(TextView name) const {
  return std::ranges::any_of(
      items_, [&](const Item& item) { return EqualsIgnoringCase(Text(item.record->FileName), name); });
}

void ctrlListImage::ShowUploaded(const FileRecord& record) {
  if (items_.empty()) NoteAccount();
  // What is shown are still another user's files.
  if (ShowsOtherAccount()) return;
  const Text name = record->FileName;
  const auto same = std::ranges::find_if(items_, [&](const Item& item) {
    return item.record == record || EqualsIgnoringCase(Text(item.record->FileName), name);
  });
  if (same != items_.end()) {
    *same = {record, true};
    view_.RefreshItem(static_cast<std::size_t>(same - items_.begin()));
  } else if (ShowsWhenUploaded(name)) {
    items_.push_back({record, true});
    view_.AppendItem();
  }
  reselect_ = true;
  ShowListOrLabel();
  UploadedFileSetFocus(name);
}

// --- Delete ---

void ctrlListImage::DeleteFile() {
  ResultAsItStood(0, [&](int&) {
    // In an event of a delete there is nothing more to delete: what is selected is under way.
    if (deleteRuns_) return;
    const Operation operation(*this);
    const Hourglass pointer(*this);
    if (!Selected()) Fail(ftp_error::kUnavailable, u"No file is selected.");
    if (items_.empty() || !Client() || !CheckShownChangeable()) return;
    if (!CFileUpload::CanDeleteFile()) {
      Fail(ftp_error::kNotAllowed, u"The account may not delete files.");
      return Raise(event::kNotAllowed);
    }
    deleteRuns_ = true;
    ResultAsItStood(0, [&](int&) { DeleteSelected(); });
    deleteRuns_ = false;
    if (IsClosed()) return;
    listing_.isCurrent = false;
    Fill([](const CUpload&) { return false; });
    try {
      Init(currentFilter_);
    } catch (const RuntimeError&) {
      // The account is not empty; what it holds is not known.
      view_.ShowList(true);
      view_.SetHint({});
      if (operation.Succeeds())
        Fail(ftp_error::kNotTaken, u"The files were deleted, but the rest could not be listed.");
    }
    if (items_.empty()) return;
    view_.SelectAlone(0);
    OnSelectionChanged();
  });
}

void ctrlListImage::DeleteSelected() {
  const std::uint32_t filling = filling_;
  const AccountKey account = apartment_.session.Account();
  const std::uint32_t aborts = apartment_.aborts;
  // Where the last record was. The next one follows, so that many deletes stay one walk through the records.
  std::size_t position = 1;
  // What the user selects between two files is not meant.
  std::vector<bool> chosen(items_.size());
  for (std::size_t i = 0; i < chosen.size(); ++i) chosen[i] = view_.IsSelected(i);
  for (std::size_t i = 0; i < chosen.size(); ++i) {
    // The host may fill the list anew, take the client away or log another user on in any event; the rest
    // then stays.
    if (apartment_.session.Account() != account)
      return Fail(ftp_error::kNotLoggedOn, u"The files are those of another user.");
    if (filling != filling_ || IsClosed() || apartment_.aborts != aborts)
      return Fail(ftp_error::kAborted, u"The delete was stopped.");
    if (!chosen[i]) {
      Raise(event::kNotSelected);
      continue;
    }
    const std::shared_ptr<CFileUpload> client = Client();
    if (!client) return;
    const FileRecord record = items_[i].record;
    if (DeleteOnServer(*client, *record)) {
      position = RemoveRecord(Text(record->FileName), position);
      Raise(event::kDeleted);
      RaiseCurrentItem();
    }
    // The next request keeps the thread again.
    Yield();
  }
}

std::size_t ctrlListImage::RemoveRecord(TextView name, std::size_t from) {
  FileList& all = listing_.all;
  const std::size_t count = all.Count();
  for (std::size_t step = 0; step < count; ++step) {
    const std::size_t position = (from - 1 + step) % count + 1;
    if (Trim(Text(all.At(position)->FileName)) != Trim(name)) continue;
    all.Remove(position);
    return position;
  }
  return from;
}

// --- Rename ---

void ctrlListImage::ShowRenamed(const FileRecord& record, const Text&, const Text& oldName,
                                const Text& newName) {
  reselect_ = true;
  // Record and item are one object as a rule, but the item of an older listing has a record of its own.
  const auto item = std::ranges::find_if(
      items_, [&](const Item& shown) { return shown.record == record || shown.record->FileName == oldName; });
  if (item == items_.end()) return;
  if (item->record != record) listing_.GiveName(item->record, newName);
  view_.RefreshItem(static_cast<std::size_t>(item - items_.begin()));
}

}  // namespace tarnwick
