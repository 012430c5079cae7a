// Files whose changes outlive a kill: whole or absent, and on the disk before anyone is told of them.
// Every function throws std::system_error on failure unless it says otherwise.
#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <string_view>
#include <utility>

namespace tarnwick::hosting {

// Owner of a file descriptor; -1 is none.
class FileHandle {
 public:
  FileHandle() = default;
  explicit FileHandle(int descriptor) : descriptor_(descriptor) {}
  FileHandle(FileHandle&& other) noexcept : descriptor_(std::exchange(other.descriptor_, -1)) {}
  FileHandle& operator=(FileHandle&& other) noexcept {
    std::swap(descriptor_, other.descriptor_);
    return *this;
  }
  ~FileHandle();

  int Get() const { return descriptor_; }
  explicit operator bool() const { return descriptor_ >= 0; }

 private:
  int descriptor_ = -1;
};

// A file of its own for bytes that arrive; removed again with the object unless it was moved to its place.
class TemporaryFile {
 public:
  explicit TemporaryFile(std::filesystem::path path);
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;
  ~TemporaryFile();

  // Collects small pieces: an upload arrives in many of them, and each write is a call of the system.
  void Append(std::string_view bytes);
  std::uint64_t Size() const { return size_; }

  // Puts the bytes on the disk.
  void Sync();

  // Whether the file `other` holds the same bytes. Sync comes first.
  bool HasBytesOf(const std::filesystem::path& other) const;

  // Takes the place of `target`, whatever was there, durably. Sync comes first.
  void MoveTo(const std::filesystem::path& target);

 private:
  void Flush();

  std::filesystem::path path_;
  FileHandle file_;
  std::string waiting_;
  std::uint64_t size_ = 0;
};

// Puts the entries of a folder on the disk: what was created, renamed or removed in it.
void SyncFolder(const std::filesystem::path& folder);

// Opens a regular file for reading; follows no link and never throws. None when there is no such file.
FileHandle OpenRegularFile(const std::filesystem::path& path);

std::uint64_t SizeOf(const FileHandle& file);

// Reads up to `size` bytes from `offset` on; fewer only at the end of the file.
std::size_t ReadAt(const FileHandle& file, char* buffer, std::size_t size, std::uint64_t offset);

}  // namespace tarnwick::hosting
