#include "controls/windows/WindowsListView.h"

#include <algorithm>
#include <cstdlib>
#include <string>
#include <utility>

#include "controls/windows/Drawing.h"
#include "platform/windows/AnsiText.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {
namespace {

constexpr wchar_t kClassName[] = L"TarnwickListImage";
constexpr int kColumnWidth = 96;
// Names for screen readers.
constexpr wchar_t kListName[] = L"Files of the account";
// What a column must have beside its text at 96 dots per inch.
constexpr int kCellMargin = 12;

// Room at both ends of what the label says, and of a drawn cell's text, at 96 dots per inch.
constexpr int kLabelMargin = 4;
// Of two colours that are nearer than this in red, green and blue, one is not seen on the other.
constexpr int kLeastContrast = 12;

// What the system sends for the menu key and Shift+F10.
constexpr DWORD kNoPlace = 0xFFFFFFFF;

void CopyTo(const NMLVDISPINFOW& info, const Text& text) {
  if (info.item.cchTextMax <= 0) return;
  const auto room = static_cast<std::size_t>(info.item.cchTextMax - 1);
  const std::size_t length = std::min(room, text.size());
  std::copy_n(text.begin(), length, info.item.pszText);
  info.item.pszText[length] = L'\0';
}

bool LookAlike(COLORREF one, COLORREF other) {
  return std::abs(GetRValue(one) - GetRValue(other)) < kLeastContrast &&
         std::abs(GetGValue(one) - GetGValue(other)) < kLeastContrast &&
         std::abs(GetBValue(one) - GetBValue(other)) < kLeastContrast;
}

constexpr UINT kSaidFormat = DT_CENTER | DT_WORDBREAK | DT_EXPANDTABS | DT_NOPREFIX;

// Where `said` stands in the middle of `room`, in the font of `dc`: as many whole lines as there is room for.
RECT PlaceOf(HDC dc, const std::wstring& said, const RECT& room, int dpi) {
  RECT place = room;
  InflateRect(&place, -MulDiv(kLabelMargin, dpi, 96), 0);
  RECT needed = {0, 0, std::max(1L, place.right - place.left), 0};
  TEXTMETRICW metrics = {};
  DrawTextW(dc, said.c_str(), -1, &needed, kSaidFormat | DT_CALCRECT);
  GetTextMetricsW(dc, &metrics);
  const LONG line = std::max(1L, metrics.tmHeight);
  const LONG space = std::max(0L, room.bottom - room.top);
  const LONG height = std::min(needed.bottom, space / line * line);
  place.top += (space - height) / 2;
  place.bottom = place.top + height;
  return place;
}

}  // namespace

WindowsListView::WindowsListView(HINSTANCE module, ControlWindowUser& control)
    : ControlWindow(module, kClassName, control) {}

bool WindowsListView::MakeChildren() {
  const INITCOMMONCONTROLSEX classes = {sizeof classes, ICC_LISTVIEW_CLASSES | ICC_BAR_CLASSES};
  InitCommonControlsEx(&classes);
  list_ = MakeChild(Outer(), WC_LISTVIEWW, kListName,
                    WS_VISIBLE | WS_TABSTOP | WS_CLIPCHILDREN | WS_CLIPSIBLINGS | LVS_REPORT | LVS_OWNERDATA |
                        LVS_SHOWSELALWAYS | LVS_EDITLABELS | LVS_SHAREIMAGELISTS | LVS_SINGLESEL |
                        LVS_NOSORTHEADER);
  label_ = MakeChild(Outer(), L"STATIC", L"", SS_CENTER | SS_NOPREFIX);
  if (!list_ || !label_) return false;
  SetWindowPos(label_, HWND_TOP, 0, 0, 0, 0, SWP_NOMOVE | SWP_NOSIZE | SWP_NOACTIVATE);
  ListView_SetExtendedListViewStyle(list_, LVS_EX_FULLROWSELECT);
  // Its own tips are for names alone, and not in every version of the system.
  ListView_SetToolTips(list_, nullptr);
  listProc_ = reinterpret_cast<WNDPROC>(GetClassLongPtrW(list_, GCLP_WNDPROC));
  SetIcons();
  // What an earlier window showed; its selection is lost.
  if (multiple_) SetWindowLongW(list_, GWL_STYLE, GetWindowLongW(list_, GWL_STYLE) & ~LVS_SINGLESEL);
  AddColumns();
  ListView_SetItemCountEx(list_, static_cast<int>(count_), 0);
  ShowParts();
  if (const auto selected = std::exchange(selected_, std::nullopt)) SelectAlone(*selected);
  return true;
}

