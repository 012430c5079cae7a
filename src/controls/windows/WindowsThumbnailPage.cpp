#include "controls/windows/WindowsThumbnailPage.h"

#include <algorithm>
#include <string>
#include <utility>

#include "base/RuntimeError.h"
#include "controls/windows/Drawing.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/CommonControls.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {
namespace {

using layout::kCaption;
using layout::kFrames;

constexpr wchar_t kClassName[] = L"TarnwickThumbNailView";
// Names for screen readers.
constexpr wchar_t kPageName[] = L"Pictures of the account";
constexpr wchar_t kScrollName[] = L"Pages";
constexpr wchar_t kEditorName[] = L"New name";
constexpr wchar_t kSlotName[] = L"Picture ";
constexpr wchar_t kSwitchText[] = L"List view";

// In pixels at 96 dots per inch; a longer line goes on below.
constexpr int kTipWidth = 400;

const wchar_t* ReasonOf(PictureFault fault) {
  switch (fault) {
    case PictureFault::kDamaged:
      return L"Not shown: the file is damaged, or this system cannot read it.";
    case PictureFault::kTooLarge:
      return L"Not shown: the picture is too large.";
    case PictureFault::kOtherKind:
      return L"Not shown: this is another kind of file.";
    case PictureFault::kNone:
      break;
  }
  return L"";
}

constexpr COLORREF kLinkColor = RGB(0, 0, 255);

constexpr UINT kTextFormat = DT_CENTER | DT_WORDBREAK | DT_NOPREFIX;

// Between a text of the empty account and the edge of its label, in twips.
constexpr int kLabelIndent = 60;
constexpr int kLabelInset = 45;

}  // namespace

WindowsThumbnailPage::WindowsThumbnailPage(HINSTANCE module, ControlWindowUser& control)
    : ControlWindow(module, kClassName, control), workers_([this](const auto& request, ShownPicture picture) {
        TakePicture(request, std::move(picture));
      }) {}

WindowsThumbnailPage::~WindowsThumbnailPage() {
  DisconnectAccessibles();
}

// --- The windows ---

bool WindowsThumbnailPage::MakeChildren() {
  // The system's own classes, so that screen readers know what they are.
  const HWND outer = Outer();
  SetWindowTextW(outer, kPageName);
  gridWindow_ =
      MakeChild(outer, L"STATIC", kPageName, WS_TABSTOP | WS_CLIPCHILDREN | SS_OWNERDRAW | SS_NOTIFY);
  // The editor lies above the slots. What stands before it is its name, even if it is never shown.
  MakeChild(gridWindow_, L"STATIC", kEditorName, SS_NOPREFIX);
  editorWindow_ = MakeChild(gridWindow_, L"EDIT", L"", WS_BORDER | WS_CLIPSIBLINGS | ES_AUTOHSCROLL);
  for (std::size_t slot = 0; slot < kSlotCount; ++slot)
    slots_[slot].window = MakeChild(gridWindow_, L"STATIC", L"", WS_CLIPSIBLINGS | SS_OWNERDRAW | SS_NOTIFY);
  scrollWindow_ = MakeChild(outer, L"SCROLLBAR", kScrollName, WS_TABSTOP | SBS_VERT);
  messageWindow_ = MakeChild(outer, L"STATIC", L"", SS_OWNERDRAW);
  linkWindow_ = MakeChild(outer, L"BUTTON", L"", WS_TABSTOP | BS_OWNERDRAW);
  switchWindow_ = MakeChild(outer, L"BUTTON", kSwitchText, WS_TABSTOP | WS_VISIBLE | BS_PUSHBUTTON);
  for (const HWND window :
       {gridWindow_, editorWindow_, scrollWindow_, messageWindow_, linkWindow_, switchWindow_})
    if (!window) return false;
  for (int slot = 1; slot <= kSlotCount; ++slot) {
    if (!At(slot).window) return false;
    ApplyCaption(slot);
  }
  PlaceChildren();
  scrollBar_.SetWindow(scrollWindow_);
  ApplyContent();
  return true;
}

// All but the labels of an empty account, whose places depend on their texts.
void WindowsThumbnailPage::PlaceChildren() const {
  const auto place = [this](HWND window, const layout::TwipRect& area) {
    const RECT at = Pixels(area);
    MoveWindow(window, at.left, at.top, at.right - at.left, at.bottom - at.top, TRUE);
  };
  place(gridWindow_, layout::kGrid);
  for (std::size_t slot = 0; slot < kSlotCount; ++slot) place(slots_[slot].window, kFrames[slot]);
  place(scrollWindow_, layout::kScrollBar);
  place(switchWindow_, layout::kButton);
}

