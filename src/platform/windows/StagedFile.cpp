#include "platform/windows/StagedFile.h"

#include <array>

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

StagedFile::StagedFile(const std::wstring& target) : target_(target) {
  // A target without a folder is in the current one; "C:name" keeps its drive.
  const std::size_t folderEnd = target.find_last_of(L"\\/:") + 1;
  const std::wstring folder = folderEnd == 0 ? L"." : target.substr(0, folderEnd);
  std::array<wchar_t, MAX_PATH> name{};
  if (GetTempFileNameW(folder.c_str(), L"twk", 0, name.data()) != 0) path_ = name.data();
}

StagedFile::~StagedFile() {
  if (path_.empty()) return;
  // A copy of a read-only file is read-only too, and could not be deleted.
  SetFileAttributesW(path_.c_str(), FILE_ATTRIBUTE_NORMAL);
  DeleteFileW(path_.c_str());
}

bool StagedFile::Commit() {
  const DWORD attributes = GetFileAttributesW(target_.c_str());
  // Not left to the rename, which some versions of the system let through.
  if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_READONLY) != 0) return false;
  if (path_.empty() || !MoveFileExW(path_.c_str(), target_.c_str(), MOVEFILE_REPLACE_EXISTING)) return false;
  path_.clear();
  return true;
}

}  // namespace tarnwick
