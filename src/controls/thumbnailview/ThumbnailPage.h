// The seam to the window of the thumbnail control: four slots, a scroll bar, the texts of an empty account,
// the editor over a caption and the button that switches to the list.
#pragma once

#include <optional>

#include "base/Text.h"
#include "controls/ControlView.h"
#include "controls/thumbnailview/PicturePlace.h"

namespace tarnwick {

inline constexpr int kSlotCount = 4;

// Slots count from 1: top left, top right, bottom left, bottom right. What the rules change through this
// interface is not reported back to them: ThumbnailPageUser hears of what the user does.
class ThumbnailPage : public ControlView {
 public:
  // The grid with its scroll bar, or in its place message and link. Showing the grid shows all four slots.
  virtual void ShowGrid(bool grid) = 0;
  // The texts of an empty account.
  virtual void SetEmptyTexts(TextView message, TextView link) = 0;
  // What the grid says in place of pictures, where the message of an empty account stands; empty for nothing.
  virtual void SetGridText(TextView text) = 0;

  // Frame and caption of a slot.
  virtual void ShowSlot(int slot, bool shown) = 0;
  // Takes the picture out and empties caption and tip.
  virtual void ClearSlot(int slot) = 0;
  // "&&" stands for one "&", as in the caption of any label.
  virtual void SetCaption(int slot, TextView caption) = 0;
  // What is told when the pointer rests on the slot, in lines. The page adds why its picture is not shown.
  virtual void SetTip(int slot, TextView tip) = 0;
  // Reads the file, and shows it as soon as it is decoded, which takes no time of the caller's. `place` is
  // that of the picture as it lies in the file; one that its file has turned stands as it is seen. Without
  // it, and for a format that CImageHeight does not know, the place follows from the size that the decoder
  // tells. False when the file cannot be read or does not begin as a picture. One that turns out to be
  // damaged, or an absurdly large one, leaves the square empty, too, and ThumbnailPageUser hears of it.
  virtual bool SetPicture(int slot, TextView path, const std::optional<PicturePlace>& place) = 0;
  // The look of the selected picture.
  virtual void SetSelected(int slot, bool selected) = 0;

  // A move of the scroll bar by an arrow or beside the thumb is two pictures. `max` may be negative while
  // disabled.
  virtual void SetScrollRange(int max) = 0;
  virtual void EnableScroll(bool enabled) = 0;
  virtual void SetScrollValue(int value) = 0;
  virtual int ScrollValue() const = 0;

  // The editor over the slot's caption, with all of `name` selected.
  virtual void ShowEditor(int slot, TextView name) = 0;
  virtual void HideEditor() = 0;
  virtual Text EditorText() const = 0;

  // Whether the keyboard focus is in the window of the control or below it.
  virtual bool HasFocus() const = 0;
};

}  // namespace tarnwick
