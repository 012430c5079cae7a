// Construction, listing, pages and their pictures. Selection, renaming and the operations on files are in
// ctrlThumbNailViewFiles.cpp.
#include "controls/thumbnailview/ctrlThumbNailView.h"

#include <algorithm>
#include <utility>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"
#include "platform/FileSystem.h"
#include "platform/StringResources.h"
#include "session/ResourceStrings.h"
#include "session/UserFolder.h"
#include "support/PathHelpers.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {
namespace {

constexpr std::uint16_t kNoImagesString = 3582;
constexpr std::uint16_t kLinkStrings[] = {487, 488, 489};

constexpr std::size_t kCaptionLength = 20;

}  // namespace

Text FormatLabelText(TextView name) {
  Text caption(name);
  if (caption.size() > kCaptionLength)
    caption = Text(name.substr(0, 13)) + u"..." + Text(name.substr(name.size() - 4));
  return ReplaceAll(caption, u"&", u"&&");
}

Text FormatTip(const CUpload& file) {
  Text tip = ShownName(Text(file.FileName));
  // What is 2 GiB and more has a negative size after an upload.
  if (file.FileSize >= 0)
    tip +=
        u"\r\n" + SizeText(file.FileSize) + u" Bytes (" + TextFromNumber(Kilobytes(file.FileSize)) + u" KB)";
  if (!file.FileDate.empty()) tip += u"\r\n" + ShownName(Text(file.FileDate));
  return tip;
}

ctrlThumbNailView::ctrlThumbNailView(const ControlParts& parts, ThumbnailPage& page)
    : FileControl(parts, page, TransferEvents::kSilent), page_(page), header_(apartment_.platform.files) {
  listing_.shown.Clear();
}

ctrlThumbNailView::~ctrlThumbNailView() {
  listing_.Forget();
  listing_.shown.Clear();
}

// --- Listing ---

bool ctrlThumbNailView::Init(TextView szFileFilter) {
  return ResultAsItStood(false, [&](bool& done) {
    const Text filter(szFileFilter);
    done = List();
    ResultAsItStood(0, [&](int&) {
      Text link;
      for (const std::uint16_t id : kLinkStrings)
        link += (link.empty() ? u"" : u" ") + GetResourceString(apartment_, id);
      page_.SetEmptyTexts(GetResourceString(apartment_, kNoImagesString), link);
    });
    Show(filter);
    FocusGrid();
  });
}

bool ctrlThumbNailView::List() {
  const Operation operation(*this);
  if (listing_.isLoaded) return true;
  const bool current = listing_.isCurrent;
  listing_.Forget();
  PrepareUserFolder(apartment_);
  if (!ListAccount()) return false;
  // Set before the page pumps messages: what forgets the listing meanwhile is not to be undone.
  listing_.isLoaded = true;
  listing_.isCurrent = current;
  return true;
}

void ctrlThumbNailView::ChangeFileFilter(TextView szFileFilter) {
  ResultAsItStood(0, [&](int&) {
    const Text filter(szFileFilter);
    selectedAddress_.clear();
    Show(filter);
  });
}

bool ctrlThumbNailView::Passes(const CUpload& file) const {
  if (listing_.filter == u"*") return true;
  const Text name = file.FileName;
  return LowerCase(name.substr(name.size() - std::min<std::size_t>(name.size(), 3))) == listing_.filter;
}

void ctrlThumbNailView::Show(const Text& filter) {
  FileList& shown = listing_.shown;
  shown.Clear();
  NoteAccount();
  listing_.filter = filter;
  // A second file of the same address is not shown.
  for (const FileRecord& record : listing_.all)
    if (Passes(*record) && !shown.Find(record->FilePath)) shown.Add(record);
  // What is selected is on the first page.
  keepSelection_ = false;
  const std::size_t selected = shown.PositionOf(selectedAddress_);
  if (selected == 0 || selected > kSlotCount) selectedAddress_.clear();
  // Sets the scroll bar to 0. The user may scroll while the page is filled, so it is not set once more
  // afterwards.
  SetScrollRange();
  scrolledBack_ = false;
  ShowPage(0);
  UpdateSelection();
}

int ctrlThumbNailView::SetScrollRange() {
  const int count = static_cast<int>(listing_.shown.Count());
  // The last page begins with the last row but one; with four pictures or fewer there is one page.
  const int max = count % 2 != 0 ? count - 3 : count - 4;
  page_.EnableScroll(count > kSlotCount);
  page_.SetScrollRange(max);
  SetScrollValue(0);
  return max;
}

