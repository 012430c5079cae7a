// A new file that becomes its target whole or goes away, also when the process is ended: beside the target,
// or in its place at once when all of the bytes are there.
#pragma once

#include <string>
#include <string_view>

#include "platform/windows/Owner.h"

namespace tarnwick {

// What the path names while the current folder is this one; empty when it is no path.
std::wstring FullPath(const std::wstring& path);

class StagedFile {
 public:
  // Creates an empty file of a name of its own in the folder of `target`. The first in a folder removes the
  // leftovers there.
  explicit StagedFile(const std::wstring& target) : StagedFile(target, Place::kBeside) {}
  ~StagedFile();
  StagedFile(const StagedFile&) = delete;
  StagedFile& operator=(const StagedFile&) = delete;

  // Full name of the file; empty when it could not be created.
  const std::wstring& Path() const { return path_; }

  // False when not all of the bytes could be written.
  bool Write(std::string_view bytes);

  // For a call that writes to the file by its name. If the process is ended meanwhile, the file is left over.
  void Close() {
    Keep();
    file_ = {};
    goesWhenClosed_ = false;
  }

  // Renames the file to the target, over a file of that name unless it is read-only. On failure what was
  // there stays.
  bool Commit();

  // Writes a file of these bytes in its place at once, where there is none. False, and nothing is left of it,
  // when it cannot be there whole or the system cannot let it go with its handle.
  static bool WriteNew(const std::wstring& target, std::string_view bytes);

  // Removes what ended processes left in the folder, which is named with its last separator.
  static void RemoveLeftovers(const std::wstring& folder);

 private:
  enum class Place { kBeside, kTarget };
  StagedFile(const std::wstring& target, Place place);
  // The file stays when it is closed.
  bool Keep();

  const std::wstring target_;
  std::wstring path_;
  FileOwner file_;
  bool goesWhenClosed_ = false;
};

}  // namespace tarnwick
