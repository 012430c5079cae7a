#include "controls/windows/TextTip.h"

#include <algorithm>
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

// The system breaks a tip's lines at blanks. What has none, such as an address, would run out of the screen.
void BreakWords(HWND tip, std::wstring& text, int widest) {
  const WindowDcOwner dc = DcOf(tip);
  const SelectionOwner font =
      SelectInto(dc.Get().dc, reinterpret_cast<HFONT>(SendMessageW(tip, WM_GETFONT, 0, 0)));
  for (std::size_t from = 0; from < text.size();) {
    int fits = 0;
    SIZE size = {};
    GetTextExtentExPointW(dc.Get().dc, text.c_str() + from, static_cast<int>(text.size() - from), widest,
                          &fits, nullptr, &size);
    std::size_t end = from + static_cast<std::size_t>(std::max(fits, 1));
    if (end >= text.size()) return;
    if (const std::size_t blank = text.find_last_of(L" \n", end); blank != text.npos && blank >= from) {
      from = blank + 1;
      continue;
    }
    if (IS_LOW_SURROGATE(text[end]) && end > from + 1) --end;
    text.insert(end, L"\r\n");
    from = end + 2;
  }
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
  text.resize(std::min(text.size(), kLongest));
  // Of one line the screen may show a part only.
  MONITORINFO screen = {};
  screen.cbSize = sizeof screen;
  GetMonitorInfoW(MonitorFromWindow(window, MONITOR_DEFAULTTONEAREST), &screen);
  const int widest = (screen.rcWork.right - screen.rcWork.left) / 2;
  SendMessageW(tip_.Get(), TTM_SETMAXTIPWIDTH, 0, widest);
  BreakWords(tip_.Get(), text, widest);
  // Line ends came to it.
  text.resize(std::min(text.size(), kLongest));
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