void WindowsThumbnailPage::DpiChanged(int before) {
  PlaceChildren();
  for (Slot& slot : slots_) {
    // Until it is loaded anew, or for good when its file is gone.
    RECT& place = slot.place;
    for (LONG* side : {&place.left, &place.top, &place.right, &place.bottom})
      *side = MulDiv(*side, Dpi(), before);
    if (slot.picture || slot.awaited) LoadPictureOf(slot);
  }
  PlaceEditor();
}

void WindowsThumbnailPage::WindowGone() {
  gridWindow_ = scrollWindow_ = messageWindow_ = linkWindow_ = switchWindow_ = editorWindow_ = nullptr;
  for (Slot& slot : slots_) slot.window = nullptr;
  tips_ = {};
  scrollBar_.SetWindow(nullptr);
  DisconnectAccessibles();
  toldSlot_ = edited_ = 0;
  tellingFocus_ = tellingEditor_ = false;
  dragFrom_.reset();
}

void WindowsThumbnailPage::ApplyLook() {
  for (const HWND window : {editorWindow_, switchWindow_})
    SendMessageW(window, WM_SETFONT, reinterpret_cast<WPARAM>(Font()), TRUE);
  ApplyTexts();
  RefreshGrid();
}

FontOwner WindowsThumbnailPage::LinkFont() const {
  LOGFONTW font = {};
  GetObjectW(Font(), sizeof font, &font);
  font.lfUnderline = TRUE;
  return FontOwner(CreateFontIndirectW(&font));
}

void WindowsThumbnailPage::RefreshGrid() const {
  if (gridWindow_) RedrawWindow(gridWindow_, nullptr, nullptr, RDW_INVALIDATE | RDW_ERASE | RDW_ALLCHILDREN);
}

int WindowsThumbnailPage::SlotOf(HWND window) const {
  for (std::size_t slot = 0; slot < kSlotCount; ++slot)
    if (slots_[slot].window == window) return static_cast<int>(slot) + 1;
  return 0;
}

HWND WindowsThumbnailPage::FirstStop() const {
  return content_ == Content::kGrid           ? gridWindow_
         : content_ == Content::kEmptyAccount ? linkWindow_
                                              : switchWindow_;
}

void WindowsThumbnailPage::Focus() {
  // A window inside that has just got the focus keeps it. A page that nobody sees takes it from nobody.
  if (!tellingFocus_ && IsWindowVisible(Outer())) SetFocus(FirstStop());
}

bool WindowsThumbnailPage::HasFocus() const {
  const HWND outer = Outer();
  const HWND focus = GetFocus();
  return outer && (focus == outer || IsChild(outer, focus));
}

bool WindowsThumbnailPage::MoveFocus(bool backward) {
  std::array stops = {gridWindow_, scrollWindow_, linkWindow_, switchWindow_};
  if (backward) std::reverse(stops.begin(), stops.end());
  const HWND focus = GetFocus();
  const auto current = std::find(stops.begin(), stops.end(), focus == editorWindow_ ? gridWindow_ : focus);
  if (current == stops.end()) return false;
  const auto next = std::find_if(current + 1, stops.end(),
                                 [](HWND stop) { return IsWindowVisible(stop) && IsWindowEnabled(stop); });
  if (next == stops.end()) return false;
  SetFocus(*next);
  return true;
}

// --- What the rules show ---

void WindowsThumbnailPage::ShowGrid(bool grid) {
  content_ = grid ? Content::kGrid : Content::kEmptyAccount;
  if (grid)
    for (Slot& slot : slots_) slot.shown = true;
  else
    HideEditor();
  ApplyContent();
}

void WindowsThumbnailPage::ApplyContent() const {
  if (!gridWindow_) return;
  const bool grid = content_ == Content::kGrid;
  const bool texts = content_ == Content::kEmptyAccount;
  for (const Slot& slot : slots_) ShowWindow(slot.window, slot.shown ? SW_SHOWNA : SW_HIDE);
  // First what comes, so that the focus finds a place to go to.
  const std::array windows = {gridWindow_, scrollWindow_, messageWindow_, linkWindow_};
  const std::array shown = {grid, grid, texts, texts};
  for (std::size_t i = 0; i < windows.size(); ++i)
    if (shown[i]) ShowWindow(windows[i], SW_SHOWNA);
  for (std::size_t i = 0; i < windows.size(); ++i)
    if (!shown[i]) ShowWindow(windows[i], SW_HIDE);
}

void WindowsThumbnailPage::SetEmptyTexts(TextView message, TextView link) {
  message_ = message;
  link_ = link;
  ApplyTexts();
}

void WindowsThumbnailPage::SetGridText(TextView text) {
  if (gridText_ == text) return;
  gridText_ = text;
  if (!gridWindow_) return;
  InvalidateRect(gridWindow_, nullptr, FALSE);
  NotifyWinEvent(EVENT_OBJECT_VALUECHANGE, gridWindow_, OBJID_CLIENT, CHILDID_SELF);
}

