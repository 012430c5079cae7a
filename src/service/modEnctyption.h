// The parameter cipher of the service requests. A text is reduced to the 69 characters of the cipher's
// alphabet; each of them is replaced by another one of the alphabet, chosen by a key position that depends on
// the text's length. The cipher is its own inverse.
#pragma once

#include "base/Text.h"

namespace tarnwick {

// Enciphers a parameter value; the caller escapes the result for the form.
Text EncryptParameter(TextView value);

// `value` without the characters that the cipher's alphabet lacks.
Text StripToAlphabet(TextView value);

// Overwrites `value` with the cipher of StripToAlphabet(value).
void ApplyCipher(Text& value);

}  // namespace tarnwick
