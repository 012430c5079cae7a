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
  if (facts.fault != PictureFault::kNone) return 0;
  if (facts.length > size || std::uint64_t{facts.width} * facts.height > kMostPixels) std::abort();
  const bool measured = facts.format != PictureFormat::kWebp && facts.format != PictureFormat::kHeif;
  if ((facts.frameWidth > 0) != measured || facts.left + facts.frameWidth > facts.width) std::abort();
  if ((facts.frameHeight > 0) != measured || facts.top + facts.frameHeight > facts.height) std::abort();
  if (facts.orientation < 1 || facts.orientation > 8) std::abort();
  file.resize(facts.length);
  PictureFacts again = ReducePicture(file);
  // What tells it makes no pixels, and may have been left out.
  again.orientation = facts.orientation;
  if (again != facts) std::abort();
  return 0;
}
