#include "transfer/FileNameGuard.h"

#include <algorithm>
#include <array>

namespace tarnwick {
namespace {

constexpr TextView kRefused = u"\\/:*?\"<>|";
constexpr std::array<TextView, 6> kDevices = {u"con", u"prn", u"aux", u"nul", u"conin$", u"conout$"};

// Read from every folder or drive that is shown.
constexpr std::array<TextView, 2> kFolderSettings = {u"desktop.ini", u"autorun.inf"};

// Their ending is never shown, and their icon is fetched from wherever they say.
constexpr std::array<TextView, 9> kShortcuts = {
    u".appref-ms", u".library-ms",         u".lnk", u".pif",    u".scf",
    u".search-ms", u".searchconnector-ms", u".url", u".website"};

bool IsControl(char16_t unit) {
  return unit < 0x20 || (unit >= 0x7F && unit < 0xA0);
}

// What only joins letters or parts them is a part of words in many languages and stays.
bool TurnsDirection(char16_t unit) {
  return unit == 0x061C || unit == 0x200E || unit == 0x200F || (unit >= 0x202A && unit <= 0x202E) ||
         (unit >= 0x2066 && unit <= 0x2069);
}

bool IsActedUpon(TextView name) {
  const Text lower = LowerCase(name);
  return std::find(kFolderSettings.begin(), kFolderSettings.end(), lower) != kFolderSettings.end() ||
         std::any_of(kShortcuts.begin(), kShortcuts.end(),
                     [&](TextView ending) { return lower.ends_with(ending); });
}

bool IsDevice(TextView name) {
  // The extension does not count, nor do blanks before it.
  const Text base = LowerCase(Trim(name.substr(0, name.find(u'.'))));
  if (std::find(kDevices.begin(), kDevices.end(), base) != kDevices.end()) return true;
  // COM1 to COM9 and LPT1 to LPT9, also with the raised digits 1 to 3.
  if (base.size() != 4 || (!base.starts_with(u"com") && !base.starts_with(u"lpt"))) return false;
  return TextView(u"0123456789\u00b9\u00b2\u00b3").find(base[3]) != TextView::npos;
}

}  // namespace

bool IsSafeFileName(TextView name) {
  const auto refused = [](char16_t unit) {
    return IsControl(unit) || TurnsDirection(unit) || kRefused.find(unit) != TextView::npos;
  };
  // "." and ".." end with a dot.
  return !name.empty() && std::none_of(name.begin(), name.end(), refused) && name.back() != u'.' &&
         name.back() != u' ' && !IsDevice(name) && !IsActedUpon(name);
}

Text ShownName(TextView name) {
  Text shown(name);
  std::replace_if(
      shown.begin(), shown.end(), [](char16_t unit) { return IsControl(unit) || TurnsDirection(unit); },
      u'\uFFFD');
  return shown;
}

}  // namespace tarnwick
