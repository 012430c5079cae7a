// The library's entries in the registry: its classes and its type library, for all users of the machine.
#pragma once

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

// Registers the file that this code was loaded from. On failure nothing stays registered.
HRESULT Register();

// Removes all that Register wrote; fine when nothing is there.
HRESULT Unregister();

}  // namespace tarnwick
