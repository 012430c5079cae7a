// Work on the system's thread pool.
#pragma once

#include <functional>

namespace tarnwick {

// Runs `work` on a thread of the pool, with this library loaded until it has ended. It may block. False, with
// `work` destroyed unrun, when the pool takes nothing.
bool RunOnPool(std::function<void()> work);

}  // namespace tarnwick
