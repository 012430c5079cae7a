// A window of its own for one picture, as large as that or smaller; Escape closes it.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <memory>
#include <string>

namespace Gdiplus {
class Bitmap;
}

namespace tarnwick::demo {

class PictureWindow {
 public:
  PictureWindow();
  ~PictureWindow();
  PictureWindow(const PictureWindow&) = delete;
  PictureWindow& operator=(const PictureWindow&) = delete;

  // Shows the picture in that file, in place of the last one; false when it is none. The file is free again
  // afterwards.
  bool Show(HWND owner, const std::wstring& path);
  void Close();
  // Null while there is none.
  HWND Window() const { return window_; }

 private:
  static LRESULT CALLBACK WindowProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  void Paint();

  ULONG_PTR session_ = 0;
  HWND window_ = nullptr;
  std::unique_ptr<Gdiplus::Bitmap> picture_;
};

}  // namespace tarnwick::demo
