#include "hosting/LogNote.h"

#include "base/Text.h"

namespace tarnwick::hosting {

std::string Printable(std::string_view text) {
  constexpr std::size_t kLongest = 200;
  std::string printable(text.substr(0, kLongest));
  const bool isUtf8 = TextFromUtf8(printable).has_value();
  for (char& character : printable) {
    const auto byte = static_cast<unsigned char>(character);
    if (byte <= 0x20 || byte == 0x7F || (byte > 0x7F && !isUtf8)) character = '?';
  }
  return printable.empty() ? "-" : printable;
}

}  // namespace tarnwick::hosting
