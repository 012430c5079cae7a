#include "platform/windows/WindowsRegistry.h"

#include <utility>

#include "platform/windows/AnsiText.h"
#include "platform/windows/Owner.h"

namespace tarnwick {
namespace {

// The predefined keys are 32-bit numbers that a 64-bit process sign-extends.
HKEY PredefinedKey(std::uint32_t hive) {
  return reinterpret_cast<HKEY>(static_cast<LONG_PTR>(static_cast<std::int32_t>(hive)));
}

class WindowsRegistryKey : public RegistryKey {
 public:
  explicit WindowsRegistryKey(KeyOwner key) : key_(std::move(key)) {}

  std::uint32_t Query(TextView name, std::uint32_t& type, std::span<std::uint8_t> data,
                      std::uint32_t& size) override {
    const auto ansiName = AnsiFromText(name);
    if (!ansiName) return ERROR_FILE_NOT_FOUND;
    DWORD itsType = type;
    DWORD itsSize = static_cast<DWORD>(data.size());
    const LSTATUS status =
        RegQueryValueExA(key_.Get(), ansiName->c_str(), nullptr, &itsType, data.data(), &itsSize);
    type = itsType;
    size = itsSize;
    return static_cast<std::uint32_t>(status);
  }

 private:
  KeyOwner key_;
};

}  // namespace

std::uint32_t WindowsRegistry::Open(std::uint32_t hive, TextView path, std::unique_ptr<RegistryKey>& key) {
  const auto ansiPath = AnsiFromText(path);
  if (!ansiPath) return ERROR_FILE_NOT_FOUND;
  HKEY handle = nullptr;
  const LSTATUS status = RegOpenKeyExA(PredefinedKey(hive), ansiPath->c_str(), 0, KEY_QUERY_VALUE, &handle);
  if (status == ERROR_SUCCESS) key = std::make_unique<WindowsRegistryKey>(KeyOwner(handle));
  return static_cast<std::uint32_t>(status);
}

Text WindowsRegistry::TextFromAnsi(std::string_view bytes) const {
  return tarnwick::TextFromAnsi(bytes);
}

}  // namespace tarnwick
