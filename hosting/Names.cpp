#include "hosting/Names.h"

#include <clocale>
#include <cwctype>

#include "base/Text.h"
#include "service/modEnctyption.h"
#include "support/PathHelpers.h"

namespace tarnwick::hosting {
namespace {

// Of one name in a folder, in bytes.
constexpr std::size_t kLongestName = 255;

// What clients cannot have in the name of a file or folder, and what has a meaning of its own in an address.
constexpr TextView kReserved = u"\\/:*?\"<>|#%";

bool IsControl(char16_t unit) {
  return unit < 0x20 || (unit >= 0x7F && unit <= 0x9F);
}

}  // namespace

bool IsRefusedFileName(std::string_view name) {
  const auto text = TextFromUtf8(name);
  if (!text || name.empty() || name.size() > kLongestName || name == "." || name == "..") return true;
  for (const char16_t unit : *text)
    if (IsControl(unit) || kReserved.find(unit) != TextView::npos) return true;
  return false;
}

bool IsRefusedUserName(std::string_view name) {
  // The name becomes a folder's and a part of addresses. One without a single character of the cipher could
  // never log on.
  return IsRefusedFileName(name) || name.find(' ') != std::string_view::npos || Strip(name).empty();
}

std::string FoldCase(std::string_view name) {
  // The program's own locale knows ASCII letters only.
  static const locale_t unicode = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
  Text text = TextFromUtf8(name).value_or(Text());
  for (char16_t& unit : text)
    unit = static_cast<char16_t>(unicode ? towlower_l(unit, unicode) : std::towlower(unit));
  return Utf8FromText(text);
}

std::string Strip(std::string_view text) {
  return Utf8FromText(StripToAlphabet(TextFromUtf8(text).value_or(Text())));
}

std::string FolderOf(std::string_view userName) {
  return Utf8FromText(UserFolderName(TextFromUtf8(userName).value_or(Text())));
}

}  // namespace tarnwick::hosting
