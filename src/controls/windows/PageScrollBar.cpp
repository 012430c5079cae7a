#include "controls/windows/PageScrollBar.h"

#include <algorithm>

#include "controls/thumbnailview/ThumbnailPage.h"

namespace tarnwick {
namespace {

// Pictures in a row.
constexpr int kStep = 2;

}  // namespace

void PageScrollBar::SetWindow(HWND window) {
  window_ = window;
  Apply();
}

void PageScrollBar::SetRange(int max) {
  max_ = std::max(0, max);
  SetValue(value_);
}

void PageScrollBar::Enable(bool enabled) {
  enabled_ = enabled;
  Apply();
}

void PageScrollBar::SetValue(int value) {
  value_ = restValue_ = std::clamp(value, 0, max_);
  Apply();
}

void PageScrollBar::Apply() const {
  if (!window_) return;
  SCROLLINFO info = {};
  info.cbSize = sizeof info;
  info.fMask = SIF_RANGE | SIF_PAGE | SIF_POS;
  // The thumb is as long as a page, so the range is as long as all pictures.
  info.nMax = max_ + kSlotCount - 1;
  info.nPage = kSlotCount;
  info.nPos = value_;
  SetScrollInfo(window_, SB_CTL, &info, TRUE);
  EnableWindow(window_, enabled_);
}

void PageScrollBar::OnScroll(int code, int position, ThumbnailPageUser& user) {
  // The message carries 16 bits of the position; the bar knows them all.
  SCROLLINFO info = {};
  info.cbSize = sizeof info;
  info.fMask = SIF_TRACKPOS;
  if (GetScrollInfo(window_, SB_CTL, &info) && (info.nTrackPos & 0xFFFF) == position)
    position = info.nTrackPos;
  // Between two rows the thumb stands for the upper one, so that no picture changes its column.
  const int dragged = std::clamp(position - position % kStep, 0, max_);
  switch (code) {
    case SB_LINEUP:
    case SB_PAGEUP:
      MoveTo(value_ - kStep, user);
      break;
    case SB_LINEDOWN:
    case SB_PAGEDOWN:
      MoveTo(value_ + kStep, user);
      break;
    case SB_TOP:
      MoveTo(0, user);
      break;
    case SB_BOTTOM:
      MoveTo(max_, user);
      break;
    case SB_THUMBPOSITION:
      MoveTo(dragged, user);
      break;
    case SB_THUMBTRACK:
      if (dragged == value_) break;
      value_ = dragged;
      draggedAway_ = true;
      user.OnScrollDragged(dragged);
      break;
    default:
      break;
  }
}

void PageScrollBar::OnWheel(int delta, ThumbnailPageUser& user) {
  wheelRest_ += delta;
  const int notches = wheelRest_ / WHEEL_DELTA;
  wheelRest_ -= notches * WHEEL_DELTA;
  MoveTo(value_ - notches * kStep, user);
}

void PageScrollBar::MoveTo(int value, ThumbnailPageUser& user) {
  value_ = std::clamp(value, 0, max_);
  Apply();
  // Let go where it was, it has shown other pages meanwhile.
  if (value_ == restValue_ && !draggedAway_) return;
  draggedAway_ = false;
  restValue_ = value_;
  user.OnScrollChanged(value_);
}

void PageScrollBar::Draw(HDC dc, const RECT& area, int leastThumb) const {
  FillRect(dc, &area, GetSysColorBrush(COLOR_SCROLLBAR));
  const UINT state = enabled_ ? 0 : DFCS_INACTIVE;
  RECT up = area;
  RECT down = area;
  up.bottom = up.top + (area.right - area.left);
  down.top = down.bottom - (area.right - area.left);
  DrawFrameControl(dc, &up, DFC_SCROLL, DFCS_SCROLLUP | state);
  DrawFrameControl(dc, &down, DFC_SCROLL, DFCS_SCROLLDOWN | state);
  if (!enabled_) return;
  const int track = down.top - up.bottom;
  const int all = max_ + kSlotCount;
  RECT thumb = {area.left, up.bottom + MulDiv(track, value_, all), area.right, 0};
  thumb.bottom = thumb.top + std::max(leastThumb, MulDiv(track, kSlotCount, all));
  DrawFrameControl(dc, &thumb, DFC_BUTTON, DFCS_BUTTONPUSH);
}

}  // namespace tarnwick
