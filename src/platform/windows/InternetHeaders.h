// The system's Internet functions, for the few files that use them.
#pragma once

#include "platform/windows/WindowsHeaders.h"
// Needs the types of the header above.
#include <wininet.h>
