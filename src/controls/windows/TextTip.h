// The system's tip for one place in a window at a time.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <string>

#include "platform/windows/Owner.h"

namespace tarnwick {

class TextTip {
 public:
  // From here on the text appears where the pointer rests in `place` of `window`, and nowhere else.
  void Set(HWND window, const RECT& place, std::wstring text);
  // No tip any more; one that is seen goes.
  void Clear();
  // To be told of each mouse message of the window.
  void Relay(HWND window, UINT message, WPARAM wParam, LPARAM lParam) const;

 private:
  using TipOwner = Owner<HWND, DestroyWindow>;

  TipOwner tip_;
  // Null when there is no place.
  HWND window_ = nullptr;
};

}  // namespace tarnwick