void ctrlThumbNailView::SetScrollValue(int value) {
  page_.SetScrollValue(value);
  previousScroll_ = value;
}

// --- Pages ---

void ctrlThumbNailView::ShowPage(int first) {
  nextPage_ = first;
  stopsBeforeNext_ = StopsSoFar();
  if (fillRuns_) return;
  fillRuns_ = true;
  while (nextPage_ && !IsClosed()) {
    // A stop, and a failure, were those of the page before.
    if (busy_) {
      IgnoreStops(stopsBeforeNext_);
      busy_->operation.Succeed();
    }
    ResultAsItStood(0, [&](int&) { FillPage(*std::exchange(nextPage_, std::nullopt)); });
  }
  fillRuns_ = false;
  // The host may start a transfer in the event, so this one ends first.
  if (!busy_) return;
  busy_.reset();
  Raise(event::kBusy, u"-1");
}

void ctrlThumbNailView::FillPage(int first) {
  firstIndex_ = first;
  const Text edited = editedName_.empty() ? Text() : AddressOf(editedSlot_);
  for (int slot = 1; slot <= kSlotCount; ++slot) {
    page_.ClearSlot(slot);
    const std::size_t position = static_cast<std::size_t>(first) + static_cast<std::size_t>(slot);
    const FileList& shown = listing_.shown;
    AddressOf(slot) = position <= shown.Count() ? shown.At(position)->FilePath : Text();
    // A screen reader asks for it when it hears what is selected, which comes before the picture.
    if (position <= shown.Count()) page_.SetTip(slot, FormatTip(*shown.At(position)));
  }
  // A name is edited over its own picture only.
  if (!editedName_.empty() && AddressOf(editedSlot_) != edited) OnEditorLeft();
  // While the account is not listed, nobody knows whether it is empty.
  const bool empty = listing_.all.IsEmpty() && listing_.isLoaded;
  const bool hasHits = empty || !listing_.isLoaded || !listing_.shown.IsEmpty();
  page_.SetGridText(hasHits ? Text() : apartment_.platform.strings.OwnString(kNoHitsString));
  page_.ShowGrid(!empty);
  if (empty) {
    addresses_.fill({});
    page_.EnableScroll(false);
    iImgNo = 0;
    return;
  }
  // The page that was there must not shine through while this one is fetched.
  if (scrolledBack_)
    for (int slot = 1; slot <= kSlotCount; ++slot) page_.ShowSlot(slot, false);
  // What looks selected meanwhile is on this page.
  UpdateSelection();
  for (int slot = 1; slot <= kSlotCount; ++slot) {
    // The list may change in any event of the fill.
    const int position = first + slot;
    FileList& shown = listing_.shown;
    if (position > static_cast<int>(shown.Count())) {
      AddressOf(slot).clear();
      page_.ShowSlot(slot, false);
      continue;
    }
    const FileRecord record = shown.At(static_cast<std::size_t>(position));
    if (!FillSlot(slot, *record)) return;
  }
  UpdateSelection();
}

bool ctrlThumbNailView::FillSlot(int slot, const CUpload& record) {
  FileSystem& files = apartment_.platform.files;
  page_.SetTip(slot, FormatTip(record));
  // Another user's folder is none for these pictures.
  Text copy = ShowsOtherAccount() ? Text() : copies_.PathOf(Text(record.FilePath));
  // Once more when the file was changed in the account meanwhile; not when it was deleted.
  for (int tries = 0; tries < 2 && !copy.empty() && !copies_.Has(record); ++tries) {
    const std::uint32_t changes = apartment_.ChangesOfCopy(copy);
    if (!Fetch(slot, record, copy)) return false;
    if (apartment_.ChangesOfCopy(copy) == changes || !listing_.all.Find(record.FilePath)) break;
    copy = copies_.PathOf(Text(record.FilePath));
  }
  page_.SetCaption(slot, FormatLabelText(Text(record.FileName)));
  AddressOf(slot) = record.FilePath;
  // A picture that cannot be shown leaves the caption and an empty square. It may be a file of another kind,
  // or what came in place of the picture or of a part of it, for which the next page with it asks again.
  if (!copy.empty() && FileExists(files, copy) && !ShowPicture(slot, copy))
    copies_.RemoveUnless(copy, record.FileSize);
  page_.ShowSlot(slot, true);
  return true;
}

