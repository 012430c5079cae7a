// The one place that includes the header of the common controls.
#pragma once

#include "platform/windows/WindowsHeaders.h"

// Its macros would use the macro that WindowsHeaders.h takes away.
#undef SNDMSG
#define SNDMSG ::SendMessageW
#include <commctrl.h>
