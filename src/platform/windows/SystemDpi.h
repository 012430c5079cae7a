// What the system says of its screens as a whole.
#pragma once

#include "platform/windows/Owner.h"

namespace tarnwick {

// Dots per inch that the system reckons with, in both directions; each screen may have its own beside that.
inline int SystemDpi() {
  const WindowDcOwner screen = DcOf(nullptr);
  return GetDeviceCaps(screen.Get().dc, LOGPIXELSX);
}

}  // namespace tarnwick
