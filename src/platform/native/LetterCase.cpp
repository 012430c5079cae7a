#include "base/LetterCase.h"

#include <locale.h>
#include <wctype.h>

namespace tarnwick {

void MakeLowerCase(std::span<char16_t> units) noexcept {
  const locale_t letters = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
  if (!letters) return;
  for (char16_t& unit : units) {
    const wint_t lower = towlower_l(unit, letters);
    // As Windows has it: a letter that its small one does not lead back to, such as the Kelvin sign, stays.
    if (towupper_l(lower, letters) == unit) unit = static_cast<char16_t>(lower);
  }
  freelocale(letters);
}

}  // namespace tarnwick
