#include "controls/windows/FileIcons.h"

#include <algorithm>
#include <array>

#include "controls/windows/Drawing.h"

namespace tarnwick {
namespace {

// What an icon is drawn on does not show.
constexpr COLORREF kNothing = RGB(255, 0, 255);
constexpr COLORREF kPaper = RGB(255, 255, 255);
constexpr COLORREF kFold = RGB(214, 220, 228);
constexpr COLORREF kEdge = RGB(96, 108, 124);
constexpr int kLeastForText = 24;
constexpr COLORREF kGifBand = RGB(30, 125, 80);
constexpr COLORREF kJpegBand = RGB(176, 84, 24);

struct Band {
  const wchar_t* text;
  COLORREF color;
};
constexpr Band kGif = {L"GIF", kGifBand};
constexpr Band kJpeg = {L"JPG", kJpegBand};

// A page that fills most of a square of `size` pixels, with a band across it.
void DrawPage(HDC dc, int left, int size, const Band* band) {
  const int fold = std::max(2, size / 4);
  const RECT page = {left + size / 8, 0, left + size - size / 8, size - 1};
  const PenOwner pen(CreatePen(PS_SOLID, std::max(1, size / 24), kEdge));
  const BrushOwner paper(CreateSolidBrush(kPaper));
  const BrushOwner folded(CreateSolidBrush(kFold));
  const SelectionOwner withPen = SelectInto(dc, pen.Get());
  const SelectionOwner withPaper = SelectInto(dc, paper.Get());
  const std::array<POINT, 5> outline = {{{page.left, page.top},
                                         {page.right - fold, page.top},
                                         {page.right - 1, page.top + fold},
                                         {page.right - 1, page.bottom},
                                         {page.left, page.bottom}}};
  Polygon(dc, outline.data(), static_cast<int>(outline.size()));
  const SelectionOwner withFold = SelectInto(dc, folded.Get());
  const std::array<POINT, 3> corner = {{{page.right - fold, page.top},
                                        {page.right - 1, page.top + fold},
                                        {page.right - fold, page.top + fold}}};
  Polygon(dc, corner.data(), static_cast<int>(corner.size()));
  if (!band) return;

  RECT strip = {left, size / 2, left + size, size - size / 8};
  Fill(dc, strip, band->color);
  // In a small picture the colour says it; letters would be a blur.
  if (size < kLeastForText) return;
  const FontOwner font(CreateFontW(-(strip.bottom - strip.top) * 4 / 5, 0, 0, 0, FW_BOLD, FALSE, FALSE, FALSE,
                                   DEFAULT_CHARSET, OUT_DEFAULT_PRECIS, CLIP_DEFAULT_PRECIS,
                                   NONANTIALIASED_QUALITY, FF_SWISS, L"Tahoma"));
  const SelectionOwner withFont = SelectInto(dc, font.Get());
  SetBkMode(dc, TRANSPARENT);
  SetTextColor(dc, kPaper);
  DrawTextW(dc, band->text, -1, &strip, DT_CENTER | DT_VCENTER | DT_SINGLELINE | DT_NOCLIP);
}

// `count` pages, of which two have a band; their entries count from 1.
ImageListOwner MakeIcons(int size, int count, int gif, int jpeg) {
  ImageListOwner list(ImageList_Create(size, size, ILC_COLOR24 | ILC_MASK, count, 0));
  const WindowDcOwner screen = DcOf(nullptr);
  const MemoryDcOwner dc(CreateCompatibleDC(screen.Get().dc));
  const BitmapOwner strip(CreateCompatibleBitmap(screen.Get().dc, size * count, size));
  if (!list || !dc || !strip) return {};
  SelectionOwner drawn = SelectInto(dc.Get(), strip.Get());
  Fill(dc.Get(), {0, 0, size * count, size}, kNothing);
  for (int entry = 1; entry <= count; ++entry)
    DrawPage(dc.Get(), (entry - 1) * size, size, entry == gif ? &kGif : entry == jpeg ? &kJpeg : nullptr);
  // The image list takes no bitmap that is selected.
  drawn = {};
  ImageList_AddMasked(list.Get(), strip.Get(), kNothing);
  return list;
}

}  // namespace

ImageListOwner MakeLargeIcons(int dpi) {
  return MakeIcons(MulDiv(32, dpi, 96), icon::kLargeCount, icon::kLargeGif, icon::kLargeJpeg);
}

ImageListOwner MakeSmallIcons(int dpi) {
  return MakeIcons(MulDiv(16, dpi, 96), icon::kSmallCount, icon::kSmallGif, icon::kSmallJpeg);
}

}  // namespace tarnwick
