#include "base/LetterCase.h"

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

void MakeLowerCase(std::span<char16_t> units) noexcept {
  auto* const wide = reinterpret_cast<wchar_t*>(units.data());
  const int count = static_cast<int>(units.size());
  LCMapStringEx(LOCALE_NAME_INVARIANT, LCMAP_LOWERCASE, wide, count, wide, count, nullptr, nullptr, 0);
}

}  // namespace tarnwick