void WindowsThumbnailPage::ApplyTexts() const {
  if (!linkWindow_) return;
  SetWindowTextW(messageWindow_, WideFromText(message_).c_str());
  SetWindowTextW(linkWindow_, WideFromText(link_).c_str());
  // Only over its text is the link a link.
  const auto [message, link] = LabelPlaces(DcOf(linkWindow_).Get().dc);
  for (const auto& [window, place] : {std::pair(messageWindow_, message), std::pair(linkWindow_, link)}) {
    MoveWindow(window, place.left, place.top, place.right - place.left, place.bottom - place.top, TRUE);
    InvalidateRect(window, nullptr, TRUE);
  }
}

// As wide as the text, with as many lines as it takes, in the middle of `room`.
RECT WindowsThumbnailPage::LabelPlace(HDC dc, HFONT font, TextView text, RECT room) const {
  const SelectionOwner selected = SelectInto(dc, font);
  InflateRect(&room, -Pixels(kLabelIndent), -Pixels(kLabelInset));
  RECT lines = room;
  DrawTextW(dc, WideFromText(text).c_str(), -1, &lines, kTextFormat | DT_CALCRECT);
  lines.right = std::min(lines.right, room.right);
  OffsetRect(&lines, (room.right - lines.right) / 2, 0);
  InflateRect(&lines, Pixels(kLabelIndent), Pixels(kLabelInset));
  return lines;
}

// In a large font the message takes more lines, and the link goes down.
std::pair<RECT, RECT> WindowsThumbnailPage::LabelPlaces(HDC dc) const {
  const RECT message = LabelPlace(dc, Font(), message_, Pixels(layout::kMessage));
  RECT room = Pixels(layout::kLink);
  room.top = std::max(room.top, message.bottom + Pixels(layout::kLink.top - layout::kMessage.bottom));
  return {message, LabelPlace(dc, LinkFont().Get(), link_, room)};
}

void WindowsThumbnailPage::ShowSlot(int slot, bool shown) {
  At(slot).shown = shown;
  if (At(slot).window) ShowWindow(At(slot).window, shown ? SW_SHOWNA : SW_HIDE);
}

void WindowsThumbnailPage::ClearSlot(int slot) {
  At(slot).picture = {};
  At(slot).awaited = {};
  At(slot).fault = PictureFault::kNone;
  SetTip(slot, {});
  SetCaption(slot, {});
  // It may show what was there.
  if (tips_) SendMessageW(tips_.Get(), TTM_POP, 0, 0);
}

void WindowsThumbnailPage::SetCaption(int slot, TextView caption) {
  At(slot).caption = ShownName(caption);
  ApplyCaption(slot);
}

void WindowsThumbnailPage::ApplyCaption(int slot) {
  const Slot& changed = At(slot);
  if (!changed.window) return;
  const std::wstring name =
      changed.caption.empty() ? kSlotName + std::to_wstring(slot) : WideFromText(changed.caption);
  SetWindowTextW(changed.window, name.c_str());
  InvalidateRect(changed.window, nullptr, FALSE);
}

bool WindowsThumbnailPage::SetPicture(int slot, TextView path, const std::optional<PicturePlace>& place) {
  Slot& changed = At(slot);
  changed.path = WideFromText(path);
  changed.twips = place;
  changed.picture = {};
  changed.awaited = {};
  const bool loads = LoadPictureOf(changed);
  if (changed.fault != PictureFault::kNone) TellReason(changed);
  Redraw(changed);
  return loads;
}

// To screen readers: the slot's details say now why its picture is not shown.
void WindowsThumbnailPage::TellReason(const Slot& slot) {
  if (slot.window) NotifyWinEvent(EVENT_OBJECT_DESCRIPTIONCHANGE, slot.window, OBJID_CLIENT, CHILDID_SELF);
}

// At once: the download of the next picture may take its time.
void WindowsThumbnailPage::Redraw(const Slot& slot) {
  if (!slot.window) return;
  InvalidateRect(slot.window, nullptr, FALSE);
  UpdateWindow(slot.window);
}

