// Whatever a picture file holds: its header is read within the bytes there are, and what is told makes sense.
#include <cstdint>
#include <cstdlib>
#include <string>

#include "fakes/FakePlatform.h"
#include "support/CImageHeight.h"

namespace {

using namespace tarnwick;

struct Told {
  std::int32_t type, width, height, depth;
  bool overflow;
  bool operator==(const Told&) const = default;
};

Told Read(std::string_view head) {
  FakeFiles files;
  CImageHeight reader(files);
  bool overflow = false;
  try {
    reader.ReadImageInfo(head);
  } catch (const RuntimeError& failure) {
    if (failure.Number() != error::kOverflow || reader.Depth() != 0) std::abort();
    overflow = true;
  }
  return {reader.ImageType(), reader.Width(), reader.Height(), reader.Depth(), overflow};
}

bool MakesSense(const Told& told) {
  if (told.width < 0 || told.width > 65535 || told.height < 0 || told.height > 65535) return false;
  switch (told.type) {
    case kImageUnknown:
      return told == Told{};
    case kImageGif:
      return told.depth >= 1 && told.depth <= 8 && !told.overflow;
    case kImageJpeg:
      return told.depth % 8 == 0;
    case kImagePng:
      return !told.overflow || (told.width == 0 && told.height == 0);
    case kImageBmp:
      return !told.overflow;
    default:
      return false;
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string_view head(reinterpret_cast<const char*>(data), size);
  const Told told = Read(head);
  // What is behind the end of a file counts as zeros.
  if (!MakesSense(told) || told != Read(std::string(head) + std::string(40, '\0'))) std::abort();
  return 0;
}
