// A window of its own for one picture, as large as that or smaller; Escape closes it.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <string>

#include "platform/windows/Owner.h"

namespace tarnwick::demo {

class PictureWindow {
 public:
  PictureWindow();
  ~PictureWindow() { Close(); }
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

  HWND window_ = nullptr;
  // As it is seen, at most as large as the screen.
  BitmapOwner picture_;
  SIZE size_ = {};
};

}  // namespace tarnwick::demo
