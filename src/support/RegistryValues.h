// Registry values by a key path that names its hive, such as "\HKEY_CURRENT_USER\Software".
#pragma once

#include <cstdint>
#include <memory>

#include "base/Text.h"
#include "platform/Registry.h"

namespace tarnwick {

class RegistryValues {
 public:
  struct Value {
    RegistryType type = RegistryType::kString;
    // For kNumber.
    std::uint32_t number = 0;
    // For the other types; binary data has a character per byte.
    Text text;
  };

  // Opens the key. Throws run-time error 5 when the path is malformed or the key is not there. `registry`
  // outlives the object.
  RegistryValues(Registry& registry, TextView path);

  // Throws run-time error 5 when there is no such value. One of another type than the four has neither number
  // nor text.
  Value Get(TextView name) const;

 private:
  Registry& registry_;
  std::unique_ptr<RegistryKey> key_;
};

}  // namespace tarnwick
