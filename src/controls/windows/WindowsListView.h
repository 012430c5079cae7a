// The list window: a report list without items of its own (owner data) and a label, one shown in place of the
// other, in a window that fills its control.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <cstddef>
#include <optional>
#include <vector>

#include "controls/listimage/ListView.h"
#include "controls/windows/ControlWindow.h"
#include "controls/windows/FileIcons.h"

namespace tarnwick {

// What the window asks for, and what it tells of the user. Items count from 0, columns too. No member throws.
class ListViewUser {
 public:
  virtual ~ListViewUser() = default;

  virtual Text ItemText(std::size_t item, std::size_t column) const = 0;
  virtual bool IsGif(std::size_t item) const = 0;
  // The first item from `start` on, round the end, whose name begins with `prefix` in any letter case.
  virtual std::optional<std::size_t> FindItem(TextView prefix, std::size_t start) const = 0;

  // A key was pressed, and the list has done with it what lists do.
  virtual void KeyPressed(int key) = 0;
  virtual void EnterPressed() = 0;
  // The left or the right button goes down on the list, and the list has done with it what lists do.
  virtual void ButtonPressed() = 0;
  virtual void ButtonDone() = 0;
  virtual void Clicked() = 0;
  // Whether the label may be edited, and whether the edited text stands.
  virtual bool LabelEditBegins(std::size_t item) = 0;
  virtual bool LabelEditEnds(std::size_t item, TextView text) = 0;
  virtual void DragBegins() = 0;
  virtual void GotFocus() = 0;
  virtual void LostFocus() = 0;
};

class WindowsListView : public ListView, public ControlWindow {
 public:
  // `module` is where the window's class belongs. `user` outlives the window.
  WindowsListView(HINSTANCE module, ListViewUser& user);

  // Draws the list as the window would show it, into `bounds`.
  void Draw(HDC dc, const RECT& bounds) const;
  // The small pictures, for a picture made of two.
  HIMAGELIST SmallIcons() const { return smallIcons_.Get(); }

  void SetColumns(std::span<const ListColumn> columns) override;
  void SetItemCount(std::size_t count) override;
  void AppendItem() override;
  void RefreshItem(std::size_t index) override;
  void ShowList(bool list) override;
  void SetLabelText(TextView text) override;
  bool IsSelected(std::size_t index) const override;
  std::optional<std::size_t> NextSelected(std::size_t from) const override;
  void Select(std::size_t index, bool selected) override;
  void SetFocusTo(std::size_t index) override;
  void SetMultiSelect(bool multiple) override;
  void EndLabelEdit() override;
  void Focus() override;
  void SetHourglass(bool hourglass) override { ShowHourglass(hourglass); }
  void StartDrag() override { user_.DragBegins(); }

 private:
  bool MakeChildren() override;
  void FocusLeft() override { user_.LostFocus(); }
  void WindowGone() override;
  void ApplyLook() override;
  void DpiChanged(int before) override;
  std::optional<LRESULT> OnMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam) override;
  std::optional<LRESULT> OnListMessage(UINT message, WPARAM wParam, LPARAM lParam);
  LRESULT OnNotify(const NMHDR& header);
  void Layout() const;
  void SetIcons();
  void AddColumns();

  ListViewUser& user_;
  HWND list_ = nullptr;
  HWND label_ = nullptr;
  ImageListOwner largeIcons_;
  ImageListOwner smallIcons_;
  std::vector<Text> titles_;
  std::size_t count_ = 0;
  bool listShown_ = true;
  bool multiple_ = false;
  Text labelText_;
  // Buttons that the list is busy with: it may handle messages of its own until a button is up.
  int buttons_ = 0;
};

}  // namespace tarnwick
