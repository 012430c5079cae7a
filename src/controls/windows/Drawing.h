// Small steps of drawing that the windows share.
#pragma once

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

inline void Fill(HDC dc, const RECT& area, COLORREF color) {
  SetDCBrushColor(dc, color);
  FillRect(dc, &area, static_cast<HBRUSH>(GetStockObject(DC_BRUSH)));
}

inline RECT Moved(RECT area, LONG x, LONG y) {
  OffsetRect(&area, x, y);
  return area;
}

inline void DrawFocus(HDC dc, const RECT& area) {
  // The dots take these colours.
  SetTextColor(dc, RGB(0, 0, 0));
  SetBkColor(dc, RGB(255, 255, 255));
  DrawFocusRect(dc, &area);
}

}  // namespace tarnwick
