// The pictures of the file list: pages with a folded corner and a band that tells the type of file, drawn for
// the resolution of the screen.
#pragma once

#include "platform/windows/CommonControls.h"
#include "platform/windows/Owner.h"

namespace tarnwick {

using ImageListOwner = Owner<HIMAGELIST, ImageList_Destroy>;

// Entries count from 1, as hosts count. GIF files have entry 2 of the large pictures and entry 4 of the small
// ones, JPEG files and all others entries 4 and 5; the entries between are plain pages.
namespace icon {
inline constexpr int kLargeGif = 2;
inline constexpr int kLargeJpeg = 4;
inline constexpr int kLargeCount = 4;
inline constexpr int kSmallGif = 4;
inline constexpr int kSmallJpeg = 5;
inline constexpr int kSmallCount = 5;
}  // namespace icon

// The lists for a screen of `dpi` dots per inch (32 and 16 pixels at 96); empty on failure.
ImageListOwner MakeLargeIcons(int dpi);
ImageListOwner MakeSmallIcons(int dpi);

}  // namespace tarnwick
