#pragma once

#include "platform/StringResources.h"
#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

class WindowsStringResources : public StringResources {
 public:
  // `module` holds the library's own strings and stays loaded while the object lives.
  explicit WindowsStringResources(HINSTANCE module) : module_(module) {}

  std::unique_ptr<ResourceLibrary> Load(TextView path) override;
  Text OwnString(std::uint16_t identifier) override;

 private:
  HINSTANCE module_;
};

}  // namespace tarnwick
