#include "PictureWindow.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "controls/windows/PictureLoader.h"

namespace tarnwick::demo {
namespace {

constexpr const wchar_t* kClass = L"TarnwickDemoPicture";
constexpr DWORD kStyle = WS_OVERLAPPEDWINDOW;

// The size of the picture, made smaller where it does not fit.
SIZE Reduced(SIZE size, SIZE most) {
  const double scale = std::min({1.0, static_cast<double>(most.cx) / static_cast<double>(size.cx),
                                 static_cast<double>(most.cy) / static_cast<double>(size.cy)});
  return {std::max(1L, std::lround(scale * static_cast<double>(size.cx))),
          std::max(1L, std::lround(scale * static_cast<double>(size.cy)))};
}

}  // namespace

PictureWindow::PictureWindow() {
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

bool PictureWindow::Show(HWND owner, const std::wstring& path) {
  Close();
  const SIZE screen = {GetSystemMetrics(SM_CXSCREEN), GetSystemMetrics(SM_CYSCREEN)};
  // A picture of a camera that was held upright lies on its side in the file.
  const auto size = [&](const PictureFacts& facts) {
    const SIZE stored = {static_cast<LONG>(facts.width), static_cast<LONG>(facts.height)};
    size_ = Reduced(IsTurned(facts) ? SIZE{stored.cy, stored.cx} : stored, screen);
    return size_;
  };
  DecodedPicture decoded =
      DecodePicture(ReadPictureFile(path), size, GetSysColor(COLOR_BTNFACE), [] { return true; });
  if (!decoded) return false;
  picture_ = std::move(decoded.bitmap);
  RECT area = {};
  GetWindowRect(owner, &area);
  const SIZE shown = Reduced(size_, {(area.right - area.left) * 3 / 4, (area.bottom - area.top) * 3 / 4});
  area.left += (area.right - area.left - shown.cx) / 2;
  area.top += (area.bottom - area.top - shown.cy) / 2;
  area.right = area.left + shown.cx;
  area.bottom = area.top + shown.cy;
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
  const SIZE shown = Reduced(size_, {room.right, room.bottom});
  const HDC source = CreateCompatibleDC(dc);
  const HGDIOBJ old = SelectObject(source, picture_.Get());
  SetStretchBltMode(dc, HALFTONE);
  SetBrushOrgEx(dc, 0, 0, nullptr);
  StretchBlt(dc, (room.right - shown.cx) / 2, (room.bottom - shown.cy) / 2, shown.cx, shown.cy, source, 0, 0,
             size_.cx, size_.cy, SRCCOPY);
  SelectObject(source, old);
  DeleteDC(source);
  EndPaint(window_, &paint);
}

}  // namespace tarnwick::demo
