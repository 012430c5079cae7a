// What the window of the thumbnail control tells its rules. What the user does raises events or, when the bar
// moves, fills a page, which pumps messages: the host's code runs inside, which may call the control, destroy
// its window and release it.
#pragma once

#include "base/Text.h"

namespace tarnwick {

class ThumbnailPageUser {
 public:
  virtual ~ThumbnailPageUser() = default;

  // A mouse button went down on a slot's frame, picture or caption.
  virtual void OnSlotPressed(int slot, bool rightButton) = 0;
  // The same beside the slots.
  virtual void OnBackgroundPressed(bool rightButton) = 0;
  // A key in the grid, by its virtual key code.
  virtual void OnKeyDown(int keyCode) = 0;
  // The scroll bar has come to rest at a value; its thumb is being dragged over one.
  virtual void OnScrollChanged(int value) = 0;
  virtual void OnScrollDragged(int value) = 0;
  virtual void OnLinkClicked() = 0;
  virtual void OnSwitchView() = 0;
  // Enter in the editor; Escape there, or the focus went elsewhere. The editor is shown until HideEditor.
  virtual void OnEditorEntered() = 0;
  virtual void OnEditorLeft() = 0;

  // The picture that the slot waits for cannot be shown. Runs none of the host's code.
  virtual void OnPictureUnreadable(int slot) = 0;

  // For screen readers: the whole name of the picture that a slot shows or waits for, empty for none, and
  // where the page stands in the list, such as "5 to 8 of 120".
  virtual Text NameOf(int slot) const = 0;
  virtual Text PlaceOfPage() const = 0;
};

}  // namespace tarnwick