// False when there is no such file. A picture that is no longer there to be loaded again stays as it was
// loaded.
bool WindowsThumbnailPage::LoadPictureOf(Slot& slot) {
  if (!slot.picture) slot.place = Pixels(layout::kPicture);
  slot.background = BackColor();
  slot.fault = PictureFault::kNone;
  WIN32_FILE_ATTRIBUTE_DATA file = {};
  if (!GetFileAttributesExW(slot.path.c_str(), GetFileExInfoStandard, &file)) return false;
  const auto joined = [](DWORD high, DWORD low) { return std::uint64_t{high} << 32 | low; };
  const auto request = std::make_shared<const PictureRequest>(
      PictureRequest{slot.path, joined(file.nFileSizeHigh, file.nFileSizeLow),
                     joined(file.ftLastWriteTime.dwHighDateTime, file.ftLastWriteTime.dwLowDateTime),
                     slot.twips, Dpi(), BackColor()});
  if (const SharedPicture known = pictures_.Find(*request)) {
    Show(slot, known);
    return true;
  }
  // Read here and now, in a few milliseconds: as long as a worker had the file open, it could not be
  // replaced, and a rename meanwhile would take it away.
  PictureFile bytes = ReadPictureFile(slot.path);
  if (!bytes && !slot.picture) slot.fault = bytes.fault;
  if (!bytes || !workers_.Start(request, std::move(bytes))) return false;
  slot.awaited = request;
  return true;
}

void WindowsThumbnailPage::Show(Slot& slot, const SharedPicture& picture) {
  slot.picture = picture;
  slot.place = picture->place;
  slot.awaited = {};
}

void WindowsThumbnailPage::TakePicture(const std::shared_ptr<const PictureRequest>& request,
                                       ShownPicture picture) {
  const auto slot = std::ranges::find(slots_, request, &Slot::awaited);
  if (slot == slots_.end()) return;
  slot->awaited = {};
  if (picture.decoded) {
    Show(*slot, std::make_shared<const ShownPicture>(std::move(picture)));
    pictures_.Keep(*request, slot->picture);
    Redraw(*slot);
  } else if (!slot->picture) {
    slot->fault = picture.decoded.fault;
    TellReason(*slot);
    user_->OnPictureUnreadable(static_cast<int>(slot - slots_.begin()) + 1);
  }
}

void WindowsThumbnailPage::SetSelected(int slot, bool selected) {
  Slot& changed = At(slot);
  const bool looksOther = std::exchange(changed.selected, selected) != selected;
  if (!changed.window) return;
  if (looksOther) InvalidateRect(changed.window, nullptr, FALSE);
  if (selected)
    TellSelection(slot);
  else if (toldSlot_ == slot)
    toldSlot_ = 0;
}

// --- Screen readers ---

// On another page the same slot has another picture.
void WindowsThumbnailPage::TellSelection(int slot) {
  const std::wstring place = SpokenPlace();
  if (std::exchange(toldPlace_, place) != place)
    for (const DWORD event : {EVENT_OBJECT_REORDER, EVENT_OBJECT_VALUECHANGE})
      NotifyWinEvent(event, gridWindow_, OBJID_CLIENT, CHILDID_SELF);
  const std::wstring name = SpokenName(slot);
  const bool sameName = std::exchange(toldName_, name) == name;
  if (std::exchange(toldSlot_, slot) == slot && sameName) return;
  NotifyWinEvent(EVENT_OBJECT_SELECTION, At(slot).window, OBJID_CLIENT, CHILDID_SELF);
  TellFocus();
}

void WindowsThumbnailPage::TellFocus() const {
  const int selected = SelectedSlot();
  if (selected != 0 && GetFocus() == gridWindow_)
    NotifyWinEvent(EVENT_OBJECT_FOCUS, WindowOf(selected), OBJID_CLIENT, CHILDID_SELF);
}

PageAccessible& WindowsThumbnailPage::AccessibleOf(int slot) {
  ComPtr<PageAccessible>& object = accessibles_[static_cast<std::size_t>(slot)];
  if (!object) object = ComPtr<PageAccessible>::Adopt(new PageAccessible(*this, slot));
  return *object;
}

void WindowsThumbnailPage::DisconnectAccessibles() {
  for (ComPtr<PageAccessible>& object : accessibles_)
    if (const ComPtr<PageAccessible> held = std::exchange(object, {})) held->Disconnect();
}

HWND WindowsThumbnailPage::WindowOf(int slot) const {
  return slot == 0 ? gridWindow_ : slots_[static_cast<std::size_t>(slot) - 1].window;
}

int WindowsThumbnailPage::PictureCount() const {
  int count = 0;
  while (count < kSlotCount && !user_->NameOf(count + 1).empty()) ++count;
  return count;
}

int WindowsThumbnailPage::SelectedSlot() const {
  const auto selected = std::ranges::find(slots_, true, &Slot::selected);
  return selected == slots_.end() ? 0 : static_cast<int>(selected - slots_.begin()) + 1;
}

std::wstring WindowsThumbnailPage::SpokenName(int slot) const {
  return slot == 0 ? kPageName : WideFromText(ShownName(user_->NameOf(slot)));
}

