// Decodes pictures beside the thread of a window, in the system's pool of threads.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "controls/thumbnailview/PicturePlace.h"
#include "controls/windows/PictureLoader.h"
#include "platform/windows/MessageWindow.h"

namespace tarnwick {

// A picture file as it is at a moment, and how it is to be shown.
struct PictureRequest {
  std::wstring path;
  std::uint64_t length = 0;
  std::uint64_t written = 0;  // when, as the file system counts
  // Of the picture as it lies in the file; empty when its size is not known.
  std::optional<PicturePlace> place;
  int dpi = 0;
  COLORREF background = 0;

  bool operator==(const PictureRequest&) const = default;
};

// A picture as large as it is shown, at `place` in its slot's frame, in pixels. Empty when it cannot be
// shown.
struct ShownPicture {
  DecodedPicture decoded;
  RECT place = {};
};

class PictureWorkers {
 public:
  // Takes a picture. Called on the thread of the object, for what somebody still waits for.
  using Taker = std::function<void(const std::shared_ptr<const PictureRequest>&, ShownPicture)>;

  explicit PictureWorkers(Taker taker);
  // Does not wait for what is being decoded.
  ~PictureWorkers();
  PictureWorkers(const PictureWorkers&) = delete;
  PictureWorkers& operator=(const PictureWorkers&) = delete;

  // Has the file's bytes decoded, in the order of these calls. Decoding is given up when nobody else holds
  // `request` any more. False when no worker can be had.
  bool Start(const std::shared_ptr<const PictureRequest>& request, PictureFile file);
  // Waits until all pictures are taken, and takes part in decoding them.
  void Finish();

 private:
  // What the workers share with the object; lives until the last of both has ended.
  struct Shared;

  void Take();

  const Taker taker_;
  const std::shared_ptr<Shared> shared_;
  MessageWindow window_;
};

}  // namespace tarnwick
