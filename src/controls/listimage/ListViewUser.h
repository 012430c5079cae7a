// What the window of the list control asks its rules for, and what it tells them of the user.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>

#include "base/Text.h"

namespace tarnwick {

// Entries, counted from 1, of the image lists with the large and the small pictures.
struct ItemPicture {
  int large = 0;
  int small = 0;
};

// Items and columns count from 0.
class ListViewUser {
 public:
  virtual ~ListViewUser() = default;

  // Name, address or size; empty outside the list.
  virtual Text ItemText(std::size_t index, int column) const = 0;
  virtual ItemPicture PictureOf(std::size_t index) const = 0;
  // The first item from `start` on, then from the top, whose name starts with `prefix` in any letter case.
  virtual std::optional<std::size_t> FindItem(TextView prefix, std::size_t start) const = 0;
  // Whether the user may edit a label.
  virtual bool OnBeforeLabelEdit() const = 0;

  // All of these raise events: the host's code runs inside, which may call the control, destroy its window
  // and release it.

  // A key was pressed, and the list has done with it what lists do.
  virtual void OnKeyDown(std::int32_t keyCode) = 0;
  // Enter in the list, not in a label edit.
  virtual void OnEnter() = 0;
  // Another item was selected in other ways than by the arrow keys or a click.
  virtual void OnSelectionChanged() = 0;
  virtual void OnClick() = 0;
  // The left or right mouse button, on an item or beside them, and the list has done with it what lists do;
  // or the key that stands for the right one.
  virtual void OnMouseButton() = 0;
  // The label edit of an item ended with a text; an edit that was cancelled is not told. True when the item
  // has a new name now, which need not be that text.
  virtual bool OnAfterLabelEdit(std::size_t index, TextView newText) = 0;
};

}  // namespace tarnwick
