#pragma once

#include "base/Text.h"

namespace tarnwick {

// Whether a name that came from elsewhere may become the name of a local file, on this very text: not empty,
// "." or "..", none of \ / : * ? " < > | and no control character, no mark that turns the direction of
// writing, no dot or blank at its end, no name of a device (CON, COM1 ...), with or without an extension, and
// none that the system's file manager acts upon as soon as it shows the folder (desktop.ini, shortcuts).
bool IsSafeFileName(TextView name);

// `name` as it is shown: each control character and each mark that turns the direction of writing, by which
// "exe.jpg" can look like another name, is U+FFFD.
Text ShownName(TextView name);

}  // namespace tarnwick
