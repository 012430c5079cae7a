// Where everything stands on the thumbnail page, in twips (1440 to an inch, 15 to a pixel at 96 dots per
// inch). The page does not re-arrange itself; a larger control has room to the right and below.
#pragma once

#include <array>
#include <cmath>

#include "controls/thumbnailview/ThumbnailPage.h"
#include "platform/windows/WindowsHeaders.h"

namespace tarnwick::layout {

struct TwipRect {
  int left;
  int top;
  int right;
  int bottom;
};

inline constexpr int kTwipsPerInch = 1440;
inline constexpr int kMargin = 75;
inline constexpr int kPictureSide = 1965;
inline constexpr int kPictureLeft = 150;
inline constexpr int kPictureTop = 180;
inline constexpr int kFrameWidth = kPictureLeft + kPictureSide + kPictureLeft;
inline constexpr int kFrameHeight = 2730;

// The whole page. Its size is the control's natural one; it is a whole number of pixels and of HIMETRIC.
inline constexpr TwipRect kPage = {0, 0, 5040, 6120};
inline constexpr SIZEL kPageHimetric = {kPage.right * 2540 / kTwipsPerInch,
                                        kPage.bottom * 2540 / kTwipsPerInch};

// In the page.
inline constexpr int kSecondColumn = kMargin + kFrameWidth + kMargin;
inline constexpr int kSecondRow = kMargin + kFrameHeight + kMargin;
inline constexpr TwipRect kGrid = {0, 0, kSecondColumn + kFrameWidth + kMargin,
                                   kSecondRow + kFrameHeight + kMargin};
inline constexpr TwipRect kScrollBar = {kPage.right - 270, 0, kPage.right, kGrid.bottom};
inline constexpr TwipRect kButton = {kMargin, kGrid.bottom + 15, kMargin + 1350, kGrid.bottom + 15 + 345};
inline constexpr TwipRect kMessage = {kMargin, 2100, kGrid.right - kMargin, 2580};
// Both labels stand in the middle, as wide as their texts, and have more lines in a large font.
inline constexpr TwipRect kLink = {kMargin, 2610, kGrid.right - kMargin, 2910};

// In the grid, whose corner is the page's.
constexpr TwipRect Frame(int left, int top) {
  return {left, top, left + kFrameWidth, top + kFrameHeight};
}
inline constexpr std::array<TwipRect, kSlotCount> kFrames = {
    Frame(kMargin, kMargin), Frame(kSecondColumn, kMargin), Frame(kMargin, kSecondRow),
    Frame(kSecondColumn, kSecondRow)};

// In a slot's frame. The marker is a ring around the picture, the caption has room for two lines of a font of
// 8 points, in a larger one for one.
inline constexpr TwipRect kPicture = {kPictureLeft, kPictureTop, kPictureLeft + kPictureSide,
                                      kPictureTop + kPictureSide};
inline constexpr int kMarkerWidth = 45;
inline constexpr int kMarkerGap = 15;
inline constexpr int kMarkerReach = kMarkerGap + kMarkerWidth;
inline constexpr TwipRect kMarker = {kPicture.left - kMarkerReach, kPicture.top - kMarkerReach,
                                     kPicture.right + kMarkerReach, kPicture.bottom + kMarkerReach};
inline constexpr TwipRect kCaption = {kMarker.left, kMarker.bottom, kMarker.right, kFrameHeight - 60};

inline int Pixels(double twips, int dpi) {
  return static_cast<int>(std::lround(twips * dpi / kTwipsPerInch));
}
// Edges are rounded, not sizes, so that what touches in twips touches in pixels.
inline RECT Pixels(const TwipRect& area, int dpi) {
  return {Pixels(area.left, dpi), Pixels(area.top, dpi), Pixels(area.right, dpi), Pixels(area.bottom, dpi)};
}

}  // namespace tarnwick::layout