void WindowsListView::WindowGone() {
  list_ = label_ = nullptr;
  buttons_ = 0;
  ForgetPointer();
}

void WindowsListView::ApplyLook() {
  SendMessageW(list_, WM_SETFONT, reinterpret_cast<WPARAM>(Font()), TRUE);
  SendMessageW(label_, WM_SETFONT, reinterpret_cast<WPARAM>(Font()), TRUE);
  ListView_SetTextColor(list_, TextColor());
  ListView_SetTextBkColor(list_, BackColor());
  ListView_SetBkColor(list_, BackColor());
  PlaceLabel();
}

void WindowsListView::SetIcons() {
  ImageListOwner large = MakeLargeIcons(Dpi());
  ImageListOwner small = MakeSmallIcons(Dpi());
  ListView_SetImageList(list_, large.Get(), LVSIL_NORMAL);
  ListView_SetImageList(list_, small.Get(), LVSIL_SMALL);
  largeIcons_ = std::move(large);
  smallIcons_ = std::move(small);
}

void WindowsListView::DpiChanged(int before) {
  SetIcons();
  // The user may have made them wider.
  for (int column = 0; column < static_cast<int>(titles_.size()); ++column)
    ListView_SetColumnWidth(list_, column, MulDiv(ColumnWidth(column), Dpi(), before));
  Layout();
}

void WindowsListView::Layout() const {
  RECT client = {};
  GetClientRect(Outer(), &client);
  MoveWindow(list_, 0, 0, client.right, client.bottom, TRUE);
  PlaceLabel();
}

void WindowsListView::PlaceLabel() const {
  RECT room = {};
  GetClientRect(listShown_ ? list_ : Outer(), &room);
  RECT head = {};
  if (listShown_ && GetClientRect(ListView_GetHeader(list_), &head)) room.top = head.bottom;
  const WindowDcOwner dc = DcOf(label_);
  const SelectionOwner font = SelectInto(dc.Get().dc, Font());
  const RECT place = PlaceOf(dc.Get().dc, WideFromText(Said()), room, Dpi());
  MoveWindow(label_, place.left, place.top, std::max(0L, place.right - place.left), place.bottom - place.top,
             TRUE);
  // What was drawn in another size does not stand in the middle any more.
  InvalidateRect(label_, nullptr, TRUE);
}

