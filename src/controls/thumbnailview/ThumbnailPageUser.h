// What the window of the thumbnail control tells of the user. The host's code runs inside these calls and may
// end the control. No member throws.
#pragma once

#include "base/Text.h"

namespace tarnwick {

class ThumbnailPageUser {
 public:
  virtual ~ThumbnailPageUser() = default;

  // A mouse button went down on a slot's frame, picture or caption.
  virtual void SlotPressed(int slot, bool rightButton) = 0;
  // The same beside the slots.
  virtual void BackgroundPressed(bool rightButton) = 0;
  // A key in the grid, by its virtual key code.
  virtual void KeyPressed(int key) = 0;
  // The scroll bar has come to rest at a value; its thumb is being dragged over one.
  virtual void ScrollChanged(int value) = 0;
  virtual void ScrollDragged(int value) = 0;
  virtual void LinkClicked() = 0;
  virtual void SwitchViewClicked() = 0;
  // Enter in the editor; Escape there, or the focus went elsewhere. The editor is shown until HideEditor.
  virtual void EditorEntered() = 0;
  virtual void EditorLeft() = 0;
  // A slot's picture is dragged out.
  virtual void DragBegins() = 0;
  virtual void GotFocus() = 0;
  virtual void LostFocus() = 0;
};

}  // namespace tarnwick
