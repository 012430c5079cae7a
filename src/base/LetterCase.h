// Letter case as the system knows it. The platform implements this, so that the rules do without the system's
// headers.
#pragma once

#include <span>

namespace tarnwick {

// Converts the units to lower case, each by itself and independent of the user's locale. Where the system
// cannot, they stay as they are.
void MakeLowerCase(std::span<char16_t> units) noexcept;

}  // namespace tarnwick
