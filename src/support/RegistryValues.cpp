#include "support/RegistryValues.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

#include "base/RuntimeError.h"

namespace tarnwick {
namespace {

struct Hive {
  TextView name;
  std::uint32_t key;
};

constexpr std::array kHives = {
    Hive{u"HKEY_CLASSES_ROOT", kHiveClassesRoot},     Hive{u"HKEY_CURRENT_USER", kHiveCurrentUser},
    Hive{u"HKEY_LOCAL_MACHINE", kHiveLocalMachine},   Hive{u"HKEY_USERS", kHiveUsers},
    Hive{u"HKEY_CURRENT_CONFIG", kHiveCurrentConfig}, Hive{u"HKEY_DYN_DATA", kHiveDynData},
};

// Proxy lists can be long, but a value beyond this is no setting.
constexpr std::size_t kMostBytes = 64 * 1024;

}  // namespace

RegistryValues::RegistryValues(Registry& registry, TextView path) : registry_(registry) {
  if (!path.starts_with(u'\\')) throw RuntimeError(error::kInvalidCall);
  path.remove_prefix(1);
  const std::size_t nameEnd = std::min(path.find(u'\\'), path.size());
  const auto* hive = std::find_if(kHives.begin(), kHives.end(),
                                  [&](const Hive& known) { return known.name == path.substr(0, nameEnd); });
  if (hive == kHives.end()) throw RuntimeError(error::kInvalidCall);
  const TextView subKey = path.substr(std::min(nameEnd + 1, path.size()));
  if (registry.Open(hive->key, subKey, key_) != kRegistrySuccess) throw RuntimeError(error::kInvalidCall);
}

RegistryValues::Value RegistryValues::Get(TextView name) const {
  std::vector<std::uint8_t> data(kMostBytes);
  std::uint32_t type = 0;
  std::uint32_t size = 0;
  if (key_->Query(name, type, data, size) != kRegistrySuccess) throw RuntimeError(error::kInvalidCall);
  const std::string_view bytes(reinterpret_cast<const char*>(data.data()),
                               std::min<std::size_t>(size, kMostBytes));

  Value value;
  value.type = static_cast<RegistryType>(type);
  switch (value.type) {
    case RegistryType::kString:
    case RegistryType::kExpandString:
      value.text = registry_.TextFromAnsi(bytes.substr(0, bytes.find('\0')));
      break;
    case RegistryType::kBinary:
      value.text = TextFromLatin1(bytes);
      break;
    case RegistryType::kNumber:
      std::memcpy(&value.number, bytes.data(), std::min(bytes.size(), sizeof value.number));
      break;
  }
  return value;
}

}  // namespace tarnwick
