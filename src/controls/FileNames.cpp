#include "controls/FileNames.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>

namespace tarnwick {
namespace {

bool IsDigit(char16_t unit) {
  return unit >= u'0' && unit <= u'9';
}

// Drops the digits at the start and returns how many there were.
std::size_t TakeDigits(TextView& text) {
  const auto end = std::find_if_not(text.begin(), text.end(), IsDigit);
  const auto count = static_cast<std::size_t>(end - text.begin());
  text.remove_prefix(count);
  return count;
}

void TakeSign(TextView& text) {
  if (text.starts_with(u'+') || text.starts_with(u'-')) text.remove_prefix(1);
}

}  // namespace

bool EqualsIgnoringCase(TextView left, TextView right) {
  return left.size() == right.size() &&
         std::equal(left.begin(), left.end(), right.begin(),
                    [](char16_t a, char16_t b) { return LowerCase(a) == LowerCase(b); });
}

bool StartsWithIgnoringCase(TextView text, TextView prefix) {
  return EqualsIgnoringCase(text.substr(0, prefix.size()), prefix);
}

bool EndsWithIgnoringCase(TextView text, TextView ending) {
  return text.size() >= ending.size() && EqualsIgnoringCase(text.substr(text.size() - ending.size()), ending);
}

TextView ExtensionOf(TextView name) {
  const std::size_t dot = name.rfind(u'.');
  return dot == TextView::npos ? TextView() : name.substr(dot);
}

Text WithExtension(TextView name, TextView extension) {
  return Text(name.substr(0, name.size() - ExtensionOf(name).size())).append(extension);
}

bool IsNumeric(TextView text) {
  text = Trim(text);
  TakeSign(text);
  std::size_t digits = TakeDigits(text);
  if (text.starts_with(u'.')) {
    text.remove_prefix(1);
    digits += TakeDigits(text);
  }
  if (digits == 0) return false;
  if (text.starts_with(u'e') || text.starts_with(u'E')) {
    text.remove_prefix(1);
    TakeSign(text);
    if (TakeDigits(text) == 0) return false;
  }
  return text.empty();
}

Text SizeText(double bytes) {
  // Fifteen digits are what a double holds for certain; hosts see the same number of them.
  char digits[32];
  const auto end =
      std::to_chars(std::begin(digits), std::end(digits), bytes, std::chars_format::general, 15).ptr;
  std::replace(std::begin(digits), end, 'e', 'E');
  return TextFromLatin1({digits, end});
}

std::int32_t RoundHalfToEven(double exact) {
  double whole = std::floor(exact);
  const double rest = exact - whole;
  if (rest > 0.5 || (rest == 0.5 && std::fmod(whole, 2) != 0)) ++whole;
  return static_cast<std::int32_t>(whole);
}

std::int32_t Kilobytes(double bytes) {
  constexpr double kLimit = std::numeric_limits<std::int32_t>::max();
  return RoundHalfToEven(std::clamp(bytes / 1024, -kLimit, kLimit));
}

}  // namespace tarnwick
