// The list window: a report list without items of its own (owner data) and a label, shown in its place or,
// when the list has something to say, in the middle of it, in a window that fills its control.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <cstddef>
#include <optional>
#include <utility>
#include <vector>

#include "controls/listimage/ListView.h"
#include "controls/listimage/ListViewUser.h"
#include "controls/windows/ControlWindow.h"
#include "controls/windows/FileIcons.h"
#include "controls/windows/TextTip.h"

namespace tarnwick {

class WindowsListView : public ListView, public ControlWindow {
 public:
  // `module` is where the window's class belongs. `control` outlives the object.
  WindowsListView(HINSTANCE module, ControlWindowUser& control);

  // Before the window is made; `user` takes part until the object ends.
  void SetUser(ListViewUser& user) { user_ = &user; }

  // Draws the list as the window would show it, into `bounds`.
  void Draw(HDC dc, const RECT& bounds);
  // The small pictures, for a picture made of two.
  HIMAGELIST SmallIcons() const { return smallIcons_.Get(); }

  void SetColumns(std::span<const ListColumn> columns) override;
  void SetItemCount(std::size_t count) override;
  void AppendItem() override;
  void RefreshItem(std::size_t index) override;
  void ShowList(bool list) override;
  void SetLabelText(TextView text) override;
  void SetHint(TextView text) override;
  bool IsSelected(std::size_t index) const override;
  std::optional<std::size_t> NextSelected(std::size_t from) const override;
  void SelectAlone(std::size_t index) override;
  void SetMultiSelect(bool multiple) override;
  void EndLabelEdit() override;
  void Focus() override;
  void SetHourglass(bool hourglass) override { ShowHourglass(hourglass); }
  void StartDrag() override { control_.DragBegins(); }

 private:
  bool MakeChildren() override;
  void WindowGone() override;
  void ApplyLook() override;
  void DpiChanged(int before) override;
  std::optional<LRESULT> OnMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam) override;
  std::optional<LRESULT> OnListMessage(HWND list, UINT message, WPARAM wParam, LPARAM lParam);
  LRESULT OnNotify(const NMHDR& header);
  LRESULT OnDraw(NMLVCUSTOMDRAW& drawn) const;
  LRESULT OnKeyDown(HWND list, WPARAM key, LPARAM lParam);
  // The key that stands for the right button was pressed in the list, or in the outer window in its place.
  LRESULT OnMenuKey(HWND window);
  // Where the menu belongs, in the list's coordinates.
  POINT MenuPlace() const;
  // The pointer is at this place in the list.
  void FollowPointer(const POINT& at);
  // What it is on is not known any more.
  void ForgetPointer();
  void PaintList(HWND list) const;
  void Layout() const;
  void PlaceLabel() const;
  // Shows the list and the label as they are to be.
  void ShowParts() const;
  // What the label says now; empty while it is hidden.
  const Text& Said() const { return listShown_ ? hint_ : labelText_; }
  void SetIcons();
  // Sent to the list itself, past what watches its messages; 0 without a list. A window that is watched looks
  // its properties up three times for each message, and under Wine another process answers each time. What
  // the list notifies of goes to the outer window as ever.
  LRESULT Ask(UINT message, WPARAM wParam, LPARAM lParam) const;
  // -1 when no item behind `after` has what the flags tell.
  int NextItem(int after, UINT flags) const;
  // The state of an item, or of all for -1.
  void SetState(int item, UINT state, UINT mask) const;
  // Leaves at most `kept` selected, which is an item or -1.
  void Deselect(int kept);
  void AddColumns();
  int ColumnWidth(int column) const;

  ListViewUser* user_ = nullptr;
  HWND list_ = nullptr;
  // What the list itself answers by.
  WNDPROC listProc_ = nullptr;
  HWND label_ = nullptr;
  ImageListOwner largeIcons_;
  ImageListOwner smallIcons_;
  std::vector<Text> titles_;
  std::size_t count_ = 0;
  // Selected before there was a window, which knows it itself.
  std::optional<std::size_t> selected_;
  bool listShown_ = true;
  bool multiple_ = false;
  Text labelText_;
  Text hint_;
  TextTip tip_;
  // Item and column that the pointer is on; -1 and -1 for none.
  std::pair<int, int> pointed_ = {-1, -1};
  // Buttons that the list is busy with: it may handle messages of its own until a button is up.
  int buttons_ = 0;
};

}  // namespace tarnwick
