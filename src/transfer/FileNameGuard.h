#pragma once

#include "base/Text.h"

namespace tarnwick {

// Whether a name that came from elsewhere may become the name of a local file, on this very text: not empty,
// "." or "..", none of \ / : * ? " < > | and no control character, no dot or blank at its end, and no name of
// a device (CON, COM1 ...), with or without an extension.
bool IsSafeFileName(TextView name);

}  // namespace tarnwick