std::wstring WindowsThumbnailPage::SpokenDetails(int slot) const {
  const std::wstring tip = slot == 0 ? std::wstring() : TipOf(slots_[static_cast<std::size_t>(slot) - 1]);
  const std::size_t nameEnd = tip.find(L"\r\n");
  return nameEnd == std::wstring::npos ? std::wstring() : tip.substr(nameEnd + 2);
}

std::wstring WindowsThumbnailPage::SpokenPlace() const {
  const Text place = user_->PlaceOfPage();
  return WideFromText(place.empty() ? gridText_ : place);
}

// What a program does for its user.
LRESULT WindowsThumbnailPage::OnAct(WPARAM acts, int slot) {
  const HWND outer = Outer();
  // The page may have become shorter since.
  if (content_ != Content::kGrid || slot < 0 || slot > PictureCount()) return 0;
  if (acts & PageAccessible::kTakeFocus) SetFocus(gridWindow_);
  if (Outer() == outer && (acts & PageAccessible::kSelect)) user_->OnSlotPressed(slot, false);
  if (Outer() == outer && (acts & PageAccessible::kOpen)) user_->OnKeyDown(VK_RETURN);
  return 0;
}

// --- The editor ---

void WindowsThumbnailPage::PlaceEditor() const {
  if (edited_ == 0) return;
  const RECT frame = Pixels(kFrames[static_cast<std::size_t>(edited_) - 1]);
  const RECT caption = Pixels(kCaption);
  TEXTMETRICW metrics = {};
  {
    const WindowDcOwner dc = DcOf(editorWindow_);
    const SelectionOwner font = SelectInto(dc.Get().dc, Font());
    GetTextMetricsW(dc.Get().dc, &metrics);
  }
  // The system's editor has its text a border and two pixels below its edge, on any screen.
  const int edges = 2 * (GetSystemMetrics(SM_CYBORDER) + 2);
  const int height = std::min<int>(metrics.tmHeight + edges, caption.bottom - caption.top);
  MoveWindow(editorWindow_, frame.left + caption.left, frame.top + caption.top, caption.right - caption.left,
             height, TRUE);
}

void WindowsThumbnailPage::ShowEditor(int slot, TextView name) {
  if (!Window()) return;
  edited_ = slot;
  PlaceEditor();
  SetWindowTextW(editorWindow_, WideFromText(name).c_str());
  ShowWindow(editorWindow_, SW_SHOW);
  SetFocus(editorWindow_);
  SendMessageW(editorWindow_, EM_SETSEL, 0, -1);
}

void WindowsThumbnailPage::HideEditor() {
  if (edited_ == 0) return;
  // The focus draws all anew, but not when it has gone elsewhere.
  InvalidateRect(At(std::exchange(edited_, 0)).window, nullptr, FALSE);
  if (GetFocus() == editorWindow_) SetFocus(gridWindow_);
  ShowWindow(editorWindow_, SW_HIDE);
}

Text WindowsThumbnailPage::EditorText() const {
  if (!editorWindow_) return {};
  std::wstring text(static_cast<std::size_t>(GetWindowTextLengthW(editorWindow_)) + 1, L'\0');
  text.resize(
      static_cast<std::size_t>(GetWindowTextW(editorWindow_, text.data(), static_cast<int>(text.size()))));
  return TextFromWide(text);
}

// --- What the user does ---

std::optional<LRESULT> WindowsThumbnailPage::OnMessage(HWND window, UINT message, WPARAM wParam,
                                                       LPARAM lParam) {
  if (message == WM_SETFOCUS) return OnFocus(window, wParam, lParam);
  // 32 bits of a 64-bit value, with or without their sign.
  if (message == WM_GETOBJECT && static_cast<LONG>(lParam) == OBJID_CLIENT &&
      (window == gridWindow_ || SlotOf(window) != 0))
    return LresultFromObject(__uuidof(IAccessible), wParam, &AccessibleOf(SlotOf(window)));
  if (window == Outer()) return OnOuterMessage(message, wParam, lParam);
  if (window == editorWindow_) return OnEditorMessage(message, wParam, lParam);
  if (window == linkWindow_ || window == switchWindow_)
    return OnButtonMessage(window, message, wParam, lParam);
  if (window == gridWindow_ || SlotOf(window) != 0) return OnGridMessage(window, message, wParam, lParam);
  return std::nullopt;
}

LRESULT WindowsThumbnailPage::OnFocus(HWND window, WPARAM wParam, LPARAM lParam) {
  if (window == Outer()) {
    SetFocus(FirstStop());
    return 0;
  }
  const LRESULT result = DefSubclassProc(window, WM_SETFOCUS, wParam, lParam);
  RefreshGrid();
  if (window == gridWindow_) TellFocus();
  tellingFocus_ = true;
  control_.Activated();
  tellingFocus_ = false;
  return result;
}

