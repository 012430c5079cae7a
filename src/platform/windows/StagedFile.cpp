#include "platform/windows/StagedFile.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cwchar>
#include <mutex>
#include <set>
#include <vector>

namespace tarnwick {
namespace {

std::wstring NameOf(DWORD process, DWORD tick, DWORD number) {
  std::array<wchar_t, 40> name{};
  wsprintfW(name.data(), L"twk%lx-%lx-%lx.tmp", process, tick, number);
  return name.data();
}

// No other file of this process, and of no other one that runs now, has it.
std::wstring UniqueName() {
  static std::atomic<DWORD> files{0};
  return NameOf(GetCurrentProcessId(), GetTickCount(), ++files);
}

// The process that gave a file its name; 0 for a name of another form.
DWORD WriterOf(const wchar_t* name) {
  DWORD process = 0;
  DWORD tick = 0;
  DWORD number = 0;
  const bool fits = std::swscanf(name, L"twk%lx-%lx-%lx", &process, &tick, &number) == 3;
  return fits && NameOf(process, tick, number) == name ? process : 0;
}

// Whether the process runs and was there when the file was made: a later one may have the number again.
bool Lives(DWORD process, const FILETIME& fileMade) {
  const HandleOwner owner(OpenProcess(PROCESS_QUERY_LIMITED_INFORMATION, FALSE, process));
  if (!owner) return GetLastError() == ERROR_ACCESS_DENIED;
  DWORD code = 0;
  if (GetExitCodeProcess(owner.Get(), &code) && code != STILL_ACTIVE) return false;
  FILETIME started{};
  FILETIME other{};
  return !GetProcessTimes(owner.Get(), &started, &other, &other, &other) ||
         CompareFileTime(&started, &fileMade) <= 0;
}

FileOwner Opened(const std::wstring& path, DWORD access, DWORD disposition, DWORD share = 0) {
  return FileOwner(CreateFileW(path.c_str(), access, share, nullptr, disposition, 0, nullptr));
}

// Whether the file goes when `file`, its only handle, is closed, be it by the end of the process.
bool SetGoesWhenClosed(HANDLE file, bool goes) {
  FILE_DISPOSITION_INFO info{goes};
  return SetFileInformationByHandle(file, FileDispositionInfo, &info, sizeof info);
}

void RemoveFile(const std::wstring& path) {
  // A copy of a read-only file is read-only too, and could not be deleted.
  SetFileAttributesW(path.c_str(), FILE_ATTRIBUTE_NORMAL);
  DeleteFileW(path.c_str());
}

// Once for each folder: what others leave there meanwhile is for a later process.
void RemoveLeftoversOnce(const std::wstring& folder) {
  static std::mutex lock;
  static std::set<std::wstring> folders;
  const bool isNew = [&] {
    const std::lock_guard guard(lock);
    return folders.insert(folder).second;
  }();
  if (isNew) StagedFile::RemoveLeftovers(folder);
}

// With its last separator.
std::wstring FolderOf(const std::wstring& fullPath) {
  return fullPath.substr(0, fullPath.find_last_of(L"\\/") + 1);
}

// Without a look-up of the old name, which takes longer than writing a small file.
bool Rename(HANDLE file, const std::wstring& name, bool replace) {
  std::vector<char> room(sizeof(FILE_RENAME_INFO) + name.size() * sizeof(wchar_t));
  auto* const info = reinterpret_cast<FILE_RENAME_INFO*>(room.data());
  info->ReplaceIfExists = replace;
  info->FileNameLength = static_cast<DWORD>(name.size() * sizeof(wchar_t));
  name.copy(info->FileName, name.size());
  return SetFileInformationByHandle(file, FileRenameInfo, info, static_cast<DWORD>(room.size()));
}

}  // namespace

std::wstring FullPath(const std::wstring& path) {
  std::wstring full(GetFullPathNameW(path.c_str(), 0, nullptr, nullptr), L'\0');
  full.resize(GetFullPathNameW(path.c_str(), static_cast<DWORD>(full.size()), full.data(), nullptr));
  return full;
}

StagedFile::StagedFile(const std::wstring& target, Place place)
    : target_(FullPath(target)), path_(place == Place::kTarget ? target_ : FolderOf(target_) + UniqueName()) {
  RemoveLeftoversOnce(FolderOf(path_));
  file_ = Opened(path_, GENERIC_WRITE | DELETE, CREATE_NEW);
  if (file_)
    goesWhenClosed_ = SetGoesWhenClosed(file_.Get(), true);
  else
    path_.clear();
}

StagedFile::~StagedFile() {
  file_ = {};
  if (!path_.empty() && !goesWhenClosed_) RemoveFile(path_);
}

bool StagedFile::WriteNew(const std::wstring& target, std::string_view bytes) {
  StagedFile file(target, Place::kTarget);
  if (!file.goesWhenClosed_ || !file.Write(bytes) || !file.Keep()) return false;
  file.path_.clear();
  return true;
}

void StagedFile::RemoveLeftovers(const std::wstring& folder) {
  WIN32_FIND_DATAW found{};
  const FindOwner search(FindFirstFileW((folder + L"twk*.tmp").c_str(), &found));
  if (!search) return;
  do {
    if ((found.dwFileAttributes & (FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT)) != 0) continue;
    const DWORD writer = WriterOf(found.cFileName);
    if (writer == 0 || Lives(writer, found.ftCreationTime)) continue;
    const std::wstring path = folder + found.cFileName;
    // On a share the writer may run on another machine; but it holds the file.
    if (Opened(path, DELETE, OPEN_EXISTING)) RemoveFile(path);
  } while (FindNextFileW(search.Get(), &found));
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

bool StagedFile::Keep() {
  if (goesWhenClosed_ && SetGoesWhenClosed(file_.Get(), false)) goesWhenClosed_ = false;
  return !goesWhenClosed_;
}

bool StagedFile::Commit() {
  if (path_.empty()) return false;
  // A scanner may have opened what was written by its name.
  if (!file_)
    file_ = Opened(path_, DELETE, OPEN_EXISTING, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE);
  if (!file_ || !Keep()) return false;
  // Most often there is none. To ask first would take as long as the rename in a folder of many files.
  if (!Rename(file_.Get(), target_, false)) {
    if (GetLastError() != ERROR_ALREADY_EXISTS) return false;
    const DWORD attributes = GetFileAttributesW(target_.c_str());
    // Wine: the rename would replace a read-only file.
    if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_READONLY) != 0) return false;
    if (!Rename(file_.Get(), target_, true)) return false;
  }
  path_.clear();
  return true;
}

}  // namespace tarnwick
