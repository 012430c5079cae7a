// Size, colour depth and format of a picture file, told from its first bytes without decoding the picture.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

class FileSystem;

// Values of CImageHeight::ImageType.
enum ImageFormat : std::int32_t {
  kImageUnknown = 0,
  kImageGif = 1,
  kImageJpeg = 2,
  kImagePng = 3,
  kImageBmp = 4,
};

// One object for many pictures is faster than one for each; it keeps 260 KB of room once it has read a file.
class CImageHeight {
 public:
  // Bytes at the start of a file that count. A header that goes on behind them is not found.
  static constexpr std::size_t kHeadBytes = 266141;

  // `files` outlives the object.
  explicit CImageHeight(FileSystem& files) : files_(files) {}

  // Reads the picture at `path`, of which only the properties are kept. A file that is not there is created
  // empty. Throws 75 or 76 when the file cannot be read, with all properties 0, and 6 when its depth does not
  // fit, with the properties as far as they were known by then.
  void ReadImageInfo(TextView path);

  // The same of a file whose first bytes, or all, are `head`.
  void ReadImageInfo(std::string_view head);

  // Of the picture read last: pixels (PNG, GIF and BMP: the low 16 bits of them), bits for each pixel, and
  // the format. All are 0 when nothing was recognised.
  std::int32_t Width() const { return width_; }
  std::int32_t Height() const { return height_; }
  std::uint8_t Depth() const { return depth_; }
  ImageFormat ImageType() const { return imageType_; }

 private:
  void Reset();
  void ReadPng(std::string_view head);
  void ReadGif(std::string_view head);
  void ReadBmp(std::string_view head);
  void ReadJpeg(std::string_view head);

  FileSystem& files_;
  std::unique_ptr<char[]> buffer_;
  std::int32_t width_ = 0;
  std::int32_t height_ = 0;
  std::uint8_t depth_ = 0;
  ImageFormat imageType_ = kImageUnknown;
};

}  // namespace tarnwick
