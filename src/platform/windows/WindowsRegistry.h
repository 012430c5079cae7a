#pragma once

#include "platform/Registry.h"

namespace tarnwick {

class WindowsRegistry : public Registry {
 public:
  std::uint32_t Open(std::uint32_t hive, TextView path, std::unique_ptr<RegistryKey>& key) override;
  Text TextFromAnsi(std::string_view bytes) const override;
};

}  // namespace tarnwick
