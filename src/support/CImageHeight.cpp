#include "support/CImageHeight.h"

#include <algorithm>
#include <span>

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"

namespace tarnwick {
namespace {

// Where the search for a JPEG header ends: what is read of a header found before has room behind it.
constexpr std::size_t kScanEnd = CImageHeight::kHeadBytes - 11;

// A short file counts as if zeros followed it, so that a header that is cut off needs no checks of its own.
std::uint8_t ByteAt(std::string_view head, std::size_t position) {
  return position < head.size() ? static_cast<std::uint8_t>(head[position]) : std::uint8_t{0};
}

std::int32_t Mult(std::uint8_t low, std::uint8_t high) {
  return low + high * 256;
}

std::int32_t LittleEndianAt(std::string_view head, std::size_t position) {
  return Mult(ByteAt(head, position), ByteAt(head, position + 1));
}

std::int32_t BigEndianAt(std::string_view head, std::size_t position) {
  return Mult(ByteAt(head, position + 1), ByteAt(head, position));
}

std::uint8_t DepthOf(std::uint8_t bits, int channels) {
  const int depth = bits * channels;
  if (depth > 0xFF) throw RuntimeError(error::kOverflow);
  return static_cast<std::uint8_t>(depth);
}

// Frames of every kind; what lies between them are tables and an extension.
bool IsStartOfFrame(std::uint8_t code) {
  return code >= 192 && code <= 207 && code != 196 && code != 200 && code != 204;
}

}  // namespace

void CImageHeight::ReadImageInfo(TextView path) {
  Reset();
  // Not cleared: what is behind the bytes of the file is not looked at. It is kept for the next picture,
  // because fresh memory of this size takes the system several times as long as the file does.
  if (!buffer_) buffer_ = std::make_unique_for_overwrite<char[]>(kHeadBytes);
  const std::size_t count = files_.ReadBeginning(path, std::span(buffer_.get(), kHeadBytes));
  ReadImageInfo(std::string_view(buffer_.get(), count));
}

void CImageHeight::ReadImageInfo(std::string_view head) {
  Reset();
  if (head.starts_with("\x89PN")) ReadPng(head);
  if (head.starts_with("GIF")) ReadGif(head);
  if (head.starts_with("BM")) ReadBmp(head);
  // Whatever is no good PNG may still hold a JPEG.
  if (imageType_ == kImageUnknown) ReadJpeg(head);
}

void CImageHeight::Reset() {
  width_ = 0;
  height_ = 0;
  depth_ = 0;
  imageType_ = kImageUnknown;
}

void CImageHeight::ReadPng(std::string_view head) {
  imageType_ = kImagePng;
  const std::uint8_t bits = ByteAt(head, 24);
  switch (ByteAt(head, 25)) {
    case 0:
      depth_ = bits;
      break;
    case 2:
      depth_ = DepthOf(bits, 3);
      break;
    case 3:
      depth_ = 8;
      break;
    case 4:
      depth_ = DepthOf(bits, 2);
      break;
    case 6:
      depth_ = DepthOf(bits, 4);
      break;
    default:
      imageType_ = kImageUnknown;
      return;
  }
  width_ = BigEndianAt(head, 18);
  height_ = BigEndianAt(head, 22);
}

void CImageHeight::ReadGif(std::string_view head) {
  imageType_ = kImageGif;
  width_ = LittleEndianAt(head, 6);
  height_ = LittleEndianAt(head, 8);
  depth_ = static_cast<std::uint8_t>((ByteAt(head, 10) & 7) + 1);
}

void CImageHeight::ReadBmp(std::string_view head) {
  imageType_ = kImageBmp;
  width_ = LittleEndianAt(head, 18);
  height_ = LittleEndianAt(head, 22);
  depth_ = ByteAt(head, 28);
}

void CImageHeight::ReadJpeg(std::string_view head) {
  std::size_t at = head.find("\xFF\xD8\xFF");
  if (at == std::string_view::npos) return;
  at += 2;
  // Behind the bytes of the file there is no marker.
  const std::size_t end = std::min(kScanEnd, head.size());
  while (true) {
    // A marker is a 255 and its code; more of the 255 may stand before it.
    while (at < end && (ByteAt(head, at) != 255 || ByteAt(head, at + 1) == 255)) ++at;
    if (at >= end) return;
    ++at;
    if (IsStartOfFrame(ByteAt(head, at))) break;
    // To the last byte of the segment. A length of 0 stays at the code, which is not 255: the search goes on.
    at += static_cast<std::size_t>(BigEndianAt(head, at + 1));
  }
  imageType_ = kImageJpeg;
  height_ = BigEndianAt(head, at + 4);
  width_ = BigEndianAt(head, at + 6);
  depth_ = DepthOf(ByteAt(head, at + 8), 8);
}

}  // namespace tarnwick
