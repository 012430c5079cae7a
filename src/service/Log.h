#pragma once

#include "base/Text.h"

namespace tarnwick {

// Takes the progress texts of the service client. A hook that is empty on purpose: nothing is written
// anywhere.
inline void Log(TextView /*progress*/) noexcept {}

}  // namespace tarnwick