void WindowsListView::Draw(HDC dc, const RECT& bounds) {
  // There is no window yet when a form draws a control that it has not shown.
  if (!smallIcons_) smallIcons_ = MakeSmallIcons(Dpi());
  const SavedDcOwner saved = SaveStateOf(dc);
  // Of the last row and column there may be a part.
  IntersectClipRect(dc, bounds.left, bounds.top, bounds.right, bounds.bottom);
  const SelectionOwner font = SelectInto(dc, Font());
  Fill(dc, bounds, BackColor());
  SetBkMode(dc, TRANSPARENT);
  TEXTMETRICW metrics = {};
  GetTextMetricsW(dc, &metrics);
  int iconWidth = 0;
  int iconHeight = 0;
  ImageList_GetIconSize(smallIcons_.Get(), &iconWidth, &iconHeight);
  const int margin = MulDiv(kLabelMargin, Dpi(), 96);
  const int line = std::max<int>(metrics.tmHeight + margin, iconHeight + 1);
  constexpr UINT kCell = DT_LEFT | DT_VCENTER | DT_SINGLELINE | DT_NOPREFIX | DT_END_ELLIPSIS;
  if (listShown_) {
    RECT head = bounds;
    head.bottom = head.top + line;
    FillRect(dc, &head, GetSysColorBrush(COLOR_BTNFACE));
  }
  int top = bounds.top;
  for (std::size_t row = 0; listShown_ && row <= count_ && top < bounds.bottom; ++row, top += line) {
    SetTextColor(dc, row == 0 ? GetSysColor(COLOR_BTNTEXT) : TextColor());
    int left = bounds.left;
    for (std::size_t column = 0; column < titles_.size() && left < bounds.right; ++column) {
      const int width = ColumnWidth(static_cast<int>(column));
      RECT cell = {left, top, left + width, top + line};
      if (row == 0) DrawEdge(dc, &cell, EDGE_ETCHED, BF_RIGHT | BF_BOTTOM);
      InflateRect(&cell, -margin, 0);
      if (row > 0 && column == 0) {
        ImageList_Draw(smallIcons_.Get(), user_->PictureOf(row - 1).small - 1, dc, cell.left,
                       cell.top + (line - iconHeight) / 2, ILD_TRANSPARENT);
        cell.left += iconWidth + margin / 2;
      }
      const Text text =
          row == 0 ? titles_[column] : ShownName(user_->ItemText(row - 1, static_cast<int>(column)));
      DrawTextW(dc, WideFromText(text).c_str(), -1, &cell, kCell);
      left += width;
    }
  }
  RECT room = bounds;
  if (listShown_) room.top += line;
  const std::wstring said = WideFromText(Said());
  RECT middle = PlaceOf(dc, said, room, Dpi());
  SetTextColor(dc, TextColor());
  DrawTextW(dc, said.c_str(), -1, &middle, kSaidFormat);
}

void WindowsListView::SetColumns(std::span<const ListColumn> columns) {
  if (!titles_.empty()) return;
  for (const ListColumn& column : columns) titles_.emplace_back(column.title);
  if (list_) AddColumns();
}

int WindowsListView::ColumnWidth(int column) const {
  return list_ ? ListView_GetColumnWidth(list_, column) : MulDiv(kColumnWidth, Dpi(), 96);
}

void WindowsListView::AddColumns() {
  const int width = MulDiv(kColumnWidth, Dpi(), 96);
  for (std::size_t i = 0; i < titles_.size(); ++i) {
    std::wstring title = WideFromText(titles_[i]);
    LVCOLUMNW added = {};
    added.mask = LVCF_TEXT | LVCF_WIDTH | LVCF_FMT | LVCF_SUBITEM;
    added.fmt = LVCFMT_LEFT;
    added.cx = width;
    added.pszText = title.data();
    added.iSubItem = static_cast<int>(i);
    SendMessageW(list_, LVM_INSERTCOLUMNW, static_cast<WPARAM>(added.iSubItem),
                 reinterpret_cast<LPARAM>(&added));
  }
  // A scroll bar may have come.
  PlaceLabel();
}

void WindowsListView::SetItemCount(std::size_t count) {
  if (!list_) {
    count_ = count;
    selected_.reset();
    return;
  }
  ListView_CancelEditLabel(list_);
  ForgetPointer();
  Deselect(-1);
  const int focused = NextItem(-1, LVNI_FOCUSED);
  if (focused >= 0) SetState(focused, 0, LVIS_FOCUSED);
  count_ = count;
  ListView_SetItemCountEx(list_, static_cast<int>(count), 0);
  if (count > 0) ListView_EnsureVisible(list_, 0, FALSE);
}

void WindowsListView::AppendItem() {
  ++count_;
  if (list_) ListView_SetItemCountEx(list_, static_cast<int>(count_), LVSICF_NOSCROLL);
}

void WindowsListView::RefreshItem(std::size_t index) {
  ForgetPointer();
  if (list_) ListView_RedrawItems(list_, static_cast<int>(index), static_cast<int>(index));
}

void WindowsListView::ShowList(bool list) {
  if (std::exchange(listShown_, list) != list) ShowParts();
}

void WindowsListView::SetLabelText(TextView text) {
  labelText_ = text;
  ShowParts();
}

void WindowsListView::SetHint(TextView text) {
  if (hint_ == text) return;
  hint_ = text;
  ShowParts();
}

