// What a slot of the thumbnails looks like: a frame with a picture and its caption.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include "base/Text.h"
#include "controls/windows/PictureCache.h"

namespace tarnwick {

struct ThumbnailTile {
  Text caption;
  // Null when there is none.
  SharedPicture picture;
  // Where it stands in the frame, or will stand at most.
  RECT place = {};
  bool selected = false;
};

// What all tiles of a page have in common.
struct TileStyle {
  int dpi;
  HFONT font;
  COLORREF background;
};

// `focus` marks the selected tile as the one that the keyboard is for.
void DrawTile(HDC dc, const RECT& frame, const ThumbnailTile& tile, const TileStyle& style, bool focus);

}  // namespace tarnwick
