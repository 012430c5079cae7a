// Text of the library: UTF-16, as hosts count it. Lengths and positions are UTF-16 units.
// Bytes of files and sockets are never held in these types.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tarnwick {

using Text = std::u16string;
using TextView = std::u16string_view;

// UTF-8 form of `text`; a lone surrogate becomes U+FFFD.
std::string Utf8FromText(TextView text);

// Text of the UTF-8 `bytes`; nullopt when they are not valid UTF-8 (overlong forms and surrogates included).
std::optional<Text> TextFromUtf8(std::string_view bytes);

// WTF-8 of any text, and the text of it: UTF-8 in which a lone surrogate stands like any other character, so
// that nothing is lost. Every valid UTF-8 is WTF-8; no text has two forms.
std::string Wtf8FromText(TextView text);
Text TextFromWtf8(std::string_view bytes);

// Each byte as the character of the same number (ISO 8859-1).
Text TextFromLatin1(std::string_view bytes);

// `text` without leading and trailing blanks (U+0020 only).
TextView Trim(TextView text);

// Lower case, one letter for one, independent of the user's locale. What has none stays, and so do characters
// beyond U+FFFF.
char16_t LowerCase(char16_t unit);
Text LowerCase(TextView text);

// `text` with every occurrence of `what` (not empty), found from left to right, replaced by `with`.
Text ReplaceAll(TextView text, TextView what, TextView with);

// The pieces between the `separator`s, n + 1 of them for n separators. They point into `text`.
std::vector<TextView> Split(TextView text, char16_t separator);

// Decimal text of a number, without leading zeros or separators.
Text TextFromNumber(std::int64_t number);

// The 32-bit number whose decimal text is `text` (an optional sign, then digits; blanks around are ignored).
// Throws run-time error 13 when it is anything else, 6 when it has more than 32 bits.
std::int32_t NumberFromText(TextView text);

// The number at the start of `text`, with "." as the decimal point; 0 when there is none.
// Throws run-time error 6 when it is outside the range of a double.
double LeadingNumber(TextView text);
// Of valid UTF-8.
double LeadingNumber(std::string_view utf8);

// The Boolean that `text` means: TRUE or FALSE in any letter case, or a number (0 is false).
// Throws run-time error 13 when it is anything else.
bool BooleanFromText(TextView text);

}  // namespace tarnwick