void WindowsListView::ShowParts() const {
  if (!list_) return;
  const std::wstring said = WideFromText(Said());
  SetWindowTextW(label_, said.c_str());
  // Without a list the outer window has the focus, and screen readers tell its name.
  SetWindowTextW(Outer(), listShown_ ? L"" : said.c_str());
  PlaceLabel();
  ShowWindow(label_, said.empty() ? SW_HIDE : SW_SHOWNA);
  // At the end: when the list had the focus, the host hears of it.
  ShowWindow(list_, listShown_ ? SW_SHOWNA : SW_HIDE);
}

LRESULT WindowsListView::Ask(UINT message, WPARAM wParam, LPARAM lParam) const {
  return list_ ? CallWindowProcW(listProc_, list_, message, wParam, lParam) : 0;
}

int WindowsListView::NextItem(int after, UINT flags) const {
  return static_cast<int>(Ask(LVM_GETNEXTITEM, static_cast<WPARAM>(after), static_cast<LPARAM>(flags)));
}

void WindowsListView::SetState(int item, UINT state, UINT mask) const {
  LVITEMW changed = {};
  changed.state = state;
  changed.stateMask = mask;
  Ask(LVM_SETITEMSTATE, static_cast<WPARAM>(item), reinterpret_cast<LPARAM>(&changed));
}

bool WindowsListView::IsSelected(std::size_t index) const {
  return list_ ? (Ask(LVM_GETITEMSTATE, index, LVIS_SELECTED) & LVIS_SELECTED) != 0 : selected_ == index;
}

std::optional<std::size_t> WindowsListView::NextSelected(std::size_t from) const {
  if (!list_) return selected_ && *selected_ >= from ? selected_ : std::nullopt;
  const int found = NextItem(static_cast<int>(from) - 1, LVNI_SELECTED);
  return found < 0 ? std::nullopt : std::optional<std::size_t>(static_cast<std::size_t>(found));
}

// Not by one message for all items where it can be avoided: under Wine the list then walks through them, and
// a selected one is painted again even when it is to stay so.
void WindowsListView::Deselect(int kept) {
  const LRESULT selected = Ask(LVM_GETSELECTEDCOUNT, 0, 0);
  if (selected == 0) return;
  const int first = NextItem(-1, LVNI_SELECTED);
  if (selected > 1) {
    SetState(-1, 0, LVIS_SELECTED);
  } else if (first != kept) {
    SetState(first, 0, LVIS_SELECTED);
  }
}

void WindowsListView::SelectAlone(std::size_t index) {
  if (!list_) {
    selected_ = index;
    return;
  }
  const int item = static_cast<int>(index);
  // A list of single selection does not see to it when the selection comes from a program.
  Deselect(item);
  SetState(item, LVIS_SELECTED | LVIS_FOCUSED, LVIS_SELECTED | LVIS_FOCUSED);
  Ask(LVM_ENSUREVISIBLE, index, FALSE);
  ForgetPointer();
}

void WindowsListView::SetMultiSelect(bool multiple) {
  multiple_ = multiple;
  if (!list_) return;
  const std::optional<std::size_t> first = NextSelected(0);
  const LONG style = GetWindowLongW(list_, GWL_STYLE);
  SetWindowLongW(list_, GWL_STYLE, multiple ? style & ~LVS_SINGLESEL : style | LVS_SINGLESEL);
  if (!multiple && first) {
    Deselect(static_cast<int>(*first));
    SetState(static_cast<int>(*first), LVIS_SELECTED, LVIS_SELECTED);
  }
}

void WindowsListView::EndLabelEdit() {
  if (list_) ListView_CancelEditLabel(list_);
}

void WindowsListView::Focus() {
  // A list that nobody sees takes it from nobody.
  if (list_ && IsWindowVisible(Outer())) SetFocus(listShown_ ? list_ : Outer());
}

