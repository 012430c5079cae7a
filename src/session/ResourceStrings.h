// Localised message texts: the host product's resource library comes first, the library's own strings second.
#pragma once

#include <cstdint>

#include "base/Text.h"

namespace tarnwick {

struct Apartment;

// Loads the resource library from the host product's install folder, once per apartment. A missing setting or
// file loads nothing, silently.
void LoadResourceLibrary(Apartment& apartment) noexcept;

// The string of that identifier. Throws run-time error 326 when neither library has it.
Text GetResourceString(Apartment& apartment, std::uint16_t identifier);

}  // namespace tarnwick
