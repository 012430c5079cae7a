// The seam to the list window. The rules own the items; the view asks its ListViewUser for the texts and
// pictures that it draws (owner data), so that a hundred thousand files show at once.
#pragma once

#include <cstddef>
#include <optional>
#include <span>

#include "base/Text.h"
#include "controls/ControlView.h"

namespace tarnwick {

struct ListColumn {
  TextView key;
  TextView title;
};

// Items count from 0. What the rules change through this interface is not reported back to them: ListViewUser
// hears of what the user does. No member throws. All work without a window too; a window that
// comes later shows the same state.
class ListView : public ControlView {
 public:
  // They are the same ones in each call. The first one adds them, each 96 pixels wide at 96 DPI, with its
  // text at the left; the later ones leave them, with the widths that the user has given them.
  virtual void SetColumns(std::span<const ListColumn> columns) = 0;

  // The list holds `count` new items: none is selected or has the focus, the first one is on top. A label
  // edit ends without a result. Costs the same whatever `count` is.
  virtual void SetItemCount(std::size_t count) = 0;

  // One more item at the end; selection and focus stay.
  virtual void AppendItem() = 0;

  // The texts or the picture of item `index` changed.
  virtual void RefreshItem(std::size_t index) = 0;

  // Shows either the list or, in its place, the label.
  virtual void ShowList(bool list) = 0;
  virtual void SetLabelText(TextView text) = 0;
  // What the list itself shows where the label stands; empty for nothing.
  virtual void SetHint(TextView text) = 0;

  virtual bool IsSelected(std::size_t index) const = 0;
  // The first selected item from `from` on.
  virtual std::optional<std::size_t> NextSelected(std::size_t from) const = 0;
  // Selects the item and no other, gives it the focus mark and scrolls it into view.
  virtual void SelectAlone(std::size_t index) = 0;
  // Turning it off keeps the first selected item selected.
  virtual void SetMultiSelect(bool multiple) = 0;

  // Ends a running label edit without a result.
  virtual void EndLabelEdit() = 0;
};

}  // namespace tarnwick