std::optional<LRESULT> WindowsListView::OnMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (window == list_) return OnListMessage(window, message, wParam, lParam);
  // The label, or the editor of an item's name.
  if (window != Outer()) return std::nullopt;
  switch (message) {
    case WM_CONTEXTMENU:
      if (static_cast<DWORD>(lParam) != kNoPlace) return std::nullopt;
      return OnMenuKey(window);
    case WM_SIZE:
      Layout();
      return 0;
    case WM_SETFOCUS:
      control_.Activated();
      if (Outer() == window && listShown_) SetFocus(list_);
      return 0;
    case WM_NOTIFY: {
      const auto& header = *reinterpret_cast<const NMHDR*>(lParam);
      if (header.hwndFrom != list_) return std::nullopt;
      return OnNotify(header);
    }
    default:
      return std::nullopt;
  }
}

LRESULT WindowsListView::OnNotify(const NMHDR& header) {
  switch (header.code) {
    case LVN_GETDISPINFOW: {
      auto& info = *reinterpret_cast<NMLVDISPINFOW*>(const_cast<NMHDR*>(&header));
      const auto item = static_cast<std::size_t>(info.item.iItem);
      if (info.item.iItem < 0 || item >= count_) return 0;
      if (info.item.mask & LVIF_TEXT) CopyTo(info, ShownName(user_->ItemText(item, info.item.iSubItem)));
      if (info.item.mask & LVIF_IMAGE) info.item.iImage = user_->PictureOf(item).small - 1;
      return 0;
    }
    case LVN_ODFINDITEMW: {
      const auto& find = *reinterpret_cast<const NMLVFINDITEMW*>(&header);
      if (!(find.lvfi.flags & (LVFI_STRING | LVFI_PARTIAL)) || !find.lvfi.psz) return -1;
      const auto found =
          user_->FindItem(TextFromWide(find.lvfi.psz), static_cast<std::size_t>(std::max(0, find.iStart)));
      return found ? static_cast<LRESULT>(*found) : -1;
    }
    case LVN_BEGINLABELEDITW: {
      // True keeps the list from editing.
      if (!user_->OnBeforeLabelEdit()) return TRUE;
      const auto& info = *reinterpret_cast<const NMLVDISPINFOW*>(&header);
      if (const HWND editor = ListView_GetEditControl(list_)) {
        Watch(editor);
        // The list puts in what it shows. An untouched name must come out as it is.
        const Text name = user_->ItemText(static_cast<std::size_t>(info.item.iItem), 0);
        if (ShownName(name) != name) SetWindowTextW(editor, WideFromText(name).c_str());
      }
      return FALSE;
    }
    case LVN_ENDLABELEDITW: {
      const auto& info = *reinterpret_cast<const NMLVDISPINFOW*>(&header);
      if (!info.item.pszText) return FALSE;
      return user_->OnAfterLabelEdit(static_cast<std::size_t>(info.item.iItem),
                                     TextFromWide(info.item.pszText))
                 ? TRUE
                 : FALSE;
    }
    case NM_CUSTOMDRAW:
      return OnDraw(*reinterpret_cast<NMLVCUSTOMDRAW*>(const_cast<NMHDR*>(&header)));
    case LVN_BEGINDRAG:
      control_.DragBegins();
      return 0;
    case NM_CLICK:
      user_->OnClick();
      return 0;
    case NM_SETFOCUS:
      control_.Activated();
      return 0;
    default:
      return 0;
  }
}

// The list draws what is selected, while it has not the focus, on the colour of buttons. Where that is the
// list's own colour, as on a form without one and in a high contrast, nobody would see it.
LRESULT WindowsListView::OnDraw(NMLVCUSTOMDRAW& drawn) const {
  if (drawn.nmcd.dwDrawStage == CDDS_PREPAINT)
    return GetFocus() != list_ && LookAlike(BackColor(), GetSysColor(COLOR_BTNFACE)) ? CDRF_NOTIFYITEMDRAW
                                                                                     : CDRF_DODEFAULT;
  // Of all items the state says here that they are selected.
  if (drawn.nmcd.dwDrawStage == CDDS_ITEMPREPAINT && IsSelected(drawn.nmcd.dwItemSpec)) {
    // Colours of selected items are not looked at.
    drawn.nmcd.uItemState &= ~static_cast<UINT>(CDIS_SELECTED);
    drawn.clrText = GetSysColor(COLOR_HIGHLIGHTTEXT);
    drawn.clrTextBk = GetSysColor(COLOR_HIGHLIGHT);
  }
  return CDRF_DODEFAULT;
}

