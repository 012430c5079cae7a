#include "hosting/Files.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <system_error>
#include <vector>

namespace tarnwick::hosting {
namespace {

[[noreturn]] void ThrowLastError(const std::filesystem::path& path) {
  throw std::system_error(errno, std::generic_category(), path.string());
}

constexpr std::size_t kBlock = 256 * 1024;

}  // namespace

FileHandle::~FileHandle() {
  if (descriptor_ >= 0) close(descriptor_);
}

TemporaryFile::TemporaryFile(std::filesystem::path path)
    : path_(std::move(path)), file_(open(path_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644)) {
  if (!file_) ThrowLastError(path_);
}

TemporaryFile::~TemporaryFile() {
  if (!path_.empty()) unlink(path_.c_str());
}

void TemporaryFile::Append(std::string_view bytes) {
  waiting_.append(bytes);
  size_ += bytes.size();
  if (waiting_.size() >= kBlock) Flush();
}

void TemporaryFile::Flush() {
  std::string_view bytes = waiting_;
  while (!bytes.empty()) {
    const ssize_t written = write(file_.Get(), bytes.data(), bytes.size());
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) ThrowLastError(path_);
    bytes.remove_prefix(static_cast<std::size_t>(written));
  }
  waiting_.clear();
}

void TemporaryFile::Sync() {
  Flush();
  if (fsync(file_.Get()) != 0) ThrowLastError(path_);
}

bool TemporaryFile::HasBytesOf(const std::filesystem::path& other) const {
  const FileHandle first = OpenRegularFile(path_);
  const FileHandle second = OpenRegularFile(other);
  if (!first || !second || SizeOf(second) != size_) return false;
  std::vector<char> left(kBlock);
  std::vector<char> right(kBlock);
  for (std::uint64_t offset = 0;; offset += kBlock) {
    const std::size_t got = ReadAt(first, left.data(), kBlock, offset);
    if (ReadAt(second, right.data(), kBlock, offset) != got) return false;
    if (std::memcmp(left.data(), right.data(), got) != 0) return false;
    if (got < kBlock) return true;
  }
}

void TemporaryFile::MoveTo(const std::filesystem::path& target) {
  std::filesystem::rename(path_, target);
  path_.clear();
  SyncFolder(target.parent_path());
}

void SyncFolder(const std::filesystem::path& folder) {
  const FileHandle handle(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!handle || fsync(handle.Get()) != 0) ThrowLastError(folder);
}

FileHandle OpenRegularFile(const std::filesystem::path& path) {
  // Without O_NONBLOCK, opening a pipe that someone put there would wait for ever.
  FileHandle file(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
  struct stat facts {};
  if (!file || fstat(file.Get(), &facts) != 0 || !S_ISREG(facts.st_mode)) return {};
  return file;
}

std::uint64_t SizeOf(const FileHandle& file) {
  struct stat facts {};
  if (fstat(file.Get(), &facts) != 0) ThrowLastError("fstat");
  return static_cast<std::uint64_t>(facts.st_size);
}

std::size_t ReadAt(const FileHandle& file, char* buffer, std::size_t size, std::uint64_t offset) {
  std::size_t done = 0;
  while (done < size) {
    const ssize_t got = pread(file.Get(), buffer + done, size - done, static_cast<off_t>(offset + done));
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) ThrowLastError("pread");
    if (got == 0) break;
    done += static_cast<std::size_t>(got);
  }
  return done;
}

}  // namespace tarnwick::hosting
