#include "hosting/Exchange.h"

#include <algorithm>
#include <cctype>
#include <charconv>

#include "support/Text.h"

namespace tarnwick::hosting {
namespace {

constexpr std::size_t kLongestPrinted = 200;

// `%XX` becomes its byte; what only looks like an escape stays, since clients write raw names too.
std::string Unescape(std::string_view escaped) {
  std::string bytes;
  for (std::size_t i = 0; i < escaped.size(); ++i) {
    unsigned value = 0;
    const char* digits = escaped.data() + i + 1;
    if (escaped[i] == '%' && escaped.size() - i > 2 &&
        std::from_chars(digits, digits + 2, value, 16).ptr == digits + 2) {
      bytes += static_cast<char>(value);
      i += 2;
    } else {
      bytes += escaped[i];
    }
  }
  return bytes;
}

bool StartsWithScheme(std::string_view target) {
  constexpr std::string_view kScheme = "http://";
  return target.size() >= kScheme.size() &&
         std::equal(kScheme.begin(), kScheme.end(), target.begin(), [](char wanted, char found) {
           return wanted == std::tolower(static_cast<unsigned char>(found));
         });
}

}  // namespace

void ReadTarget(std::string_view target, RequestHead& head) {
  target = target.substr(0, target.find_first_of("?#"));
  if (StartsWithScheme(target)) target = target.substr(std::min(target.find('/', 7), target.size()));
  head.segments.clear();
  head.path.clear();
  while (!target.empty()) {
    const std::string_view segment = target.substr(0, target.find('/'));
    target.remove_prefix(std::min(segment.size() + 1, target.size()));
    if (segment.empty()) continue;
    head.segments.push_back(Unescape(segment));
    head.path.append("/").append(head.segments.back());
  }
  if (head.path.empty()) head.path = "/";
}

std::string Printable(std::string_view text) {
  std::string printable(text.substr(0, kLongestPrinted));
  const bool isUtf8 = TextFromUtf8(printable).has_value();
  for (char& character : printable) {
    const auto byte = static_cast<unsigned char>(character);
    if (byte <= 0x20 || byte == 0x7F || (byte > 0x7F && !isUtf8)) character = '?';
  }
  return printable.empty() ? "-" : printable;
}

}  // namespace tarnwick::hosting
