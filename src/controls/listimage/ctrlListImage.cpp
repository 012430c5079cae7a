// Construction, listing, selection, and what the user does. The operations on files are in
// ctrlListImageFiles.cpp.
#include "controls/listimage/ctrlListImage.h"

#include <array>
#include <utility>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"
#include "platform/StringResources.h"
#include "session/ResourceStrings.h"
#include "session/UserFolder.h"

namespace tarnwick {
namespace {

constexpr std::array<ListColumn, 3> kColumns{
    {{u"filename", u"File Name"}, {u"filepath", u"File Path"}, {u"filesize", u"File Size"}}};
constexpr std::uint16_t kNoImagesString = 3582;

constexpr std::int32_t kUpKey = 38;
constexpr std::int32_t kDownKey = 40;

constexpr ItemPicture kGifPicture{2, 4};
constexpr ItemPicture kJpegPicture{4, 5};

bool IsGif(const CUpload& record) {
  return EndsWithIgnoringCase(Text(record.FileName), u"gif");
}
bool IsJpg(const CUpload& record) {
  return EndsWithIgnoringCase(Text(record.FileName), u"jpg");
}

}  // namespace

ctrlListImage::ctrlListImage(const ControlParts& parts, ListView& view)
    : FileControl(parts, view, TransferEvents::kTold), view_(view) {
  view_.SetLabelText(
      ResultAsItStood(Text(), [&](Text& label) { label = GetResourceString(apartment_, kNoImagesString); }));
}

ctrlListImage::~ctrlListImage() {
  listing_.isCurrent = false;
}

// --- Listing ---

bool ctrlListImage::Init(TextView szFileFilter) {
  Text filter(szFileFilter);
  const Operation operation(*this);
  // Until the listing is there, the thumbnails have none either.
  const bool loaded = listing_.isLoaded;
  if (!listing_.isCurrent) listing_.Forget();
  if (!Client()) throw RuntimeError(init_error::kNoClient);
  PrepareUserFolder(apartment_);
  if (!ListAccount()) throw RuntimeError(init_error::kListingFailed);
  listing_.isLoaded = loaded;
  ShowListOrLabel();
  view_.SetColumns(kColumns);
  currentFilter_ = std::move(filter);
  // Letter case counts here, other than in ChangeFileFilter: hosts rely on both.
  if (currentFilter_ == u"*") {
    Fill([](const CUpload&) { return true; });
  } else if (currentFilter_ == u"gif") {
    Fill(IsGif);
  } else if (currentFilter_ == u"jpg") {
    Fill(IsJpg);
  } else {
    Fill([](const CUpload&) { return false; });
  }
  listing_.isCurrent = true;
  return true;
}

void ctrlListImage::ChangeFileFilter(TextView szFileFilter) {
  ResultAsItStood(0, [&](int&) {
    const Text previous = reselect_ ? SelectedFileName() : Text();
    const Text filter = LowerCase(szFileFilter);
    if (filter == u"gif") {
      currentFilter_ = filter;
      Fill(IsGif);
    } else if (filter == u"jpg") {
      currentFilter_ = filter;
      Fill(IsJpg);
    } else {
      currentFilter_ = u"*";
      Fill([](const CUpload&) { return true; });
    }
    if (!reselect_ || items_.empty()) return;
    std::size_t again = 0;
    for (std::size_t i = 0; i < items_.size(); ++i) {
      if (!EqualsIgnoringCase(Text(items_[i].record->FileName), previous)) continue;
      again = i;
      break;
    }
    view_.SelectAlone(again);
  });
}

void ctrlListImage::Fill(const std::function<bool(const CUpload&)>& shows) {
  items_.reserve(listing_.all.Count());
  std::size_t count = 0;
  for (const FileRecord& record : listing_.all) {
    if (!shows(*record)) continue;
    if (count == items_.size()) items_.emplace_back();
    Item& item = items_[count++];
    // Counting references touches each record; most stay where they are.
    if (item.record != record) item.record = record;
    item.uploaded = false;
  }
  items_.resize(count);
  NoteAccount();
  ++filling_;
  view_.SetItemCount(items_.size());
  ShowHint();
}

void ctrlListImage::ShowListOrLabel() {
  view_.ShowList(!listing_.all.IsEmpty());
  ShowHint();
}

void ctrlListImage::ShowHint() {
  const bool hasHits = !items_.empty() || listing_.all.IsEmpty();
  view_.SetHint(hasHits ? Text() : apartment_.platform.strings.OwnString(kNoHitsString));
}

bool ctrlListImage::ShowsWhenUploaded(TextView name) const {
  const Text filter = LowerCase(currentFilter_);
  return (filter != u"gif" && filter != u"jpg") || EndsWithIgnoringCase(name, filter);
}

// --- Selection ---

std::optional<std::size_t> ctrlListImage::NextSelected(std::size_t from) const {
  const auto selected = view_.NextSelected(from);
  return selected && *selected < items_.size() ? selected : std::nullopt;
}

FileRecord ctrlListImage::SelectedRecord() const {
  const auto selected = Selected();
  return selected ? items_[*selected].record : nullptr;
}

std::vector<Text> ctrlListImage::GetFileNames() const {
  std::vector<Text> names;
  for (auto at = Selected(); at; at = NextSelected(*at + 1)) names.push_back(items_[*at].record->FileName);
  return names;
}

void ctrlListImage::UploadedFileSetFocus(TextView szFileName) {
  const Text name(szFileName);
  view_.Focus();
  for (std::size_t i = 0; i < items_.size(); ++i) {
    if (items_[i].record->FileName != name) continue;
    view_.SelectAlone(i);
    return;
  }
}

// --- What the view asks ---

Text ctrlListImage::ItemText(std::size_t index, int column) const {
  if (index >= items_.size()) return {};
  const Item& item = items_[index];
  if (column == 0) return item.record->FileName;
  if (column == 1) return item.record->FilePath;
  if (column != 2) return {};
  const Text bytes = SizeText(item.record->FileSize);
  const Text kilobytes = TextFromNumber(Kilobytes(item.record->FileSize));
  return item.uploaded ? bytes + u"Bytes (" + kilobytes + u"KB)" : bytes + u" Bytes (" + kilobytes + u" KB)";
}

ItemPicture ctrlListImage::PictureOf(std::size_t index) const {
  if (index >= items_.size()) return kJpegPicture;
  const Text filter = LowerCase(currentFilter_);
  const bool gif = filter == u"gif" ||
                   (filter != u"jpg" && EndsWithIgnoringCase(Text(items_[index].record->FileName), u".gif"));
  return gif ? kGifPicture : kJpegPicture;
}

std::optional<std::size_t> ctrlListImage::FindItem(TextView prefix, std::size_t start) const {
  for (std::size_t step = 0; step < items_.size(); ++step) {
    const std::size_t at = (start + step) % items_.size();
    if (StartsWithIgnoringCase(Text(items_[at].record->FileName), prefix)) return at;
  }
  return std::nullopt;
}

// --- What the user does ---

void ctrlListImage::OnKeyDown(std::int32_t keyCode) {
  if ((keyCode == kUpKey || keyCode == kDownKey) && !items_.empty()) RaiseCurrentItem();
}

void ctrlListImage::OnEnter() {
  Raise(event::kClickEnds);
}

void ctrlListImage::OnSelectionChanged() {
  RaiseCurrentItem();
}

void ctrlListImage::OnClick() {
  Raise(event::kClickBegins);
  if (!SelectedFileName().empty()) RaiseCurrentItem();
  Raise(event::kClickEnds);
}

void ctrlListImage::OnMouseButton() {
  // A button on an item raises nothing here: the click that follows does.
  if (mobjFileupload && SelectedFileName().empty()) Raise(event::kCurrentItem);
}

bool ctrlListImage::OnBeforeLabelEdit() const {
  return bRenameEnabled && !RenameRuns() && !IsClosed() && !ShowsOtherAccount();
}

bool ctrlListImage::OnAfterLabelEdit(std::size_t index, TextView newText) {
  return ResultAsItStood(false, [&](bool& renamed) {
    if (!bRenameEnabled || index >= items_.size()) return;
    if (ShowsOtherAccount()) {
      const Operation operation(*this);
      CheckShownChangeable();
      return Raise(event::kRenameFailed);
    }
    const Text oldName = items_[index].record->FileName;
    Text newName(newText);
    // An emptied or untouched label means that the user changed his mind.
    if (Trim(newName).empty() || newName == oldName) return;
    if (!CheckEditedName(newName)) return;
    CheckFileExtension(newName, ExtensionOf(oldName));
    if (Trim(newName) != oldName) renamed = RenameFile(oldName, newName);
  });
}

void ctrlListImage::DroppedNoFiles(bool own) {
  if (own) Raise(event::kOwnDrop);
}

}  // namespace tarnwick
