// What the system says of its screens as a whole.
#pragma once

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

// Dots per inch that the system reckons with, in both directions; each screen may have its own beside that.
inline int SystemDpi() {
  const HDC screen = GetDC(nullptr);
  const int dpi = GetDeviceCaps(screen, LOGPIXELSX);
  ReleaseDC(nullptr, screen);
  return dpi;
}

}  // namespace tarnwick
