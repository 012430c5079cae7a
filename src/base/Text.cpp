#include "base/Text.h"

#include <utf8.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <cstdint>
#include <cstring>
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

// Writes each byte as the character of the same number; false when one is no ASCII, so that it is not one.
bool WidenAscii(std::string_view bytes, char16_t* units) {
  // Blocks of a fixed length become a few vector instructions.
  constexpr std::size_t kBlock = 16;
  unsigned char block[kBlock];
  char16_t wide[kBlock];
  unsigned seen = 0;
  while (bytes.size() >= kBlock) {
    std::memcpy(block, bytes.data(), kBlock);
    for (std::size_t i = 0; i < kBlock; ++i) wide[i] = block[i];
    std::memcpy(units, wide, sizeof wide);
    std::uint64_t halves[2];
    std::memcpy(halves, block, sizeof halves);
    if (((halves[0] | halves[1]) & 0x8080808080808080) != 0) return false;
    bytes.remove_prefix(kBlock);
    units += kBlock;
  }
  for (const char byte : bytes) seen |= * units++ = static_cast<unsigned char>(byte);
  return seen < 0x80;
}

// Printable ASCII of `text`, for the number parsers; any other character becomes one that no number holds.
std::string Ascii(TextView text) {
  std::string ascii(text.size(), '?');
  std::transform(text.begin(), text.end(), ascii.begin(),
                 [](char16_t unit) { return unit > 0x20 && unit < 0x7F ? static_cast<char>(unit) : '?'; });
  return ascii;
}

// `loneSurrogate` is what stands for one; 0 for itself.
std::string BytesOf(TextView text, char32_t loneSurrogate) {
  // Written in place: the library's appending forms take two to three times as long.
  std::string bytes(text.size() * 3, '\0');
  char* end = bytes.data();
  for (std::size_t i = 0; i < text.size(); ++i) {
    char32_t point = text[i];
    // The library refuses a text with a lone surrogate as a whole.
    if (IsHighSurrogate(point) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
      point = 0x10000 + ((point - 0xD800) << 10) + (text[++i] - char32_t{0xDC00});
    } else if (loneSurrogate != 0 && (IsHighSurrogate(point) || IsLowSurrogate(point))) {
      point = loneSurrogate;
    }
    end = utf8::unchecked::append(point, end);
  }
  bytes.resize(static_cast<std::size_t>(end - bytes.data()));
  return bytes;
}

}  // namespace

std::string Utf8FromText(TextView text) {
  return BytesOf(text, kReplacement);
}

std::optional<Text> TextFromUtf8(std::string_view bytes) {
  if (!utf8::is_valid(bytes)) return std::nullopt;
  return TextFromWtf8(bytes);
}

std::string Wtf8FromText(TextView text) {
  return BytesOf(text, 0);
}

Text TextFromWtf8(std::string_view bytes) {
  Text text(bytes.size(), u'\0');
  // Most are ASCII.
  if (WidenAscii(bytes, text.data())) return text;
  const char16_t* const end = utf8::unchecked::utf8to16(bytes.begin(), bytes.end(), text.data());
  text.resize(static_cast<std::size_t>(end - text.data()));
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

double LeadingNumber(std::string_view utf8) {
  // File sizes, which a listing has by the hundred thousand.
  if (!utf8.empty() && utf8.size() <= 15 &&
      std::ranges::all_of(utf8, [](char unit) { return unit >= '0' && unit <= '9'; })) {
    std::int64_t whole = 0;
    for (const char digit : utf8) whole = whole * 10 + (digit - '0');
    return static_cast<double>(whole);
  }
  return LeadingNumber(TextFromWtf8(utf8));
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
