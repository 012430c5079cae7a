// Text at the system's border: ANSI bytes (the process's code page) for the calls that take them, wide text
// for the others.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

// nullopt when the code page cannot hold `text` exactly, or when a NUL in it would cut it short.
std::optional<std::string> AnsiFromText(TextView text);

Text TextFromAnsi(std::string_view bytes);

inline std::wstring WideFromText(TextView text) {
  return {text.begin(), text.end()};
}

inline Text TextFromWide(std::wstring_view wide) {
  return {wide.begin(), wide.end()};
}

}  // namespace tarnwick