std::optional<LRESULT> WindowsThumbnailPage::OnOuterMessage(UINT message, WPARAM wParam, LPARAM lParam) {
  const auto sender = reinterpret_cast<HWND>(lParam);
  switch (message) {
    case WM_LBUTTONDOWN:
    case WM_RBUTTONDOWN:
    case WM_MBUTTONDOWN:
      return OnPress(Outer(), message, {});
    case WM_MOUSEWHEEL:
      if (content_ != Content::kGrid || !scrollBar_.IsEnabled()) return std::nullopt;
      scrollBar_.OnWheel(GET_WHEEL_DELTA_WPARAM(wParam), *user_);
      return 0;
    case WM_VSCROLL: {
      if (sender != scrollWindow_) return std::nullopt;
      const int code = LOWORD(wParam);
      scrollBar_.OnScroll(code, HIWORD(wParam), *user_);
      // A pressed bar moves on until its own loop hears that the button is up. A page that was filled in
      // between may have taken that message.
      if (code < SB_THUMBPOSITION && GetCapture() == sender && GetKeyState(VK_LBUTTON) >= 0) ReleaseCapture();
      return 0;
    }
    case WM_COMMAND:
      if (HIWORD(wParam) != BN_CLICKED) return std::nullopt;
      if (sender == linkWindow_)
        user_->OnLinkClicked();
      else if (sender == switchWindow_)
        user_->OnSwitchView();
      return 0;
    case WM_DRAWITEM: {
      const auto& item = *reinterpret_cast<const DRAWITEMSTRUCT*>(lParam);
      // The grid asks as well when somebody takes a picture of it.
      if (item.hwndItem == linkWindow_ || item.hwndItem == messageWindow_)
        DrawLabel(item.hDC, item.rcItem, item.hwndItem == linkWindow_, GetFocus() == item.hwndItem);
      return TRUE;
    }
    default:
      return std::nullopt;
  }
}

std::optional<LRESULT> WindowsThumbnailPage::OnGridMessage(HWND window, UINT message, WPARAM wParam,
                                                           LPARAM lParam) {
  const POINT at = {static_cast<SHORT>(LOWORD(lParam)), static_cast<SHORT>(HIWORD(lParam))};
  if (message >= WM_MOUSEFIRST && message <= WM_MOUSELAST && window != gridWindow_)
    RelayToTips({window, message, wParam, lParam, 0, {}});
  switch (message) {
    case WM_NOTIFY: {
      auto& header = *reinterpret_cast<NMHDR*>(lParam);
      if (header.hwndFrom != tips_.Get() || header.code != TTN_GETDISPINFOW) return std::nullopt;
      const int slot = SlotOf(reinterpret_cast<HWND>(header.idFrom));
      tipText_ = slot == 0 ? std::wstring() : TipOf(At(slot));
      reinterpret_cast<NMTTDISPINFOW&>(header).lpszText = tipText_.data();
      return 0;
    }
    case WM_PAINT:
      PaintGrid(window);
      return 0;
    case WM_ERASEBKGND:
      return TRUE;
    // The class tells double clicks; here the second press is one more.
    case WM_LBUTTONDOWN:
    case WM_RBUTTONDOWN:
    case WM_MBUTTONDOWN:
    case WM_LBUTTONDBLCLK:
    case WM_RBUTTONDBLCLK:
    case WM_MBUTTONDBLCLK:
      return OnPress(window, message, at);
    case WM_MOUSEMOVE:
      if (!dragFrom_ || !(wParam & MK_LBUTTON)) return std::nullopt;
      return OnMove(at);
    case WM_LBUTTONUP:
      EndDragWatch();
      return 0;
    case WM_CAPTURECHANGED:
      dragFrom_.reset();
      return 0;
    case WM_KILLFOCUS:
      RefreshGrid();
      return std::nullopt;
    case WM_GETDLGCODE:
      // A dialog would take Enter for its own button.
      if (window != gridWindow_) return std::nullopt;
      return wParam == VK_RETURN ? DLGC_WANTMESSAGE : DLGC_WANTARROWS;
    case WM_KEYDOWN:
      user_->OnKeyDown(static_cast<int>(wParam));
      return 0;
    case PageAccessible::kActMessage:
      return OnAct(wParam, static_cast<int>(lParam));
    default:
      return std::nullopt;
  }
}

void WindowsThumbnailPage::RelayToTips(const MSG& message) {
  if (IsWindow(tips_.Get()) || MakeTips())
    SendMessageW(tips_.Get(), TTM_RELAYEVENT, 0, reinterpret_cast<LPARAM>(&message));
}

