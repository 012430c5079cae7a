#include "PictureWindow.h"

#include <objidl.h>

// After the header that it counts on.
#include <gdiplus.h>

#include <algorithm>

namespace tarnwick::demo {
namespace {

constexpr const wchar_t* kClass = L"TarnwickDemoPicture";
constexpr DWORD kStyle = WS_OVERLAPPEDWINDOW;

// The largest rectangle of the picture's shape in the middle of the room.
RECT Fitted(LONG width, LONG height, const RECT& room) {
  const LONG roomWidth = room.right - room.left;
  const LONG roomHeight = room.bottom - room.top;
  const double scale = std::min(static_cast<double>(roomWidth) / static_cast<double>(width),
                                static_cast<double>(roomHeight) / static_cast<double>(height));
  const LONG shownWidth = std::max(1L, static_cast<LONG>(scale * static_cast<double>(width)));
  const LONG shownHeight = std::max(1L, static_cast<LONG>(scale * static_cast<double>(height)));
  const LONG left = room.left + (roomWidth - shownWidth) / 2;
  const LONG top = room.top + (roomHeight - shownHeight) / 2;
  return {left, top, left + shownWidth, top + shownHeight};
}

}  // namespace

PictureWindow::PictureWindow() {
  const Gdiplus::GdiplusStartupInput input;
  Gdiplus::GdiplusStartup(&session_, &input, nullptr);
  WNDCLASSEXW kind = {};
  kind.cbSize = sizeof kind;
  kind.style = CS_HREDRAW | CS_VREDRAW;
  kind.lpfnWndProc = WindowProc;
  kind.hInstance = GetModuleHandleW(nullptr);
  kind.hCursor = LoadCursorW(nullptr, reinterpret_cast<LPCWSTR>(IDC_ARROW));
  kind.hbrBackground = reinterpret_cast<HBRUSH>(COLOR_BTNFACE + 1);
  kind.lpszClassName = kClass;
  RegisterClassExW(&kind);
}

PictureWindow::~PictureWindow() {
  Close();
  picture_.reset();
  Gdiplus::GdiplusShutdown(session_);
}

bool PictureWindow::Show(HWND owner, const std::wstring& path) {
  Close();
  {
    // Holds the file open as long as it lives, so what is shown is a copy.
    Gdiplus::Bitmap file(path.c_str());
    if (file.GetLastStatus() != Gdiplus::Ok) return false;
    const auto width = static_cast<INT>(file.GetWidth());
    const auto height = static_cast<INT>(file.GetHeight());
    picture_ = std::make_unique<Gdiplus::Bitmap>(width, height, PixelFormat32bppPARGB);
    Gdiplus::Graphics copy(picture_.get());
    if (copy.DrawImage(&file, 0, 0, width, height) != Gdiplus::Ok) return false;
  }
  RECT area = {};
  GetWindowRect(owner, &area);
  InflateRect(&area, -(area.right - area.left) / 8, -(area.bottom - area.top) / 8);
  const auto width = static_cast<LONG>(picture_->GetWidth());
  const auto height = static_cast<LONG>(picture_->GetHeight());
  if (width > area.right - area.left || height > area.bottom - area.top)
    area = Fitted(width, height, area);
  else
    area = {(area.left + area.right - width) / 2, (area.top + area.bottom - height) / 2,
            (area.left + area.right + width) / 2, (area.top + area.bottom + height) / 2};
  AdjustWindowRect(&area, kStyle, FALSE);
  const std::wstring name = path.substr(path.find_last_of(L'\\') + 1);
  window_ = CreateWindowExW(0, kClass, name.c_str(), kStyle | WS_VISIBLE, area.left, area.top,
                            area.right - area.left, area.bottom - area.top, owner, nullptr,
                            GetModuleHandleW(nullptr), this);
  return window_ != nullptr;
}

void PictureWindow::Close() {
  if (window_) DestroyWindow(window_);
}

LRESULT CALLBACK PictureWindow::WindowProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_NCCREATE)
    SetWindowLongPtrW(
        window, GWLP_USERDATA,
        reinterpret_cast<LONG_PTR>(reinterpret_cast<const CREATESTRUCTW*>(lParam)->lpCreateParams));
  auto* self = reinterpret_cast<PictureWindow*>(GetWindowLongPtrW(window, GWLP_USERDATA));
  if (!self) return DefWindowProcW(window, message, wParam, lParam);
  switch (message) {
    case WM_PAINT:
      self->Paint();
      return 0;
    case WM_KEYDOWN:
      if (wParam == VK_ESCAPE) DestroyWindow(window);
      return 0;
    case WM_DESTROY:
      self->window_ = nullptr;
      return 0;
    default:
      return DefWindowProcW(window, message, wParam, lParam);
  }
}

void PictureWindow::Paint() {
  PAINTSTRUCT paint = {};
  RECT room = {};
  const HDC dc = BeginPaint(window_, &paint);
  GetClientRect(window_, &room);
  {
    const RECT place =
        Fitted(static_cast<LONG>(picture_->GetWidth()), static_cast<LONG>(picture_->GetHeight()), room);
    Gdiplus::Graphics graphics(dc);
    graphics.SetInterpolationMode(Gdiplus::InterpolationModeHighQualityBicubic);
    graphics.DrawImage(picture_.get(), static_cast<INT>(place.left), static_cast<INT>(place.top),
                       static_cast<INT>(place.right - place.left),
                       static_cast<INT>(place.bottom - place.top));
  }
  EndPaint(window_, &paint);
}

}  // namespace tarnwick::demo
