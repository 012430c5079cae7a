// Interfaces and identifiers of our type library.
#pragma once

// First: what is generated includes the system's header, and the macros of that must be gone again.
#include "platform/windows/WindowsHeaders.h"

#include <Tarnwick.h>
