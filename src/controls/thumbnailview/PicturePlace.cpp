#include "controls/thumbnailview/PicturePlace.h"

#include <limits>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"

namespace tarnwick {
namespace {

// Twips.
constexpr std::int32_t kBoxSide = 1965;
constexpr double kBoxLeft = 150;
constexpr double kBoxTop = 180;

// side * kBoxSide / longer, rounded half to even.
std::int32_t Scaled(std::int32_t side, std::int32_t longer) {
  const std::int64_t product = std::int64_t{side} * kBoxSide;
  if (product > std::numeric_limits<std::int32_t>::max()) throw RuntimeError(error::kOverflow);
  if (longer == 0) throw RuntimeError(error::kDivisionByZero);
  return RoundHalfToEven(static_cast<double>(product) / longer);
}

}  // namespace

PicturePlace FitImage(std::int32_t height, std::int32_t width) {
  PicturePlace place{kBoxLeft, kBoxTop, kBoxSide, kBoxSide};
  if (height <= width) {
    place.height = Scaled(height, width);
    place.top += (kBoxSide - place.height) / 2.0;
  } else {
    place.width = Scaled(width, height);
    place.left += (kBoxSide - place.width) / 2.0;
  }
  return place;
}

PicturePlace Turned(const PicturePlace& place) {
  return {kBoxLeft + place.top - kBoxTop, kBoxTop + place.left - kBoxLeft, place.height, place.width};
}

}  // namespace tarnwick
