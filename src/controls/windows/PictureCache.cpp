#include "controls/windows/PictureCache.h"

#include <algorithm>

namespace tarnwick {
namespace {

// Some 60 pages at 96 dots per inch, and 15 at 192.
constexpr std::size_t kMostBytes = 16 * 1024 * 1024;

std::size_t BytesOf(const PictureRequest& request) {
  return std::size_t{4} * static_cast<std::size_t>(request.width) * static_cast<std::size_t>(request.height);
}

}  // namespace

SharedBitmap PictureCache::Find(const PictureRequest& request) {
  const auto found = std::ranges::find(entries_, request, &Entry::request);
  if (found == entries_.end()) return {};
  entries_.splice(entries_.begin(), entries_, found);
  return found->picture;
}

void PictureCache::Keep(const PictureRequest& request, const SharedBitmap& picture) {
  entries_.push_front({request, picture});
  bytes_ += BytesOf(request);
  while (bytes_ > kMostBytes) {
    bytes_ -= BytesOf(entries_.back().request);
    entries_.pop_back();
  }
}

}  // namespace tarnwick
