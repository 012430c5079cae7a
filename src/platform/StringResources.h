// The seam to string resources: the library's own and those of a library that is loaded for its strings only.
#pragma once

#include <cstdint>
#include <memory>

#include "base/Text.h"

namespace tarnwick {

// A loaded resource library; unloaded by its destructor. None of its code runs.
class ResourceLibrary {
 public:
  virtual ~ResourceLibrary() = default;

  // The string, cut at 511 bytes; empty when the library has none of that identifier.
  virtual Text String(std::uint16_t identifier) = 0;
};

class StringResources {
 public:
  virtual ~StringResources() = default;

  // Null when the file cannot be loaded.
  virtual std::unique_ptr<ResourceLibrary> Load(TextView path) = 0;

  // String of the library's own table; empty when it has none of that identifier.
  virtual Text OwnString(std::uint16_t identifier) = 0;
};

}  // namespace tarnwick