std::optional<LRESULT> WindowsListView::OnListMessage(HWND list, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message >= WM_MOUSEFIRST && message <= WM_MBUTTONDBLCLK) {
    if (message == WM_MOUSEMOVE)
      FollowPointer({static_cast<SHORT>(LOWORD(lParam)), static_cast<SHORT>(HIWORD(lParam))});
    tip_.Relay(list, message, wParam, lParam);
  }
  switch (message) {
    case WM_ERASEBKGND:
      // Painted with the rest, unless it is wanted in a picture.
      if (WindowFromDC(reinterpret_cast<HDC>(wParam)) != list) return std::nullopt;
      return TRUE;
    case WM_PAINT:
      PaintList(list);
      return 0;
    case WM_SIZE:
    case WM_HSCROLL:
    case WM_VSCROLL:
    case WM_MOUSEWHEEL:
    case WM_MOUSEHWHEEL:
      ForgetPointer();
      return std::nullopt;
    case WM_NOTIFY:
      // A column is as wide as it was no more.
      if (reinterpret_cast<const NMHDR*>(lParam)->code == HDN_ITEMCHANGEDW) ForgetPointer();
      return std::nullopt;
    case WM_CONTEXTMENU:
      if (static_cast<DWORD>(lParam) != kNoPlace) return std::nullopt;
      return OnMenuKey(list);
    case WM_LBUTTONDOWN:
    case WM_RBUTTONDOWN: {
      const HWND outer = Outer();
      ++buttons_;
      control_.Activated();
      const LRESULT result = DefSubclassProc(list, message, wParam, lParam);
      // Of buttons one inside the other the first one tells, when the list has done with all.
      if (Outer() == outer && --buttons_ == 0) user_->OnMouseButton();
      return result;
    }
    case WM_GETDLGCODE: {
      // Of a form that handles its keys as a dialog does, Enter would press the default button.
      const auto* const key = reinterpret_cast<const MSG*>(lParam);
      const bool enter = key && key->message == WM_KEYDOWN && key->wParam == VK_RETURN;
      return DefSubclassProc(list, message, wParam, lParam) | (enter ? DLGC_WANTMESSAGE : 0);
    }
    case WM_KEYDOWN:
      ForgetPointer();
      return OnKeyDown(list, wParam, lParam);
    default:
      return std::nullopt;
  }
}

LRESULT WindowsListView::OnKeyDown(HWND list, WPARAM key, LPARAM lParam) {
  switch (key) {
    case VK_RETURN:
      user_->OnEnter();
      return 0;
    case VK_F2:
      // The list asks whether it may, as it does after a slow second click. The other form of the message
      // edits what the code page can hold.
      if (const auto selected = NextSelected(0)) SendMessageW(list, LVM_EDITLABELW, *selected, 0);
      return 0;
    case 'A':
      // With Alt as well it is a letter on some keyboards.
      if (!multiple_ || count_ == 0 || GetKeyState(VK_CONTROL) >= 0 || GetKeyState(VK_MENU) < 0) break;
      // Under Wine each item would be looked up on the screen.
      Ask(WM_SETREDRAW, FALSE, 0);
      SetState(-1, LVIS_SELECTED, LVIS_SELECTED);
      Ask(WM_SETREDRAW, TRUE, 0);
      InvalidateRect(list, nullptr, FALSE);
      user_->OnSelectionChanged();
      return 0;
    default:
      break;
  }
  const LRESULT result = DefSubclassProc(list, WM_KEYDOWN, key, lParam);
  user_->OnKeyDown(static_cast<std::int32_t>(key));
  return result;
}

LRESULT WindowsListView::OnMenuKey(HWND window) {
  const HWND outer = Outer();
  if (window == list_) user_->OnMouseButton();
  if (Outer() != outer) return 0;
  RECT client = {};
  GetClientRect(outer, &client);
  POINT at = window == list_ ? MenuPlace() : POINT{client.right / 2, client.bottom / 2};
  ClientToScreen(window, &at);
  // On to the form, as after a click of the right button.
  return DefWindowProcW(outer, WM_CONTEXTMENU, reinterpret_cast<WPARAM>(window), MAKELPARAM(at.x, at.y));
}

