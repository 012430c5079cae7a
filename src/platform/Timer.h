// The seam to a timer that runs out once, told through the thread's messages.
#pragma once

#include <cstdint>
#include <functional>

namespace tarnwick {

class Timer {
 public:
  virtual ~Timer() = default;

  virtual void SetHandler(std::function<void()> handler) = 0;
  // Runs out after so many milliseconds, counted anew from here.
  virtual void Start(std::uint32_t milliseconds) = 0;
  virtual void Stop() = 0;
};

}  // namespace tarnwick
