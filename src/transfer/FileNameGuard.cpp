#include "transfer/FileNameGuard.h"

#include <algorithm>
#include <array>

namespace tarnwick {
namespace {

constexpr TextView kRefused = u"\\/:*?\"<>|";
constexpr std::array<TextView, 6> kDevices = {u"con", u"prn", u"aux", u"nul", u"conin$", u"conout$"};

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
    return unit < 0x20 || unit == 0x7F || kRefused.find(unit) != TextView::npos;
  };
  // "." and ".." end with a dot.
  return !name.empty() && std::none_of(name.begin(), name.end(), refused) && name.back() != u'.' &&
         name.back() != u' ' && !IsDevice(name);
}

}  // namespace tarnwick
