// A read-only registry reader: values below a base key, as text. It keeps no key open between calls and never
// throws.
#pragma once

#include <cstdint>

#include "base/Text.h"
#include "platform/Registry.h"

namespace tarnwick {

class CRegistry {
 public:
  // `registry` outlives the object.
  explicit CRegistry(Registry& registry) : registry_(registry) {}

  // Stores hive (a predefined key) and path; nothing is opened or checked.
  void setBaseRegKey(std::uint32_t regHive, TextView regSubKeys);

  // Data of value `RegNameValue` in `Subkey` of the base key (the base key itself when empty), or an empty
  // text. `Datatype` (a RegistryType) says how to read: 0 and 1 as text, 2 as text, 4 as the decimal text of
  // a number. For 2 and 4 it receives the value's actual type. Anything else yields an empty text without a
  // query. A text longer than 255 bytes is not read.
  Text getRegSetting(TextView RegNameValue, TextView Subkey, std::uint32_t& Datatype);

 private:
  bool QueryValue(const Text& keyPath, TextView name, std::uint32_t& type);

  Registry& registry_;
  std::uint32_t baseHive_ = 0;
  Text basePath_;
  Text lastText_;
  std::int32_t lastNumber_ = 0;
};

}  // namespace tarnwick
