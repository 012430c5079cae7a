#include "service/modEnctyption.h"

#include <array>
#include <cstddef>
#include <string>

namespace tarnwick {
namespace {

constexpr TextView kAlphabet = u"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz1234567890#@$*.-_";
constexpr TextView kKey = u"Maplewoodfen";
constexpr std::size_t kAsciiCount = 128;
constexpr std::uint8_t kAbsent = 0xFF;

static_assert(kAlphabet.size() == 69 && kKey.size() == 12);

// Position in the alphabet by character code, so that a character costs one look-up and no search.
constexpr std::array<std::uint8_t, kAsciiCount> kPositions = [] {
  std::array<std::uint8_t, kAsciiCount> positions{};
  positions.fill(kAbsent);
  for (std::size_t i = 0; i < kAlphabet.size(); ++i) positions[kAlphabet[i]] = static_cast<std::uint8_t>(i);
  return positions;
}();

constexpr std::uint8_t PositionOf(char16_t character) {
  return character < kAsciiCount ? kPositions[character] : kAbsent;
}

}  // namespace

Text StripToAlphabet(TextView value) {
  Text kept;
  kept.reserve(value.size());
  for (const char16_t character : value)
    if (PositionOf(character) != kAbsent) kept.push_back(character);
  return kept;
}

void ApplyCipher(Text& value) {
  // In place: the text may be a password, of which nothing stays in memory that this function owns.
  std::erase_if(value, [](char16_t character) { return PositionOf(character) == kAbsent; });
  std::size_t keyIndex = value.size() % kKey.size();
  for (char16_t& character : value) {
    const std::size_t shifted =
        (PositionOf(kKey[keyIndex]) + std::size_t{PositionOf(character)}) % kAlphabet.size();
    character = kAlphabet[(kAlphabet.size() - shifted) % kAlphabet.size()];
    keyIndex = (keyIndex + 1) % kKey.size();
  }
}

Text EncryptParameter(TextView value) {
  Text copy(value);
  ApplyCipher(copy);
  return copy;
}

}  // namespace tarnwick
