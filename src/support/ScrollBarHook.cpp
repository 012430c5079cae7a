#include "support/ScrollBarHook.h"

namespace tarnwick {
namespace {

constexpr std::uint32_t kScrollBarColor = 0x0137;  // WM_CTLCOLORSCROLLBAR

}  // namespace

void ScrollBarHook::Install() {
  if (state_.hooked) return;
  state_.previous = procedures_.SetHook(state_.window);
  state_.hooked = true;
}

std::intptr_t ScrollBarHook::Answer(WindowHandle window, std::uint32_t message, std::uintptr_t first,
                                    std::intptr_t second) const {
  if (message == kScrollBarColor) return 0;
  return procedures_.Call(state_.previous, window, message, first, second);
}

}  // namespace tarnwick
