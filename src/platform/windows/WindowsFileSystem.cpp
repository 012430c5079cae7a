#include "platform/windows/WindowsFileSystem.h"

#include <algorithm>
#include <array>
#include <future>
#include <optional>
#include <string>
#include <utility>

#include "base/RuntimeError.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/Owner.h"
#include "platform/windows/StagedFile.h"
#include "platform/windows/ThreadPool.h"

namespace tarnwick {
namespace {

// The bits that a program can set; the system numbers them as the core does.
constexpr std::uint32_t kSettable = attribute::kReadOnly | attribute::kHidden | attribute::kSystem |
                                    attribute::kArchive | attribute::kTemporary | attribute::kOffline |
                                    attribute::kNotIndexed;

// 255 characters with their terminator, as hosts know the temporary folder.
constexpr DWORD kTempPathRoom = 255;

// Wide form of `path`, for which a NUL in it is no path: it would name another file than the one that was
// checked.
std::wstring WidePath(TextView path, std::int32_t errorNumber) {
  if (path.find(u'\0') != TextView::npos) throw RuntimeError(errorNumber);
  return WideFromText(path);
}

WIN32_FILE_ATTRIBUTE_DATA FileData(TextView path) {
  WIN32_FILE_ATTRIBUTE_DATA data{};
  const std::wstring widePath = WidePath(path, error::kFileNotFound);
  if (!GetFileAttributesExW(widePath.c_str(), GetFileExInfoStandard, &data) ||
      (data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0)
    throw RuntimeError(error::kFileNotFound);
  return data;
}

// Volume and number of a file; nullopt when there is none.
std::optional<std::array<DWORD, 3>> IdentityOf(TextView path) {
  // Without a right to its contents: others may hold it as they like.
  const FileOwner file(CreateFileW(WidePath(path, error::kFileNotFound).c_str(), FILE_READ_ATTRIBUTES,
                                   FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                                   OPEN_EXISTING, 0, nullptr));
  BY_HANDLE_FILE_INFORMATION data = {};
  if (!file || !GetFileInformationByHandle(file.Get(), &data)) return std::nullopt;
  return std::array{data.dwVolumeSerialNumber, data.nFileIndexHigh, data.nFileIndexLow};
}

class WindowsFileReader : public FileReader {
 public:
  explicit WindowsFileReader(FileOwner file) : file_(std::move(file)) {}

  std::size_t Read(std::span<char> room) override {
    DWORD count = 0;
    const auto most = static_cast<DWORD>(std::min<std::size_t>(room.size(), 1U << 30));
    if (!ReadFile(file_.Get(), room.data(), most, &count, nullptr)) throw RuntimeError(error::kPathAccess);
    return count;
  }

 private:
  FileOwner file_;
};

class WindowsFileWriter : public FileWriter {
 public:
  explicit WindowsFileWriter(const std::wstring& path) {
    const auto made = std::make_shared<std::promise<std::unique_ptr<StagedFile>>>();
    making_ = made->get_future();
    const auto make = [made, path] {
      try {
        made->set_value(std::make_unique<StagedFile>(path));
      } catch (...) {
        made->set_exception(std::current_exception());
      }
    };
    if (!RunOnPool(make)) make();
  }
  // What is still being made goes before the return, so that the caller can remove its folder.
  ~WindowsFileWriter() override {
    ResultAsItStood(0, [&](int&) {
      if (making_.valid()) staged_ = making_.get();
    });
  }

  void Write(std::string_view bytes) override {
    if (!Staged().Write(bytes)) throw RuntimeError(error::kPathAccess);
  }
  void Commit() override {
    if (!Staged().Commit()) throw RuntimeError(error::kPathAccess);
  }

 private:
  StagedFile& Staged() {
    if (making_.valid()) staged_ = making_.get();
    if (!staged_ || staged_->Path().empty()) throw RuntimeError(error::kPathAccess);
    return *staged_;
  }

  // Valid until it was waited for.
  std::future<std::unique_ptr<StagedFile>> making_;
  std::unique_ptr<StagedFile> staged_;
};

bool NothingThere(DWORD status) {
  return status == ERROR_FILE_NOT_FOUND || status == ERROR_PATH_NOT_FOUND || status == ERROR_INVALID_NAME;
}

}  // namespace

std::uint64_t WindowsFileSystem::Length(TextView path) {
  const WIN32_FILE_ATTRIBUTE_DATA data = FileData(path);
  return (std::uint64_t{data.nFileSizeHigh} << 32) | data.nFileSizeLow;
}

Text WindowsFileSystem::ModifiedText(TextView path) {
  const WIN32_FILE_ATTRIBUTE_DATA data = FileData(path);
  SYSTEMTIME utc{};
  SYSTEMTIME local{};
  std::array<wchar_t, 128> date{};
  std::array<wchar_t, 128> time{};
  // Local time as it was in force at that date, so that the text does not change with the season.
  if (!FileTimeToSystemTime(&data.ftLastWriteTime, &utc) ||
      !SystemTimeToTzSpecificLocalTime(nullptr, &utc, &local) ||
      !GetDateFormatW(LOCALE_USER_DEFAULT, DATE_SHORTDATE, &local, nullptr, date.data(),
                      static_cast<int>(date.size())) ||
      !GetTimeFormatW(LOCALE_USER_DEFAULT, 0, &local, nullptr, time.data(), static_cast<int>(time.size())))
    throw RuntimeError(error::kInvalidCall);
  return TextFromWide(date.data()) + u" " + TextFromWide(time.data());
}

std::uint32_t WindowsFileSystem::Attributes(TextView path) {
  return FileData(path).dwFileAttributes & kSettable;
}

void WindowsFileSystem::SetAttributes(TextView path, std::uint32_t attributes) {
  const std::wstring widePath = WidePath(path, error::kPathAccess);
  const DWORD bits = attributes & kSettable;
  if (!SetFileAttributesW(widePath.c_str(), bits != 0 ? bits : FILE_ATTRIBUTE_NORMAL))
    throw RuntimeError(error::kPathAccess);
}

bool WindowsFileSystem::SameFile(TextView first, TextView second) {
  const auto one = IdentityOf(first);
  return one && one == IdentityOf(second);
}

void WindowsFileSystem::Copy(TextView source, TextView destination) {
  const std::wstring from = WidePath(source, error::kFileNotFound);
  StagedFile staged(WidePath(destination, error::kPathAccess));
  if (staged.Path().empty()) throw RuntimeError(error::kPathAccess);
  staged.Close();
  if (!CopyFileW(from.c_str(), staged.Path().c_str(), FALSE))
    throw RuntimeError(NothingThere(GetLastError()) ? error::kFileNotFound : error::kPathAccess);
  if (!staged.Commit()) throw RuntimeError(error::kPathAccess);
}

std::unique_ptr<FileReader> WindowsFileSystem::Open(TextView path) {
  FileOwner file(CreateFileW(WidePath(path, error::kFileNotFound).c_str(), GENERIC_READ,
                             FILE_SHARE_READ | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                             FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
  if (!file) throw RuntimeError(NothingThere(GetLastError()) ? error::kFileNotFound : error::kPathAccess);
  return std::make_unique<WindowsFileReader>(std::move(file));
}

std::size_t WindowsFileSystem::ReadBeginning(TextView path, std::span<char> room) {
  // Others may write meanwhile: a file that a program holds open without locking it can be looked at.
  FileOwner file(CreateFileW(WidePath(path, error::kPathAccess).c_str(), GENERIC_READ,
                             FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_ALWAYS,
                             FILE_ATTRIBUTE_NORMAL, nullptr));
  if (!file)
    throw RuntimeError(GetLastError() == ERROR_PATH_NOT_FOUND ? error::kPathNotFound : error::kPathAccess);
  return WindowsFileReader(std::move(file)).Read(room);
}

std::unique_ptr<FileWriter> WindowsFileSystem::Create(TextView path) {
  return std::make_unique<WindowsFileWriter>(FullPath(WidePath(path, error::kPathAccess)));
}

bool WindowsFileSystem::WriteNew(TextView path, std::string_view bytes) {
  return StagedFile::WriteNew(WidePath(path, error::kPathAccess), bytes);
}

void WindowsFileSystem::Remove(TextView path) {
  const std::wstring widePath = WidePath(path, error::kFileNotFound);
  if (!DeleteFileW(widePath.c_str()))
    throw RuntimeError(NothingThere(GetLastError()) ? error::kFileNotFound : error::kPathAccess);
}

void WindowsFileSystem::RemoveLeftovers(TextView folder) noexcept {
  ResultAsItStood(0,
                  [&](int&) { StagedFile::RemoveLeftovers(WidePath(folder, error::kPathNotFound) + L"\\"); });
}

bool WindowsFileSystem::Exists(TextView pattern, bool folders) {
  if (pattern.empty() || pattern.find(u'\0') != TextView::npos) return false;
  std::wstring widePattern = WideFromText(pattern);
  const DWORD unwanted =
      FILE_ATTRIBUTE_HIDDEN | FILE_ATTRIBUTE_SYSTEM | (folders ? 0 : DWORD{FILE_ATTRIBUTE_DIRECTORY});
  // One name needs no walk through its folder.
  if (widePattern.find_first_of(L"*?<>\"") == std::wstring::npos && widePattern.back() != L'\\' &&
      widePattern.back() != L'/') {
    const DWORD attributes = GetFileAttributesW(widePattern.c_str());
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & unwanted) == 0;
  }
  // A folder written with its separator means what is in it; the system would find nothing.
  if (widePattern.back() == L'\\' || widePattern.back() == L'/') widePattern += L'*';
  WIN32_FIND_DATAW found{};
  const FindOwner search(FindFirstFileW(widePattern.c_str(), &found));
  if (!search) return false;
  do {
    if ((found.dwFileAttributes & unwanted) == 0) return true;
  } while (FindNextFileW(search.Get(), &found));
  return false;
}

void WindowsFileSystem::MakeFolder(TextView path) {
  const std::wstring widePath = WidePath(path, error::kPathAccess);
  if (CreateDirectoryW(widePath.c_str(), nullptr)) return;
  switch (GetLastError()) {
    case ERROR_ALREADY_EXISTS:
    case ERROR_FILE_EXISTS:
      throw RuntimeError(error::kFileAlreadyExists);
    case ERROR_PATH_NOT_FOUND:
      throw RuntimeError(error::kPathNotFound);
    default:
      throw RuntimeError(error::kPathAccess);
  }
}

Text WindowsFileSystem::TempPath() {
  std::array<char, kTempPathRoom> ansi{};
  const DWORD length = GetTempPathA(kTempPathRoom, ansi.data());
  if (length == 0 || length >= kTempPathRoom) return {};
  // Where the code page cannot hold the user's name the ANSI form names no folder at all.
  std::array<wchar_t, kTempPathRoom> wide{};
  const DWORD units = GetTempPathW(kTempPathRoom, wide.data());
  if (units > 0 && units < kTempPathRoom && !AnsiFromText(TextFromWide({wide.data(), units})))
    return TextFromWide({wide.data(), units});
  return TextFromAnsi({ansi.data(), length});
}

}  // namespace tarnwick
