// Pictures as they were shown, so that a page that comes back costs nothing.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <cstddef>
#include <list>
#include <memory>

#include "controls/windows/PictureWorkers.h"

namespace tarnwick {

using SharedPicture = std::shared_ptr<const ShownPicture>;

class PictureCache {
 public:
  // Null when it is not there.
  SharedPicture Find(const PictureRequest& request);
  // Keeps a picture as long as there is room for it; what was not used for the longest time goes first.
  void Keep(const PictureRequest& request, const SharedPicture& picture);

 private:
  struct Entry {
    PictureRequest request;
    SharedPicture picture;
  };
  // What was used last is in front. Some hundred entries at most, which are compared faster than drawn.
  std::list<Entry> entries_;
  std::size_t bytes_ = 0;
};

}  // namespace tarnwick
