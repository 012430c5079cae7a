// The scroll bar beside the thumbnails. It keeps its state without a window, too.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include "controls/thumbnailview/ThumbnailPageUser.h"

namespace tarnwick {

class PageScrollBar {
 public:
  // Shows the state in a scroll bar control; null when that is gone.
  void SetWindow(HWND window);

  void SetRange(int max);
  void Enable(bool enabled);
  void SetValue(int value);
  int Value() const { return value_; }
  bool IsEnabled() const { return enabled_; }

  // The user moves the bar, or turns the wheel. `user` is notified in it, who may fill a page: that pumps
  // messages and runs the host's code.
  void OnScroll(int code, int position, ThumbnailPageUser& user);
  void OnWheel(int delta, ThumbnailPageUser& user);

  // Draws the bar as a window would show it. `leastThumb` is the least height of the thumb in pixels.
  void Draw(HDC dc, const RECT& area, int leastThumb) const;

 private:
  void MoveTo(int value, ThumbnailPageUser& user);
  void Apply() const;

  HWND window_ = nullptr;
  int max_ = 0;
  int value_ = 0;
  // Where the bar was at rest last; differs from the value while the thumb is dragged.
  int restValue_ = 0;
  // A drag of the thumb has shown another page since.
  bool draggedAway_ = false;
  bool enabled_ = true;
  // What is left of the wheel's turn, less than a notch.
  int wheelRest_ = 0;
};

}  // namespace tarnwick
