#pragma once

#include "platform/FileSystem.h"

namespace tarnwick {

class WindowsFileSystem : public FileSystem {
 public:
  std::uint64_t Length(TextView path) override;
  Text ModifiedText(TextView path) override;
  std::uint32_t Attributes(TextView path) override;
  void SetAttributes(TextView path, std::uint32_t attributes) override;
  bool SameFile(TextView first, TextView second) override;
  void Copy(TextView source, TextView destination) override;
  std::unique_ptr<FileReader> Open(TextView path) override;
  std::size_t ReadBeginning(TextView path, std::span<char> room) override;
  std::unique_ptr<FileWriter> Create(TextView path) override;
  bool WriteNew(TextView path, std::string_view bytes) override;
  void Remove(TextView path) override;
  void RemoveLeftovers(TextView folder) noexcept override;
  bool Exists(TextView pattern, bool folders) override;
  void MakeFolder(TextView path) override;
  Text TempPath() override;
};

}  // namespace tarnwick
