// Letter case as the system knows it. The platform implements this, so that the rules do without the system's
// headers.
#pragma once

#include <span>

namespace tarnwick {

// Puts small letters in the place of capital ones, whatever the user's language, each unit by itself. Where
// the system cannot, the letters stay.
void MakeLowerCase(std::span<char16_t> units) noexcept;

}  // namespace tarnwick
