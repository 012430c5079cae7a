#include "platform/windows/StagedFile.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <vector>

namespace tarnwick {
namespace {

// No other file of this process, and of no other one that runs now, has it.
std::wstring UniqueName() {
  static std::atomic<DWORD> files{0};
  std::array<wchar_t, 32> name{};
  wsprintfW(name.data(), L"twk%lx-%lx-%lx.tmp", GetCurrentProcessId(), GetTickCount(), ++files);
  return name.data();
}

FileOwner Opened(const std::wstring& path, DWORD access, DWORD disposition) {
  return FileOwner(CreateFileW(path.c_str(), access, 0, nullptr, disposition, 0, nullptr));
}

// Without a look-up of the old name, which takes longer than writing a small file.
bool Rename(HANDLE file, const std::wstring& name) {
  std::vector<char> room(sizeof(FILE_RENAME_INFO) + name.size() * sizeof(wchar_t));
  auto* const info = reinterpret_cast<FILE_RENAME_INFO*>(room.data());
  info->ReplaceIfExists = TRUE;
  info->FileNameLength = static_cast<DWORD>(name.size() * sizeof(wchar_t));
  name.copy(info->FileName, name.size());
  return SetFileInformationByHandle(file, FileRenameInfo, info, static_cast<DWORD>(room.size()));
}

}  // namespace

StagedFile::StagedFile(const std::wstring& target) : target_(target) {
  // A target without a folder is in the current one; "C:name" keeps its drive.
  path_ = target.substr(0, target.find_last_of(L"\\/:") + 1) + UniqueName();
  file_ = Opened(path_, GENERIC_WRITE | DELETE, CREATE_NEW);
  if (!file_) path_.clear();
}

StagedFile::~StagedFile() {
  Close();
  if (path_.empty()) return;
  // A copy of a read-only file is read-only too, and could not be deleted.
  SetFileAttributesW(path_.c_str(), FILE_ATTRIBUTE_NORMAL);
  DeleteFileW(path_.c_str());
}

bool StagedFile::Write(std::string_view bytes) {
  while (!bytes.empty()) {
    DWORD count = 0;
    const auto most = static_cast<DWORD>(std::min<std::size_t>(bytes.size(), 1U << 30));
    if (!WriteFile(file_.Get(), bytes.data(), most, &count, nullptr) || count == 0) return false;
    bytes.remove_prefix(count);
  }
  return true;
}

bool StagedFile::Commit() {
  if (path_.empty()) return false;
  const DWORD attributes = GetFileAttributesW(target_.c_str());
  // Not left to the rename, which some versions of the system let through.
  if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_READONLY) != 0) return false;
  if (!file_) file_ = Opened(path_, DELETE, OPEN_EXISTING);
  if (!file_ || !Rename(file_.Get(), target_)) return false;
  path_.clear();
  return true;
}

}  // namespace tarnwick