// False on failure.
bool WindowsThumbnailPage::MakeTips() {
  // A name is shown with each "&" that it has.
  tips_ = Owner<HWND, DestroyWindow>(CreateWindowExW(
      WS_EX_TOPMOST, TOOLTIPS_CLASSW, nullptr, WS_POPUP | TTS_ALWAYSTIP | TTS_NOPREFIX, CW_USEDEFAULT,
      CW_USEDEFAULT, CW_USEDEFAULT, CW_USEDEFAULT, GetAncestor(Outer(), GA_ROOT), nullptr, nullptr, nullptr));
  if (!tips_) return false;
  SendMessageW(tips_.Get(), TTM_SETMAXTIPWIDTH, 0, MulDiv(kTipWidth, Dpi(), 96));
  for (const Slot& slot : slots_) {
    TTTOOLINFOW tool = {};
    // The size that all versions of the common controls take.
    tool.cbSize = TTTOOLINFOW_V2_SIZE;
    tool.uFlags = TTF_IDISHWND;
    tool.hwnd = gridWindow_;
    tool.uId = reinterpret_cast<UINT_PTR>(slot.window);
    tool.lpszText = LPSTR_TEXTCALLBACKW;
    SendMessageW(tips_.Get(), TTM_ADDTOOLW, 0, reinterpret_cast<LPARAM>(&tool));
  }
  return true;
}

std::wstring WindowsThumbnailPage::TipOf(const Slot& slot) {
  const std::wstring tip = WideFromText(slot.tip);
  return tip.empty() || slot.fault == PictureFault::kNone ? tip : tip + L"\r\n" + ReasonOf(slot.fault);
}

LRESULT WindowsThumbnailPage::OnPress(HWND window, UINT message, POINT at) {
  const HWND outer = Outer();
  const int slot = SlotOf(window);
  const bool left = message == WM_LBUTTONDOWN || message == WM_LBUTTONDBLCLK;
  const bool right = message == WM_RBUTTONDOWN || message == WM_RBUTTONDBLCLK;
  // Ends an edit, too.
  SetFocus(FirstStop());
  if (Outer() != outer) return 0;
  if (slot == 0) {
    control_.Activated();
    user_->OnBackgroundPressed(right);
    return 0;
  }
  // Before the host's code runs, which may wait until the button is up again.
  if (left && (At(slot).picture || At(slot).awaited) && PtInRect(&At(slot).place, at)) {
    SetCapture(window);
    dragFrom_ = at;
  }
  control_.Activated();
  user_->OnSlotPressed(slot, right);
  return 0;
}

LRESULT WindowsThumbnailPage::OnMove(POINT at) {
  if (std::abs(at.x - dragFrom_->x) <= GetSystemMetrics(SM_CXDRAG) &&
      std::abs(at.y - dragFrom_->y) <= GetSystemMetrics(SM_CYDRAG))
    return 0;
  EndDragWatch();
  control_.DragBegins();
  return 0;
}

void WindowsThumbnailPage::EndDragWatch() {
  if (!dragFrom_) return;
  dragFrom_.reset();
  ReleaseCapture();
}

std::optional<LRESULT> WindowsThumbnailPage::OnEditorMessage(UINT message, WPARAM wParam, LPARAM lParam) {
  const auto tell = [&](void (ThumbnailPageUser::*what)()) {
    tellingEditor_ = true;
    (user_->*what)();
    tellingEditor_ = false;
  };
  switch (message) {
    case WM_GETDLGCODE:
      // Delete deletes a letter, whatever the host's own key for it does.
      if (wParam != 0 && wParam != VK_TAB) return DLGC_WANTALLKEYS;
      return std::nullopt;
    case WM_KEYDOWN:
      if (wParam == VK_RETURN)
        tell(&ThumbnailPageUser::OnEditorEntered);
      else if (wParam == VK_ESCAPE)
        tell(&ThumbnailPageUser::OnEditorLeft);
      else
        return std::nullopt;
      return 0;
    case WM_CHAR:
      // The characters of the keys that were handled above, at which an edit control would beep.
      if (wParam == VK_RETURN || wParam == VK_ESCAPE || wParam == VK_TAB) return 0;
      return std::nullopt;
    case WM_KILLFOCUS: {
      const LRESULT result = DefSubclassProc(editorWindow_, message, wParam, lParam);
      if (edited_ != 0 && !tellingEditor_) tell(&ThumbnailPageUser::OnEditorLeft);
      return result;
    }
    default:
      return std::nullopt;
  }
}

