// How the controls show and compare files.
#pragma once

#include <cstdint>

#include "base/Text.h"

namespace tarnwick {

// Letters in LowerCase count as the same.
bool EqualsIgnoringCase(TextView left, TextView right);
bool StartsWithIgnoringCase(TextView text, TextView prefix);
bool EndsWithIgnoringCase(TextView text, TextView ending);

// From the last "." on; empty when there is none.
TextView ExtensionOf(TextView name);

// `name` with `extension` (dot included) in place of its own one, or at its end.
Text WithExtension(TextView name, TextView extension);

// Whether `text` is a number in decimal notation: blanks around it, a sign, a decimal point and an exponent
// are fine.
bool IsNumeric(TextView text);

// `bytes` as a decimal number.
Text SizeText(double bytes);

// The nearest whole number; of the two that are as near, the even one. `exact` is of 32 bits.
std::int32_t RoundHalfToEven(double exact);

// Kilobytes, rounded half to even, of at most 2^31 - 1.
std::int32_t Kilobytes(double bytes);

}  // namespace tarnwick
