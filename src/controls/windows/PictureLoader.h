// Pictures for small views: read from a file, averaged down and laid on a background.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "platform/windows/Owner.h"
#include "support/PictureBytes.h"

namespace tarnwick {

// The bytes of a file that may be a picture.
struct PictureFile {
  std::unique_ptr<std::uint8_t[]> bytes;
  std::size_t size = 0;

  explicit operator bool() const { return size > 0; }
};

// Empty when the file cannot be read or is larger than any picture that is shown, or when memory runs out.
// Never throws. The file is closed when the function returns.
PictureFile ReadPictureFile(const std::wstring& path);

// How large a picture is to be shown, in device pixels, as it is seen.
using TargetSize = std::function<SIZE(const PictureFacts&)>;

// Decodes a PNG, GIF (its first picture), JPEG or BMP file, told by its bytes, turns it as its file says,
// scales it to exactly what `targetSize` tells and lays it on `background`, which shows through where the
// picture is transparent. When it shrinks, each pixel is the average of all that it covers, parts of pixels
// included.
//
// The result is a top-down section of 32 bits a pixel, the highest byte 255; nobody else has it selected.
// Empty when the file is empty, none of the four, broken or cut off, has more than 64,000,000 pixels or is
// made to take long, when a side is not positive, when memory runs out, or soon after `isWanted`, which is
// asked now and then, says no. Never throws.
//
// On any thread that has initialised COM.
BitmapOwner DecodePicture(PictureFile file, const TargetSize& targetSize, COLORREF background,
                          const std::function<bool()>& isWanted);

// Both in one, for who can wait.
inline BitmapOwner LoadPicture(const std::wstring& path, int width, int height, COLORREF background) {
  return DecodePicture(
      ReadPictureFile(path),
      [&](const PictureFacts&) {
        return SIZE{width, height};
      },
      background, [] { return true; });
}

}  // namespace tarnwick
