// A new file beside its target, which becomes the target whole or goes away.
#pragma once

#include <string>

#include "support/Text.h"

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

  // Renames the file to the target, over a file of that name unless it is read-only. On failure what was
  // there stays. The file must not be open.
  bool Commit();

 private:
  std::wstring target_;
  std::wstring path_;
};

}  // namespace tarnwick
