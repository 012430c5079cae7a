#include "session/ResourceStrings.h"

#include "base/RuntimeError.h"
#include "platform/StringResources.h"
#include "session/Apartment.h"
#include "support/CRegistry.h"

namespace tarnwick {
namespace {

constexpr TextView kHostProductKey = u"Software\\Drennick Software\\Orvanta 2.0";

}  // namespace

void LoadResourceLibrary(Apartment& apartment) noexcept {
  if (apartment.resourceLibraryTried) return;
  apartment.resourceLibraryTried = true;
  ResultAsItStood(0, [&](int&) {
    CRegistry settings(apartment.platform.registry);
    settings.setBaseRegKey(kHiveCurrentUser, kHostProductKey);
    std::uint32_t type = 0;
    const Text folder = settings.getRegSetting(u"Install Path", u"Paths", type);
    // Without a folder the path would name a file in the root of whatever drive is current.
    if (folder.empty()) return;
    apartment.resourceLibrary = apartment.platform.strings.Load(folder + u"\\" + u"ORVRES.dll");
  });
}

Text GetResourceString(Apartment& apartment, std::uint16_t identifier) {
  if (apartment.resourceLibrary) {
    Text text = apartment.resourceLibrary->String(identifier);
    if (!text.empty()) return text;
  }
  Text text = apartment.platform.strings.OwnString(identifier);
  if (text.empty()) throw RuntimeError(error::kResourceNotFound);
  return text;
}

}  // namespace tarnwick
