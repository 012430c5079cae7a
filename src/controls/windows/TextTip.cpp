#include "controls/windows/TextTip.h"

#include <utility>

#include "platform/windows/CommonControls.h"

namespace tarnwick {
namespace {

// What a name from elsewhere may grow to.
constexpr std::size_t kLongest = INFOTIPSIZE - 1;

TTTOOLINFOW ToolOf(HWND window) {
  TTTOOLINFOW tool = {};
  // The older common controls refuse a structure that has grown since.
  tool.cbSize = TTTOOLINFOW_V2_SIZE;
  tool.hwnd = window;
  return tool;
}

}  // namespace

void TextTip::Set(HWND window, const RECT& place, std::wstring text) {
  Clear();
  // It has no owner: that would be the form, which the control may leave.
  if (!tip_)
    tip_ = TipOwner(CreateWindowExW(WS_EX_TOPMOST, TOOLTIPS_CLASSW, nullptr,
                                    WS_POPUP | TTS_ALWAYSTIP | TTS_NOPREFIX, 0, 0, 0, 0, nullptr, nullptr,
                                    nullptr, nullptr));
  if (!tip_) return;
  if (text.size() > kLongest) text.resize(kLongest);
  // Of one line the screen may show a part only.
  MONITORINFO screen = {};
  screen.cbSize = sizeof screen;
  GetMonitorInfoW(MonitorFromWindow(window, MONITOR_DEFAULTTONEAREST), &screen);
  SendMessageW(tip_.Get(), TTM_SETMAXTIPWIDTH, 0, (screen.rcWork.right - screen.rcWork.left) / 2);
  TTTOOLINFOW tool = ToolOf(window);
  tool.rect = place;
  tool.lpszText = text.data();
  if (SendMessageW(tip_.Get(), TTM_ADDTOOLW, 0, reinterpret_cast<LPARAM>(&tool))) window_ = window;
}

void TextTip::Clear() {
  if (!window_) return;
  TTTOOLINFOW tool = ToolOf(std::exchange(window_, nullptr));
  SendMessageW(tip_.Get(), TTM_DELTOOLW, 0, reinterpret_cast<LPARAM>(&tool));
}

void TextTip::Relay(HWND window, UINT message, WPARAM wParam, LPARAM lParam) const {
  if (!window_) return;
  MSG told = {window, message, wParam, lParam, 0, {0, 0}};
  SendMessageW(tip_.Get(), TTM_RELAYEVENT, 0, reinterpret_cast<LPARAM>(&told));
}

}  // namespace tarnwick
