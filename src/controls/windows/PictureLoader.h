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
  // Why there are none.
  PictureFault fault = PictureFault::kDamaged;

  explicit operator bool() const { return size > 0; }
};

// Empty when the file cannot be read, does not begin as a picture or is larger than any that is shown, or
// when memory runs out. Never throws. The file is closed when the function returns.
PictureFile ReadPictureFile(const std::wstring& path);

// How large a picture is to be shown, in device pixels, as it is seen.
using TargetSize = std::function<SIZE(const PictureFacts&)>;

struct DecodedPicture {
  BitmapOwner bitmap;
  // Why there is none.
  PictureFault fault = PictureFault::kDamaged;

  explicit operator bool() const { return static_cast<bool>(bitmap); }
};

// Decodes a PNG, GIF, JPEG, BMP or TIFF file, and a WebP or HEIF file where the system can, told by its
// bytes. Takes the first picture of several, turns it as its file says (WebP and HEIF: as the decoder does),
// scales it to exactly what `targetSize` tells and lays it on `background`, which shows through where the
// picture is transparent. When it shrinks, each pixel is the average of all that it covers, parts of pixels
// included.
//
// The result is a top-down section of 32 bits a pixel, the highest byte 255; nobody else has it selected.
// Empty when the file is empty, none of these, broken or cut off, has more than 64,000,000 pixels or is made
// to take long, when a side is not positive, when memory runs out, or soon after `isWanted`, which is asked
// now and then, says no. Never throws.
//
// On any thread that has initialised COM.
DecodedPicture DecodePicture(PictureFile file, const TargetSize& targetSize, COLORREF background,
                             const std::function<bool()>& isWanted);

// Both in one, for who can wait.
inline DecodedPicture LoadPicture(const std::wstring& path, int width, int height, COLORREF background) {
  return DecodePicture(
      ReadPictureFile(path),
      [&](const PictureFacts&) {
        return SIZE{width, height};
      },
      background, [] { return true; });
}

}  // namespace tarnwick
