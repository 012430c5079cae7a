#include "platform/windows/WindowsStringResources.h"

#include <array>
#include <utility>

#include "platform/windows/AnsiText.h"
#include "platform/windows/Owner.h"

namespace tarnwick {
namespace {

Text StringOf(HINSTANCE module, std::uint16_t identifier) {
  // Hosts know the strings cut at this size.
  std::array<char, 512> bytes{};
  const int length = LoadStringA(module, identifier, bytes.data(), static_cast<int>(bytes.size()));
  return length > 0 ? TextFromAnsi({bytes.data(), static_cast<std::size_t>(length)}) : Text();
}

// With a drive and its root, or on a server. Any other path depends on what is current, and a bare name would
// be searched for.
bool IsFullPath(TextView path) {
  const auto isSlash = [](char16_t unit) { return unit == u'\\' || unit == u'/'; };
  if (path.size() < 3) return false;
  return (path[1] == u':' && isSlash(path[2])) || (isSlash(path[0]) && isSlash(path[1]));
}

class WindowsResourceLibrary : public ResourceLibrary {
 public:
  explicit WindowsResourceLibrary(LibraryOwner library) : library_(std::move(library)) {}

  Text String(std::uint16_t identifier) override { return StringOf(library_.Get(), identifier); }

 private:
  LibraryOwner library_;
};

}  // namespace

std::unique_ptr<ResourceLibrary> WindowsStringResources::Load(TextView path) {
  const auto ansiPath = AnsiFromText(path);
  if (!ansiPath || !IsFullPath(path)) return nullptr;
  // As data: the strings are the same whatever processor the file is for, and none of its code runs.
  LibraryOwner library(
      LoadLibraryExA(ansiPath->c_str(), nullptr, LOAD_LIBRARY_AS_DATAFILE | LOAD_LIBRARY_AS_IMAGE_RESOURCE));
  return library ? std::make_unique<WindowsResourceLibrary>(std::move(library)) : nullptr;
}

Text WindowsStringResources::OwnString(std::uint16_t identifier) {
  return StringOf(module_, identifier);
}

}  // namespace tarnwick
