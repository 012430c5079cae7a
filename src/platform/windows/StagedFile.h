// A new file beside its target, which becomes the target whole or goes away.
#pragma once

#include <string>
#include <string_view>

#include "platform/windows/Owner.h"

namespace tarnwick {

class StagedFile {
 public:
  // Creates an empty file of a name of its own in the folder of `target`.
  explicit StagedFile(const std::wstring& target);
  ~StagedFile();
  StagedFile(const StagedFile&) = delete;
  StagedFile& operator=(const StagedFile&) = delete;

  // Full name of the file; empty when it could not be created.
  const std::wstring& Path() const { return path_; }

  // False when not all of the bytes could be written.
  bool Write(std::string_view bytes);

  // For a call that writes to the file by its name.
  void Close() { file_ = {}; }

  // Renames the file to the target, over a file of that name unless it is read-only. On failure what was
  // there stays.
  bool Commit();

 private:
  const std::wstring target_;
  std::wstring path_;
  FileOwner file_;
};

}  // namespace tarnwick
