#include "controls/windows/ThumbnailTile.h"

#include <algorithm>
#include <string>

#include "controls/windows/Drawing.h"
#include "controls/windows/ThumbnailLayout.h"
#include "platform/windows/AnsiText.h"

namespace tarnwick {
namespace {

constexpr COLORREF kCaptionColor = RGB(0, 0, 0x40);
constexpr COLORREF kSelectedCaptionColor = RGB(255, 255, 255);
constexpr COLORREF kCaptionPaper = RGB(255, 255, 255);

// Up to the lines that fit, names without blanks included.
constexpr UINT kCaptionFormat = DT_CENTER | DT_WORDBREAK | DT_EDITCONTROL | DT_END_ELLIPSIS;

void DrawCaption(HDC dc, RECT area, const ThumbnailTile& tile, const TileStyle& style) {
  if (tile.caption.empty()) return;
  const int gap = layout::Pixels(15, style.dpi);
  const std::wstring text = WideFromText(tile.caption);
  const SelectionOwner font = SelectInto(dc, style.font);
  InflateRect(&area, -gap, -gap);
  RECT lines = area;
  const int line = std::max(1, DrawTextW(dc, L"X", 1, &lines, DT_SINGLELINE | DT_CALCRECT));
  // Only whole lines are drawn; in a large font it is one, even where it needs a little more room.
  area.bottom = area.top + std::max<int>(1, (area.bottom - area.top) / line) * line;
  lines = area;
  DrawTextW(dc, text.c_str(), -1, &lines, kCaptionFormat | DT_CALCRECT);
  area.bottom = std::min(area.bottom, lines.bottom);
  RECT paper = area;
  InflateRect(&paper, gap, gap);
  Fill(dc, paper, tile.selected ? GetSysColor(COLOR_HIGHLIGHT) : kCaptionPaper);
  SetTextColor(dc, tile.selected ? kSelectedCaptionColor : kCaptionColor);
  SetBkMode(dc, TRANSPARENT);
  DrawTextW(dc, text.c_str(), -1, &area, kCaptionFormat);
}

}  // namespace

void DrawTile(HDC dc, const RECT& frame, const ThumbnailTile& tile, const TileStyle& style, bool focus) {
  using layout::Pixels;
  const auto placed = [&](const RECT& area) { return Moved(area, frame.left, frame.top); };
  Fill(dc, frame, style.background);
  FrameRect(dc, &frame, GetSysColorBrush(COLOR_BTNSHADOW));
  if (tile.selected) {
    RECT ring = placed(Pixels(layout::kMarker, style.dpi));
    Fill(dc, ring, GetSysColor(COLOR_HIGHLIGHT));
    const int width = Pixels(layout::kMarkerWidth, style.dpi);
    InflateRect(&ring, -width, -width);
    Fill(dc, ring, style.background);
  }
  if (tile.picture) {
    const RECT place = placed(tile.place);
    const MemoryDcOwner memory(CreateCompatibleDC(nullptr));
    const SelectionOwner picture = SelectInto(memory.Get(), tile.picture->decoded.bitmap.Get());
    BITMAP bitmap = {};
    GetObjectW(tile.picture->decoded.bitmap.Get(), sizeof bitmap, &bitmap);
    // One to one on the screen, as a rule; a printer may map pixels to many.
    SetStretchBltMode(dc, HALFTONE);
    SetBrushOrgEx(dc, 0, 0, nullptr);
    StretchBlt(dc, place.left, place.top, place.right - place.left, place.bottom - place.top, memory.Get(), 0,
               0, bitmap.bmWidth, bitmap.bmHeight, SRCCOPY);
  }
  DrawCaption(dc, placed(Pixels(layout::kCaption, style.dpi)), tile, style);
  if (tile.selected && focus) {
    RECT dots = frame;
    const int inset = Pixels(45, style.dpi);
    InflateRect(&dots, -inset, -inset);
    DrawFocus(dc, dots);
  }
}

}  // namespace tarnwick
