#include "controls/windows/PictureWorkers.h"

#include <objbase.h>

#include <algorithm>
#include <list>
#include <mutex>
#include <utility>

#include "controls/windows/ThumbnailLayout.h"
#include "platform/windows/ThreadPool.h"

namespace tarnwick {
namespace {

constexpr UINT kDecoded = WM_APP;

// What each of them decodes may take a quarter of a gigabyte.
constexpr DWORD kMostWorkers = 4;

DWORD MostWorkers() {
  SYSTEM_INFO system = {};
  GetSystemInfo(&system);
  return std::clamp<DWORD>(system.dwNumberOfProcessors, 1, kMostWorkers);
}

struct Job {
  std::weak_ptr<const PictureRequest> request;
  PictureFile file;
  std::optional<PicturePlace> place;
  int dpi;
  COLORREF background;
  ShownPicture picture;
};

RECT Pixels(const PicturePlace& place, int dpi) {
  const auto pixels = [dpi](double twips) { return layout::Pixels(twips, dpi); };
  RECT area = {pixels(place.left), pixels(place.top), pixels(place.left + place.width),
               pixels(place.top + place.height)};
  // Of a very long or very high picture a line remains.
  area.right = std::max(area.right, area.left + 1);
  area.bottom = std::max(area.bottom, area.top + 1);
  return area;
}

void Decode(Job& job) {
  RECT& place = job.picture.place;
  const auto size = [&](const PictureFacts& facts) {
    const PicturePlace stored =
        job.place && IsMeasured(facts)
            ? *job.place
            : FitImage(static_cast<std::int32_t>(facts.height), static_cast<std::int32_t>(facts.width));
    place = Pixels(IsTurned(facts) ? Turned(stored) : stored, job.dpi);
    return SIZE{place.right - place.left, place.bottom - place.top};
  };
  job.picture.decoded =
      DecodePicture(std::move(job.file), size, job.background, [&] { return !job.request.expired(); });
}

}  // namespace

struct PictureWorkers::Shared {
  // Not held while anything is decoded.
  std::mutex lock;
  // Jobs move from one list to the other, which takes no memory and cannot fail.
  std::list<Job> waiting;
  std::list<Job> decoded;
  DWORD running = 0;
  // Gets a message for each picture that is decoded; null when nobody takes them any more.
  HWND window = nullptr;
  // Set when a worker ends.
  HandleOwner ended{CreateEventW(nullptr, FALSE, FALSE, nullptr)};

  void Work();
};

// Decodes until nothing waits. The caller has counted itself as running.
void PictureWorkers::Shared::Work() {
  const bool com = SUCCEEDED(CoInitializeEx(nullptr, COINIT_MULTITHREADED));
  for (;;) {
    std::list<Job> current;
    {
      const std::lock_guard guard(lock);
      if (waiting.empty()) {
        --running;
        break;
      }
      current.splice(current.begin(), waiting, waiting.begin());
    }
    Decode(current.front());
    const std::lock_guard guard(lock);
    decoded.splice(decoded.end(), current);
    if (window) PostMessageW(window, kDecoded, 0, 0);
  }
  SetEvent(ended.Get());
  if (com) CoUninitialize();
}

PictureWorkers::PictureWorkers(Taker taker)
    : taker_(std::move(taker)),
      shared_(std::make_shared<Shared>()),
      window_([this](UINT message, WPARAM, LPARAM) {
        if (message != kDecoded) return false;
        Take();
        return true;
      }) {}

PictureWorkers::~PictureWorkers() {
  std::list<Job> dropped;
  const std::lock_guard guard(shared_->lock);
  dropped.swap(shared_->waiting);
  shared_->window = nullptr;
}

bool PictureWorkers::Start(const std::shared_ptr<const PictureRequest>& request, PictureFile file) {
  static const DWORD mostWorkers = MostWorkers();
  const HWND window = window_.Get();
  if (!window) return false;
  std::list<Job> job;
  job.push_back({request, std::move(file), request->place, request->dpi, request->background, {}});
  const std::lock_guard guard(shared_->lock);
  shared_->window = window;
  // Whoever leafs quickly must not fill the memory.
  shared_->waiting.remove_if([](const Job& other) { return other.request.expired(); });
  if (shared_->running < mostWorkers && RunOnPool([shared = shared_] { shared->Work(); })) ++shared_->running;
  if (shared_->running == 0) return false;
  shared_->waiting.splice(shared_->waiting.end(), job);
  return true;
}

void PictureWorkers::Finish() {
  const auto isBusy = [this] {
    const std::lock_guard guard(shared_->lock);
    return shared_->running > 0;
  };
  if (isBusy()) {
    {
      const std::lock_guard guard(shared_->lock);
      ++shared_->running;
    }
    shared_->Work();
    while (isBusy()) WaitForSingleObject(shared_->ended.Get(), INFINITE);
  }
  Take();
}

void PictureWorkers::Take() {
  std::list<Job> decoded;
  {
    const std::lock_guard guard(shared_->lock);
    decoded.swap(shared_->decoded);
  }
  for (Job& job : decoded)
    if (const auto request = job.request.lock()) taker_(request, std::move(job.picture));
}

}  // namespace tarnwick
