#include "controls/windows/WindowsListView.h"

#include <algorithm>
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

void CopyTo(const NMLVDISPINFOW& info, const Text& text) {
  if (info.item.cchTextMax <= 0) return;
  const auto room = static_cast<std::size_t>(info.item.cchTextMax - 1);
  const std::size_t length = std::min(room, text.size());
  std::copy_n(text.begin(), length, info.item.pszText);
  info.item.pszText[length] = L'\0';
}

}  // namespace

WindowsListView::WindowsListView(HINSTANCE module, ControlWindowUser& control)
    : ControlWindow(module, kClassName, control) {}

bool WindowsListView::MakeChildren() {
  const INITCOMMONCONTROLSEX classes = {sizeof classes, ICC_LISTVIEW_CLASSES};
  InitCommonControlsEx(&classes);
  list_ = MakeChild(Outer(), WC_LISTVIEWW, kListName,
                    WS_VISIBLE | WS_TABSTOP | LVS_REPORT | LVS_OWNERDATA | LVS_SHOWSELALWAYS |
                        LVS_EDITLABELS | LVS_SHAREIMAGELISTS | LVS_SINGLESEL);
  label_ = MakeChild(Outer(), L"STATIC", WideFromText(labelText_).c_str(), SS_CENTER | SS_NOPREFIX);
  if (!list_ || !label_) return false;
  listProc_ = reinterpret_cast<WNDPROC>(GetClassLongPtrW(list_, GCLP_WNDPROC));
  SetIcons();
  // What an earlier window showed; its selection is lost.
  if (multiple_) SetWindowLongW(list_, GWL_STYLE, GetWindowLongW(list_, GWL_STYLE) & ~LVS_SINGLESEL);
  AddColumns();
  ListView_SetItemCountEx(list_, static_cast<int>(count_), 0);
  ShowWindow(listShown_ ? list_ : label_, SW_SHOWNA);
  ShowWindow(listShown_ ? label_ : list_, SW_HIDE);
  if (const auto selected = std::exchange(selected_, std::nullopt)) SelectAlone(*selected);
  return true;
}

void WindowsListView::WindowGone() {
  list_ = label_ = nullptr;
  buttons_ = 0;
}

void WindowsListView::ApplyLook() {
  SendMessageW(list_, WM_SETFONT, reinterpret_cast<WPARAM>(Font()), TRUE);
  SendMessageW(label_, WM_SETFONT, reinterpret_cast<WPARAM>(Font()), TRUE);
  ListView_SetTextColor(list_, TextColor());
  ListView_SetTextBkColor(list_, BackColor());
  ListView_SetBkColor(list_, BackColor());
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
    ListView_SetColumnWidth(list_, column, MulDiv(ListView_GetColumnWidth(list_, column), Dpi(), before));
  Layout();
}

void WindowsListView::Layout() const {
  RECT client = {};
  GetClientRect(Outer(), &client);
  MoveWindow(list_, 0, 0, client.right, client.bottom, TRUE);
  // The label stands in the middle; it is as high as two of its lines.
  const int height = std::min<int>(client.bottom, MulDiv(32, Dpi(), 96));
  MoveWindow(label_, 0, (client.bottom - height) / 2, client.right, height, TRUE);
}

void WindowsListView::Draw(HDC dc, const RECT& bounds) {
  // There is no window yet when a form draws a control that it has not shown.
  if (!smallIcons_) smallIcons_ = MakeSmallIcons(Dpi());
  const SelectionOwner font = SelectInto(dc, Font());
  Fill(dc, bounds, BackColor());
  SetTextColor(dc, TextColor());
  SetBkMode(dc, TRANSPARENT);
  TEXTMETRICW metrics = {};
  GetTextMetricsW(dc, &metrics);
  const int line = metrics.tmHeight + 4;
  constexpr UINT kCell = DT_LEFT | DT_VCENTER | DT_SINGLELINE | DT_NOPREFIX | DT_END_ELLIPSIS;
  if (!listShown_) {
    RECT middle = {bounds.left, (bounds.top + bounds.bottom - line) / 2, bounds.right, bounds.bottom};
    DrawTextW(dc, WideFromText(labelText_).c_str(), -1, &middle, DT_CENTER | DT_TOP | DT_NOPREFIX);
    return;
  }
  const int width = MulDiv(kColumnWidth, Dpi(), 96);
  int top = bounds.top;
  for (std::size_t row = 0; row <= count_ && top < bounds.bottom; ++row, top += line) {
    int left = bounds.left;
    for (std::size_t column = 0; column < titles_.size() && left < bounds.right; ++column, left += width) {
      RECT cell = {left, top, left + width, top + line};
      if (row == 0) {
        FillRect(dc, &cell, GetSysColorBrush(COLOR_BTNFACE));
        DrawEdge(dc, &cell, BDR_RAISEDINNER, BF_RECT);
      }
      cell.left += 4;
      cell.right -= 2;
      if (row > 0 && column == 0 && smallIcons_) {
        ImageList_Draw(smallIcons_.Get(), user_->PictureOf(row - 1).small - 1, dc, cell.left, cell.top,
                       ILD_TRANSPARENT);
        cell.left += MulDiv(18, Dpi(), 96);
      }
      const Text text =
          row == 0 ? titles_[column] : ShownName(user_->ItemText(row - 1, static_cast<int>(column)));
      DrawTextW(dc, WideFromText(text).c_str(), -1, &cell, kCell);
    }
  }
}

void WindowsListView::SetColumns(std::span<const ListColumn> columns) {
  titles_.clear();
  for (const ListColumn& column : columns) titles_.emplace_back(column.title);
  if (!list_) return;
  while (ListView_DeleteColumn(list_, 0)) {
  }
  AddColumns();
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
}

void WindowsListView::SetItemCount(std::size_t count) {
  if (!list_) {
    count_ = count;
    selected_.reset();
    return;
  }
  ListView_CancelEditLabel(list_);
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
  if (list_) ListView_RedrawItems(list_, static_cast<int>(index), static_cast<int>(index));
}

void WindowsListView::ShowList(bool list) {
  listShown_ = list;
  if (!list_) return;
  ShowWindow(list ? label_ : list_, SW_HIDE);
  ShowWindow(list ? list_ : label_, SW_SHOWNA);
}

void WindowsListView::SetLabelText(TextView text) {
  labelText_ = text;
  if (label_) SetWindowTextW(label_, WideFromText(text).c_str());
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

std::optional<LRESULT> WindowsListView::OnListMessage(HWND list, UINT message, WPARAM wParam, LPARAM lParam) {
  switch (message) {
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
    case WM_KEYDOWN: {
      if (wParam == VK_RETURN) {
        user_->OnEnter();
        return 0;
      }
      if (wParam == VK_F2) {
        // The list asks whether it may, as it does after a slow second click. The other form of the message
        // edits what the code page can hold.
        if (const auto selected = NextSelected(0)) SendMessageW(list, LVM_EDITLABELW, *selected, 0);
        return 0;
      }
      const LRESULT result = DefSubclassProc(list, message, wParam, lParam);
      user_->OnKeyDown(static_cast<std::int32_t>(wParam));
      return result;
    }
    default:
      return std::nullopt;
  }
}

}  // namespace tarnwick