POINT WindowsListView::MenuPlace() const {
  RECT client = {};
  GetClientRect(list_, &client);
  const int current = NextItem(-1, LVNI_FOCUSED | LVNI_SELECTED);
  const int item = current >= 0 ? current : NextItem(-1, LVNI_SELECTED);
  if (item < 0) return {client.right / 2, client.bottom / 2};
  Ask(LVM_ENSUREVISIBLE, static_cast<WPARAM>(item), FALSE);
  RECT icon = {LVIR_ICON, 0, 0, 0};
  Ask(LVM_GETITEMRECT, static_cast<WPARAM>(item), reinterpret_cast<LPARAM>(&icon));
  return {std::clamp<LONG>(icon.right, 0, client.right), (icon.top + icon.bottom) / 2};
}

void WindowsListView::FollowPointer(const POINT& at) {
  LVHITTESTINFO hit = {};
  hit.pt = at;
  Ask(LVM_SUBITEMHITTEST, 0, reinterpret_cast<LPARAM>(&hit));
  const std::pair<int, int> pointed(hit.iItem, hit.iSubItem);
  if (std::exchange(pointed_, pointed) == pointed) return;
  tip_.Clear();
  if (hit.iItem < 0 || static_cast<std::size_t>(hit.iItem) >= count_) return;
  RECT client = {};
  GetClientRect(list_, &client);
  RECT cell = {LVIR_BOUNDS, hit.iSubItem, 0, 0};
  Ask(LVM_GETSUBITEMRECT, static_cast<WPARAM>(hit.iItem), reinterpret_cast<LPARAM>(&cell));
  // The bounds of the first column are those of the row.
  cell.right = cell.left + ColumnWidth(hit.iSubItem);
  LONG left = cell.left;
  if (hit.iSubItem == 0) {
    RECT label = {LVIR_LABEL, 0, 0, 0};
    Ask(LVM_GETITEMRECT, static_cast<WPARAM>(hit.iItem), reinterpret_cast<LPARAM>(&label));
    left = label.left;
  }
  std::wstring text =
      WideFromText(ShownName(user_->ItemText(static_cast<std::size_t>(hit.iItem), hit.iSubItem)));
  const auto width = static_cast<LONG>(Ask(LVM_GETSTRINGWIDTHW, 0, reinterpret_cast<LPARAM>(text.c_str())));
  const LONG room = std::min(cell.right, client.right) - left;
  if (left >= 0 && width + MulDiv(kCellMargin, Dpi(), 96) <= room) return;
  tip_.Set(list_, cell, std::move(text));
}

void WindowsListView::ForgetPointer() {
  pointed_ = {-1, -1};
  tip_.Clear();
}

// Everything in memory first, so that nothing flickers. The older common controls do not offer that.
void WindowsListView::PaintList(HWND list) const {
  // Of what lies between two rows nothing is drawn.
  const RegionOwner changed(CreateRectRgn(0, 0, 0, 0));
  GetUpdateRgn(list, changed.Get(), FALSE);
  const PaintingOwner painting = Paint(list);
  const HDC screen = painting.Get().paint.hdc;
  const RECT& area = painting.Get().paint.rcPaint;
  const int width = area.right - area.left;
  const int height = area.bottom - area.top;
  const MemoryDcOwner memory(CreateCompatibleDC(screen));
  const BitmapOwner bitmap(CreateCompatibleBitmap(screen, width, height));
  const SelectionOwner picture = SelectInto(memory.Get(), bitmap.Get());
  OffsetRgn(changed.Get(), -area.left, -area.top);
  SelectClipRgn(memory.Get(), changed.Get());
  SetViewportOrgEx(memory.Get(), -area.left, -area.top, nullptr);
  const auto target = reinterpret_cast<WPARAM>(memory.Get());
  Ask(WM_ERASEBKGND, target, 0);
  Ask(WM_PRINTCLIENT, target, PRF_CLIENT);
  BitBlt(screen, area.left, area.top, width, height, memory.Get(), area.left, area.top, SRCCOPY);
}

}  // namespace tarnwick
