#include "controls/windows/FileIcons.h"

#include <algorithm>
#include <array>

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

struct GdiKind {
  using Handle = HGDIOBJ;
  static Handle None() { return nullptr; }
  static void Close(Handle handle) { DeleteObject(handle); }
};
using GdiOwner = Owner<GdiKind>;

struct MemoryDcKind {
  using Handle = HDC;
  static Handle None() { return nullptr; }
  static void Close(Handle handle) { DeleteDC(handle); }
};
using MemoryDcOwner = Owner<MemoryDcKind>;

void Fill(HDC dc, const RECT& area, COLORREF color) {
  const GdiOwner brush(CreateSolidBrush(color));
  FillRect(dc, &area, static_cast<HBRUSH>(brush.Get()));
}

// A page that fills most of a square of `size` pixels, with a band across it.
void DrawPage(HDC dc, int left, int size, const Band* band) {
  const int fold = std::max(2, size / 4);
  const RECT page = {left + size / 8, 0, left + size - size / 8, size - 1};
  const GdiOwner pen(CreatePen(PS_SOLID, std::max(1, size / 24), kEdge));
  const GdiOwner paper(CreateSolidBrush(kPaper));
  const GdiOwner folded(CreateSolidBrush(kFold));
  const HGDIOBJ oldPen = SelectObject(dc, pen.Get());
  const HGDIOBJ oldBrush = SelectObject(dc, paper.Get());
  const std::array<POINT, 5> outline = {{{page.left, page.top},
                                         {page.right - fold, page.top},
                                         {page.right - 1, page.top + fold},
                                         {page.right - 1, page.bottom},
                                         {page.left, page.bottom}}};
  Polygon(dc, outline.data(), static_cast<int>(outline.size()));
  SelectObject(dc, folded.Get());
  const std::array<POINT, 3> corner = {{{page.right - fold, page.top},
                                        {page.right - 1, page.top + fold},
                                        {page.right - fold, page.top + fold}}};
  Polygon(dc, corner.data(), static_cast<int>(corner.size()));
  SelectObject(dc, oldBrush);
  SelectObject(dc, oldPen);
  if (!band) return;

  RECT strip = {left, size / 2, left + size, size - size / 8};
  Fill(dc, strip, band->color);
  // In a small picture the colour says it; letters would be a blur.
  if (size < kLeastForText) return;
  const GdiOwner font(CreateFontW(-(strip.bottom - strip.top) * 4 / 5, 0, 0, 0, FW_BOLD, FALSE, FALSE, FALSE,
                                  DEFAULT_CHARSET, OUT_DEFAULT_PRECIS, CLIP_DEFAULT_PRECIS,
                                  NONANTIALIASED_QUALITY, FF_SWISS, L"Tahoma"));
  const HGDIOBJ oldFont = SelectObject(dc, font.Get());
  SetBkMode(dc, TRANSPARENT);
  SetTextColor(dc, kPaper);
  DrawTextW(dc, band->text, -1, &strip, DT_CENTER | DT_VCENTER | DT_SINGLELINE | DT_NOCLIP);
  SelectObject(dc, oldFont);
}

// `count` pages, of which two have a band; their entries count from 1.
ImageListOwner MakeIcons(int size, int count, int gif, int jpeg) {
  ImageListOwner list(ImageList_Create(size, size, ILC_COLOR24 | ILC_MASK, count, 0));
  const HDC screen = GetDC(nullptr);
  const MemoryDcOwner dc(CreateCompatibleDC(screen));
  GdiOwner strip(CreateCompatibleBitmap(screen, size * count, size));
  ReleaseDC(nullptr, screen);
  if (!list || !dc || !strip) return {};
  const HGDIOBJ old = SelectObject(dc.Get(), strip.Get());
  Fill(dc.Get(), {0, 0, size * count, size}, kNothing);
  for (int entry = 1; entry <= count; ++entry)
    DrawPage(dc.Get(), (entry - 1) * size, size, entry == gif ? &kGif : entry == jpeg ? &kJpeg : nullptr);
  SelectObject(dc.Get(), old);
  ImageList_AddMasked(list.Get(), static_cast<HBITMAP>(strip.Get()), kNothing);
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
