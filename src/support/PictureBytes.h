// What stands in the bytes of a picture file, looked at before a decoder gets them. A decoder believes what a
// file says: it reserves the memory and takes the time that a few bytes ask for. So files that claim too much
// are refused here, and what does not make the pixels (thumbnails in thumbnails, profiles, comments, the
// further pictures of an animation) is left out.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

namespace tarnwick {

// A picture of 64 megapixels is shown, a larger one is not: a decoder holds four bytes a pixel.
inline constexpr std::uint64_t kMostPixels = 64'000'000;

// The largest file that is read: that many uncompressed pixels of four bytes, and headers. Whatever is larger
// is no picture within that limit, or has more than a quarter of a gigabyte beside it.
inline constexpr std::uint64_t kMostPictureBytes = 4 * kMostPixels + 1'000'000;

// The longest side of the formats that CImageHeight does not know, for whose sizes there is no bound in bits.
inline constexpr std::uint32_t kLongestSide = 1'000'000;

enum class PictureFormat { kPng, kGif, kJpeg, kBmp, kTiff, kWebp, kHeif };

// Why a file is not shown.
enum class PictureFault { kNone, kDamaged, kTooLarge, kOtherKind };

// Of the first so many bytes of a file, the format that they begin; empty for none of them. A decoder for
// WebP and HEIF (HEIC and AVIF) is not on every system.
inline constexpr std::size_t kFormatBytes = 12;
std::optional<PictureFormat> FormatOf(std::span<const std::uint8_t> head);

struct PictureFacts {
  // What the rest means something without.
  PictureFault fault = PictureFault::kDamaged;
  PictureFormat format = PictureFormat::kBmp;
  // The whole picture, in pixels; 0 where only a decoder tells (WebP, HEIF).
  std::uint32_t width = 0;
  std::uint32_t height = 0;
  // What the decoder calls the picture; smaller than the whole only where a GIF's first picture covers a
  // part.
  std::uint32_t left = 0;
  std::uint32_t top = 0;
  std::uint32_t frameWidth = 0;
  std::uint32_t frameHeight = 0;
  // How the picture is to be seen, as Exif counts: 1 is as it lies in the file; the first line of 2 to 4 is
  // at the top or bottom, of 5 to 8 at the left or right.
  unsigned orientation = 1;
  // The first so many bytes are a file with all that makes the picture.
  std::size_t length = 0;

  bool operator==(const PictureFacts&) const = default;
};

// Whether the picture is seen with its sides exchanged.
inline bool IsTurned(const PictureFacts& facts) {
  return facts.orientation >= 5;
}

// Whether CImageHeight knows the format, whose sizes are then those that count on the page.
inline bool IsMeasured(const PictureFacts& facts) {
  return facts.format <= PictureFormat::kBmp;
}

// What is wrong with a size; kNone for one that is shown.
PictureFault SizeFault(std::uint64_t width, std::uint64_t height);

// Looks at a whole file and moves what makes the picture to its front. Each byte is looked at once at most.
PictureFacts ReducePicture(std::span<std::uint8_t> file);

}  // namespace tarnwick
