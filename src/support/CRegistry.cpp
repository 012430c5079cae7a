#include "support/CRegistry.h"

#include <array>
#include <cstring>
#include <memory>

#include "base/RuntimeError.h"

namespace tarnwick {
namespace {

// 255 characters and a terminator: hosts rely on longer values being refused.
constexpr std::size_t kRoomBytes = 256;

constexpr auto kString = static_cast<std::uint32_t>(RegistryType::kString);
constexpr auto kExpandString = static_cast<std::uint32_t>(RegistryType::kExpandString);
constexpr auto kNumber = static_cast<std::uint32_t>(RegistryType::kNumber);

}  // namespace

void CRegistry::setBaseRegKey(std::uint32_t regHive, TextView regSubKeys) {
  baseHive_ = regHive;
  basePath_ = regSubKeys;
}

Text CRegistry::getRegSetting(TextView RegNameValue, TextView Subkey, std::uint32_t& Datatype) {
  return ResultAsItStood(Text(), [&](Text& result) {
    const Text keyPath = Subkey.empty() ? basePath_ : basePath_ + u"\\" + Text(Subkey);
    std::uint32_t asString = kString;
    switch (Datatype) {
      case 0:
      case kString:
        if (QueryValue(keyPath, RegNameValue, asString)) result = lastText_;
        break;
      case kExpandString:
        if (QueryValue(keyPath, RegNameValue, Datatype)) result = lastText_;
        break;
      case kNumber:
        if (QueryValue(keyPath, RegNameValue, Datatype)) result = TextFromNumber(lastNumber_);
        break;
      default:
        break;
    }
  });
}

// True when the value was read as what it is, whichever of the two was asked for: a number found for a text
// counts as read and leaves the last text as it was.
bool CRegistry::QueryValue(const Text& keyPath, TextView name, std::uint32_t& type) {
  std::unique_ptr<RegistryKey> key;
  if (registry_.Open(baseHive_, keyPath, key) != kRegistrySuccess) return false;
  std::array<std::uint8_t, kRoomBytes> data{};
  std::uint32_t size = 0;
  if (key->Query(name, type, data, size) != kRegistrySuccess) return false;

  if (type == kString || type == kExpandString) {
    if (size < 1 || size > data.size()) return false;
    lastText_ = registry_.TextFromAnsi({reinterpret_cast<const char*>(data.data()), size - std::size_t{1}});
    return true;
  }
  if (type == kNumber) {
    std::memcpy(&lastNumber_, data.data(), sizeof lastNumber_);
    return true;
  }
  return false;
}

}  // namespace tarnwick
