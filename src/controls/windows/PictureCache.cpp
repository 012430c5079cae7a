#include "controls/windows/PictureCache.h"

#include <algorithm>

namespace tarnwick {
namespace {

// Some 60 pages at 96 dots per inch, and 15 at 192.
constexpr std::size_t kMostBytes = 16 * 1024 * 1024;

std::size_t BytesOf(const ShownPicture& picture) {
  const RECT& place = picture.place;
  return std::size_t{4} * static_cast<std::size_t>(place.right - place.left) *
         static_cast<std::size_t>(place.bottom - place.top);
}

}  // namespace

SharedPicture PictureCache::Find(const PictureRequest& request) {
  const auto found = std::ranges::find(entries_, request, &Entry::request);
  if (found == entries_.end()) return {};
  entries_.splice(entries_.begin(), entries_, found);
  return found->picture;
}

void PictureCache::Keep(const PictureRequest& request, const SharedPicture& picture) {
  entries_.push_front({request, picture});
  bytes_ += BytesOf(*picture);
  while (bytes_ > kMostBytes) {
    bytes_ -= BytesOf(*entries_.back().picture);
    entries_.pop_back();
  }
}

}  // namespace tarnwick