std::optional<LRESULT> WindowsThumbnailPage::OnButtonMessage(HWND window, UINT message, WPARAM wParam,
                                                             LPARAM) {
  switch (message) {
    case WM_GETDLGCODE:
      if (wParam == VK_RETURN) return DLGC_WANTMESSAGE;
      return std::nullopt;
    case WM_KEYDOWN:
      // Buttons themselves take the space bar only.
      if (wParam != VK_RETURN) return std::nullopt;
      if (window == linkWindow_)
        user_->OnLinkClicked();
      else
        user_->OnSwitchView();
      return 0;
    case WM_SETCURSOR:
      if (window != linkWindow_ || HasHourglass()) return std::nullopt;
      SetCursor(LoadCursorW(nullptr, reinterpret_cast<LPCWSTR>(IDC_HAND)));
      return TRUE;
    default:
      return std::nullopt;
  }
}

// --- Drawing ---

// The container's colours and the system's change with a new drawing of all.
void WindowsThumbnailPage::FollowBackground() {
  for (Slot& slot : slots_)
    if ((slot.picture || slot.awaited) && slot.background != BackColor()) LoadPictureOf(slot);
}

// Everything of a window in memory first, so that nothing flickers.
void WindowsThumbnailPage::PaintGrid(HWND window) {
  FollowBackground();
  const PaintingOwner painting = Paint(window);
  const HDC screen = painting.Get().paint.hdc;
  const int slot = SlotOf(window);
  if (slot == 0) {
    Fill(screen, painting.Get().paint.rcPaint, BackColor());
    const SelectionOwner font = SelectInto(screen, Font());
    return DrawGridText(screen, Pixels(layout::kMessage));
  }
  RECT client = {};
  GetClientRect(window, &client);
  const MemoryDcOwner memory(CreateCompatibleDC(screen));
  const BitmapOwner bitmap(CreateCompatibleBitmap(screen, client.right, client.bottom));
  const SelectionOwner picture = SelectInto(memory.Get(), bitmap.Get());
  ThumbnailTile tile = At(slot);
  // The editor stands there, and may be lower than a caption of two lines.
  if (slot == edited_) tile.caption.clear();
  DrawTile(memory.Get(), client, tile, Style(), GetFocus() == gridWindow_);
  BitBlt(screen, 0, 0, client.right, client.bottom, memory.Get(), 0, 0, SRCCOPY);
}

void WindowsThumbnailPage::DrawGridText(HDC dc, RECT area) const {
  SetTextColor(dc, TextColor());
  SetBkMode(dc, TRANSPARENT);
  DrawTextW(dc, WideFromText(gridText_).c_str(), -1, &area, kTextFormat | DT_NOCLIP);
}

// On the system's colour of windows, whatever the container's is: there a link can be read.
void WindowsThumbnailPage::DrawLabel(HDC dc, RECT area, bool isLink, bool focus) const {
  Fill(dc, area, GetSysColor(COLOR_WINDOW));
  if (focus) DrawFocus(dc, area);
  const FontOwner underlined = LinkFont();
  const SelectionOwner font = SelectInto(dc, isLink ? underlined.Get() : Font());
  SetTextColor(dc, isLink ? kLinkColor : GetSysColor(COLOR_WINDOWTEXT));
  SetBkMode(dc, TRANSPARENT);
  InflateRect(&area, -Pixels(kLabelIndent), -Pixels(kLabelInset));
  DrawTextW(dc, WideFromText(isLink ? link_ : message_).c_str(), -1, &area, kTextFormat);
}

void WindowsThumbnailPage::Draw(HDC dc, const RECT& bounds) {
  FollowBackground();
  workers_.Finish();
  const SavedDcOwner saved = SaveStateOf(dc);
  IntersectClipRect(dc, bounds.left, bounds.top, bounds.right, bounds.bottom);
  Fill(dc, bounds, BackColor());
  const auto placed = [&](const layout::TwipRect& area) {
    return Moved(Pixels(area), bounds.left, bounds.top);
  };
  const SelectionOwner font = SelectInto(dc, Font());
  SetBkMode(dc, TRANSPARENT);
  if (content_ == Content::kGrid) {
    for (std::size_t slot = 0; slot < kSlotCount; ++slot)
      if (slots_[slot].shown) DrawTile(dc, placed(kFrames[slot]), slots_[slot], Style(), false);
    DrawGridText(dc, placed(layout::kMessage));
    scrollBar_.Draw(dc, placed(layout::kScrollBar), Pixels(120));
  } else if (content_ == Content::kEmptyAccount) {
    const auto [message, link] = LabelPlaces(dc);
    DrawLabel(dc, Moved(message, bounds.left, bounds.top), false, false);
    DrawLabel(dc, Moved(link, bounds.left, bounds.top), true, false);
  }
  RECT button = placed(layout::kButton);
  DrawFrameControl(dc, &button, DFC_BUTTON, DFCS_BUTTONPUSH);
  SetTextColor(dc, GetSysColor(COLOR_BTNTEXT));
  DrawTextW(dc, kSwitchText, -1, &button, DT_CENTER | DT_VCENTER | DT_SINGLELINE);
}

}  // namespace tarnwick
