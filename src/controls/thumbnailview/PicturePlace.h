// Where a picture stands in its slot's frame.
#pragma once

#include <cstdint>

namespace tarnwick {

// In twips (1440 to an inch).
struct PicturePlace {
  double left = 0;
  double top = 0;
  std::int32_t width = 0;
  std::int32_t height = 0;

  bool operator==(const PicturePlace&) const = default;
};

// Where a picture of that size in pixels stands in its slot: as large as the square of 1965 twips lets it be,
// in the middle. Throws 11 for a side of 0 that it would have to divide by, 6 when the product is too large.
PicturePlace FitImage(std::int32_t height, std::int32_t width);

// The place of the same picture with its sides exchanged.
PicturePlace Turned(const PicturePlace& place);

}  // namespace tarnwick
