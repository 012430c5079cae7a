// Pictures for small views: read from a file, averaged down and laid on a background.
#pragma once

#include <string>

#include "platform/windows/Owner.h"

namespace tarnwick {

// Reads a PNG, GIF (its first picture), JPEG or BMP file, told by its bytes and not by its name, scales it to
// exactly `width` x `height` device pixels and lays it on `background`, which shows through where the picture
// is transparent. When it shrinks, each pixel is the average of all that it covers, parts of pixels included.
//
// The result is a top-down section of 32 bits a pixel, the highest byte 255; nobody else has it selected.
// Empty when the file cannot be read, is none of the four, is broken or cut off, has more than 64,000,000
// pixels or is made to take long, when a side is not positive, or when memory runs out. Never throws.
//
// The calling thread has initialised COM. The file is closed when the function returns.
BitmapOwner LoadPicture(const std::wstring& path, int width, int height, COLORREF background);

}  // namespace tarnwick
