// Whatever a picture file holds: it is reduced within its own bytes, what is told is within the limits, and
// what was kept is a file of the same picture, of which nothing more can be left out.
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "support/PictureBytes.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tarnwick;
  std::vector<std::uint8_t> file(data, data + size);
  auto facts = ReducePicture(file);
  if (!facts) return 0;
  if (facts->length > size || std::uint64_t{facts->width} * facts->height > kMostPixels) std::abort();
  if (facts->frameWidth == 0 || facts->left + facts->frameWidth > facts->width) std::abort();
  if (facts->frameHeight == 0 || facts->top + facts->frameHeight > facts->height) std::abort();
  if (facts->orientation < 1 || facts->orientation > 8) std::abort();
  // What tells it makes no pixels.
  facts->orientation = 1;
  file.resize(facts->length);
  if (ReducePicture(file) != facts) std::abort();
  return 0;
}
