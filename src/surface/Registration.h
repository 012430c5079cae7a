// The library's entries in the registry: its classes and its type library.
#pragma once

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

// For all users of the machine, which takes an administrator, or for the current one.
enum class Scope { kMachine, kUser };

// Registers the file that this code was loaded from. On failure nothing stays registered.
HRESULT Register(Scope scope);

// Removes all that Register wrote; fine when nothing is there.
HRESULT Unregister(Scope scope);

}  // namespace tarnwick