bool ctrlThumbNailView::Fetch(int slot, const CUpload& record, const Text& copy) {
  if (!busy_ && TransferRuns()) {
    // The transfer of the host's has the socket; the page is filled again after it.
    fillIsOwed_ = true;
    return true;
  }
  if (!busy_) {
    busy_.emplace(*this);
    Raise(event::kBusy, u"1");
  }
  // A stop is meant for the whole page, and so is the closing of the control in an event.
  if (IsStopped()) {
    FailStopped();
    return !IsReplaced();
  }
  if (IsReplaced()) return false;
  page_.SetCaption(slot, u"Downloading " + ReplaceAll(Text(record.FileName), u"&", u"&&"));
  const bool again = FileExists(apartment_.platform.files, copy);
  Download(Text(record.FilePath), {}, copy, [this] { return IsReplaced(); });
  if (IsReplaced()) return false;
  if (again && !IsStopped()) copies_.AskedAgain(record);
  return true;
}

bool ctrlThumbNailView::ShowPicture(int slot, const Text& copy) {
  return ResultAsItStood(false, [&](bool& shown) {
    // Without one for a format that the header reader does not know, or a header that it does not reach.
    const auto place =
        ResultAsItStood(std::optional<PicturePlace>(), [&](std::optional<PicturePlace>& fitted) {
          header_.ReadImageInfo(copy);
          if (header_.ImageType() != kImageUnknown) fitted = FitImage(header_.Height(), header_.Width());
        });
    shown = page_.SetPicture(slot, copy, place);
  });
}

// As for a picture that is refused when its page is filled.
void ctrlThumbNailView::OnPictureUnreadable(int slot) {
  const CUpload* record = listing_.shown.Find(AddressOf(slot));
  if (record && !ShowsOtherAccount())
    copies_.RemoveUnless(copies_.PathOf(Text(record->FilePath)), record->FileSize);
}

Text ctrlThumbNailView::NameOf(int slot) const {
  const CUpload* record = listing_.shown.Find(AddressOf(slot));
  return record ? Text(record->FileName) : Text(FileNameFromUrl(AddressOf(slot)));
}

Text ctrlThumbNailView::PlaceOfPage() const {
  const FileList& shown = listing_.shown;
  const auto count = static_cast<int>(shown.Count());
  const auto first = static_cast<int>(shown.PositionOf(AddressOf(1)));
  if (first == 0) return {};
  const int last = std::min(first + kSlotCount - 1, count);
  const Text end = last == first ? Text() : u" to " + TextFromNumber(last);
  return TextFromNumber(first) + end + u" of " + TextFromNumber(count);
}

void ctrlThumbNailView::TransferEnded() {
  if (std::exchange(fillIsOwed_, false) && !IsClosed()) ShowPage(firstIndex_);
}

void ctrlThumbNailView::OnScrollChanged(int value) {
  // The bar stays enabled: while the page waits for its pictures, the user may go on to another one.
  ResultAsItStood(0, [&](int&) {
    scrolledBack_ = value < previousScroll_;
    previousScroll_ = value;
    if (value < static_cast<int>(listing_.shown.Count())) {
      ShowPage(value);
      UpdateSelection();
    }
    // Another control may have changed the number of pictures meanwhile.
    page_.EnableScroll(listing_.shown.Count() > kSlotCount);
  });
}

void ctrlThumbNailView::OnScrollDragged(int value) {
  ResultAsItStood(0, [&](int&) {
    if (value == 0) {
      firstIndex_ = 0;
      // Other than in OnScrollChanged it is the number of all files that counts.
    } else if (value < static_cast<int>(listing_.all.Count())) {
      ShowPage(value);
      UpdateSelection();
    }
  });
}

void ctrlThumbNailView::ShowItem(std::size_t position) {
  ShowFrom(static_cast<int>(position - 1) / 2 * 2, position);
}

void ctrlThumbNailView::ShowFrom(int first, std::optional<std::size_t> position) {
  first = std::clamp(first, 0, std::max(0, SetScrollRange()));
  selectedAddress_ = listing_.shown.At(position.value_or(static_cast<std::size_t>(first) + 1))->FilePath;
  // The page does not choose a selection of its own.
  selectionFirstIndex_ = first;
  firstIndex_ = first;
  SetScrollValue(first);
  scrolledBack_ = false;
  ShowPage(first);
  UpdateSelection();
}

}  // namespace tarnwick
