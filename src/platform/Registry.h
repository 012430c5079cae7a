// The seam to the system's registry. Read-only; one call of ours is one call of the system's.
#pragma once

#include <cstdint>
#include <memory>
#include <span>

#include "base/Text.h"

namespace tarnwick {

// Value types as the system numbers them.
enum class RegistryType : std::uint32_t { kString = 1, kExpandString = 2, kBinary = 3, kNumber = 4 };

// Predefined keys as the system numbers them; the numbers are public (`REG_HIVES`).
inline constexpr std::uint32_t kHiveClassesRoot = 0x80000000;
inline constexpr std::uint32_t kHiveCurrentUser = 0x80000001;
inline constexpr std::uint32_t kHiveLocalMachine = 0x80000002;
inline constexpr std::uint32_t kHiveUsers = 0x80000003;
inline constexpr std::uint32_t kHiveCurrentConfig = 0x80000005;
inline constexpr std::uint32_t kHiveDynData = 0x80000006;

inline constexpr std::uint32_t kRegistrySuccess = 0;

// An open key; closed by its destructor.
class RegistryKey {
 public:
  virtual ~RegistryKey() = default;

  // Reads value `name` into `data` (ANSI bytes for texts). `type` receives the value's type and `size` the
  // number of bytes, a text's terminator included when it was stored. Returns the system's status, 0 for
  // success; a value that does not fit fails.
  virtual std::uint32_t Query(TextView name, std::uint32_t& type, std::span<std::uint8_t> data,
                              std::uint32_t& size) = 0;
};

class Registry {
 public:
  virtual ~Registry() = default;

  // Opens `path` below `hive` for querying values. Returns the system's status; `key` is set on success only.
  virtual std::uint32_t Open(std::uint32_t hive, TextView path, std::unique_ptr<RegistryKey>& key) = 0;

  // Text of ANSI bytes that a query delivered.
  virtual Text TextFromAnsi(std::string_view bytes) const = 0;
};

}  // namespace tarnwick
