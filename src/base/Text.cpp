#include "base/Text.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <numeric>

#include "base/LetterCase.h"
#include "base/RuntimeError.h"

namespace tarnwick {
namespace {

constexpr char32_t kReplacement = 0xFFFD;

bool IsHighSurrogate(char32_t unit) {
  return unit >= 0xD800 && unit <= 0xDBFF;
}
bool IsLowSurrogate(char32_t unit) {
  return unit >= 0xDC00 && unit <= 0xDFFF;
}

void AppendUtf8(std::string& bytes, char32_t point) {
  const auto tail = [&](unsigned shift) {
    bytes.push_back(static_cast<char>(0x80 | ((point >> shift) & 0x3F)));
  };
  if (point < 0x80) {
    bytes.push_back(static_cast<char>(point));
  } else if (point < 0x800) {
    bytes.push_back(static_cast<char>(0xC0 | (point >> 6)));
    tail(0);
  } else if (point < 0x10000) {
    bytes.push_back(static_cast<char>(0xE0 | (point >> 12)));
    tail(6);
    tail(0);
  } else {
    bytes.push_back(static_cast<char>(0xF0 | (point >> 18)));
    tail(12);
    tail(6);
    tail(0);
  }
}

// Printable ASCII of `text`, for the number parsers; any other character becomes one that no number holds.
std::string Ascii(TextView text) {
  std::string ascii(text.size(), '?');
  std::transform(text.begin(), text.end(), ascii.begin(),
                 [](char16_t unit) { return unit > 0x20 && unit < 0x7F ? static_cast<char>(unit) : '?'; });
  return ascii;
}

}  // namespace

std::string Utf8FromText(TextView text) {
  std::string bytes;
  bytes.reserve(text.size());
  for (std::size_t i = 0; i < text.size(); ++i) {
    char32_t point = text[i];
    if (IsHighSurrogate(point) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
      point = 0x10000 + ((point - 0xD800) << 10) + (text[++i] - char32_t{0xDC00});
    } else if (IsHighSurrogate(point) || IsLowSurrogate(point)) {
      point = kReplacement;
    }
    AppendUtf8(bytes, point);
  }
  return bytes;
}

std::optional<Text> TextFromUtf8(std::string_view bytes) {
  Text text;
  text.reserve(bytes.size());
  for (std::size_t i = 0; i < bytes.size();) {
    const auto lead = static_cast<unsigned char>(bytes[i++]);
    if (lead < 0x80) {
      text.push_back(lead);
      continue;
    }
    const int tails = lead >= 0xF0 ? 3 : lead >= 0xE0 ? 2 : 1;
    if (lead < 0xC2 || lead > 0xF4 || bytes.size() - i < static_cast<std::size_t>(tails)) return std::nullopt;
    char32_t point = lead & (0x3FU >> tails);
    for (int tail = 0; tail < tails; ++tail) {
      const auto next = static_cast<unsigned char>(bytes[i++]);
      if ((next & 0xC0) != 0x80) return std::nullopt;
      point = (point << 6) | (next & 0x3FU);
    }
    const char32_t least = tails == 1 ? 0x80 : tails == 2 ? 0x800 : 0x10000;
    if (point < least || point > 0x10FFFF || (point >= 0xD800 && point <= 0xDFFF)) return std::nullopt;
    if (point < 0x10000) {
      text.push_back(static_cast<char16_t>(point));
    } else {
      text.push_back(static_cast<char16_t>(0xD800 + ((point - 0x10000) >> 10)));
      text.push_back(static_cast<char16_t>(0xDC00 + ((point - 0x10000) & 0x3FF)));
    }
  }
  return text;
}

Text TextFromLatin1(std::string_view bytes) {
  Text text(bytes.size(), u'\0');
  std::transform(bytes.begin(), bytes.end(), text.begin(),
                 [](char byte) { return static_cast<char16_t>(static_cast<unsigned char>(byte)); });
  return text;
}

TextView Trim(TextView text) {
  const std::size_t first = text.find_first_not_of(u' ');
  if (first == TextView::npos) return {};
  return text.substr(first, text.find_last_not_of(u' ') - first + 1);
}

char16_t LowerCase(char16_t unit) {
  if (unit < 0x80) return unit >= u'A' && unit <= u'Z' ? static_cast<char16_t>(unit + 32) : unit;
  // Asked of the system once: a call for each letter takes a hundred times as long.
  static const auto lower = [] {
    std::array<char16_t, 0x10000> units{};
    std::iota(units.begin(), units.end(), u'\0');
    MakeLowerCase(units);
    return units;
  }();
  return lower[unit];
}

Text LowerCase(TextView text) {
  Text lower(text);
  for (char16_t& unit : lower) unit = LowerCase(unit);
  return lower;
}

Text ReplaceAll(TextView text, TextView what, TextView with) {
  Text replaced;
  replaced.reserve(text.size());
  std::size_t from = 0;
  for (std::size_t at; (at = text.find(what, from)) != TextView::npos; from = at + what.size())
    replaced.append(text.substr(from, at - from)).append(with);
  return replaced.append(text.substr(from));
}

std::vector<TextView> Split(TextView text, char16_t separator) {
  std::vector<TextView> pieces;
  std::size_t from = 0;
  for (std::size_t at; (at = text.find(separator, from)) != TextView::npos; from = at + 1)
    pieces.push_back(text.substr(from, at - from));
  pieces.push_back(text.substr(from));
  return pieces;
}

Text TextFromNumber(std::int64_t number) {
  return TextFromLatin1(std::to_string(number));
}

std::int32_t NumberFromText(TextView text) {
  std::string ascii = Ascii(Trim(text));
  if (ascii.starts_with('+') && !ascii.starts_with("+-")) ascii.erase(0, 1);
  std::int32_t number = 0;
  const char* end = ascii.data() + ascii.size();
  const auto [stop, status] = std::from_chars(ascii.data(), end, number);
  if (status == std::errc::invalid_argument || stop != end) throw RuntimeError(error::kTypeMismatch);
  if (status != std::errc{}) throw RuntimeError(error::kOverflow);
  return number;
}

double LeadingNumber(TextView text) {
  text = Trim(text);
  if (text.starts_with(u'+')) text.remove_prefix(1);
  // from_chars also reads "inf" and "nan", which no host takes for numbers.
  const std::string ascii = Ascii(text.substr(0, text.find_first_not_of(u"0123456789.eE+-")));
  double number = 0;
  const auto [stop, status] = std::from_chars(ascii.data(), ascii.data() + ascii.size(), number);
  if (status == std::errc::result_out_of_range) throw RuntimeError(error::kOverflow);
  return status == std::errc{} ? number : 0;
}

bool BooleanFromText(TextView text) {
  const Text lower = LowerCase(text);
  if (lower == u"true") return true;
  if (lower == u"false") return false;
  return NumberFromText(text) != 0;
}

}  // namespace tarnwick
