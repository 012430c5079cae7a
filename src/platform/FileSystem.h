// The seam to the local files. Paths are full paths or relative to the process's folder.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

// Attribute bits as the system numbers them. A file without any of them is a normal one.
namespace attribute {
inline constexpr std::uint32_t kReadOnly = 0x01;
inline constexpr std::uint32_t kHidden = 0x02;
inline constexpr std::uint32_t kSystem = 0x04;
inline constexpr std::uint32_t kArchive = 0x20;
inline constexpr std::uint32_t kTemporary = 0x100;
inline constexpr std::uint32_t kOffline = 0x1000;
inline constexpr std::uint32_t kNotIndexed = 0x2000;
}  // namespace attribute

// A file that is read from its start to its end; closed by its destructor.
class FileReader {
 public:
  virtual ~FileReader() = default;

  // Fills `room` as long as there are bytes; how many. Throws 75 on failure.
  virtual std::size_t Read(std::span<char> room) = 0;
};

// A new file that takes its place whole: until Commit what was there stays, and without it nothing is left of
// the new one.
class FileWriter {
 public:
  virtual ~FileWriter() = default;

  // Adds to the end. Throws 75 when not all of the bytes could be written.
  virtual void Write(std::string_view bytes) = 0;

  // Takes the place of the file of that name, unless that is read-only. Throws 75. Last call.
  virtual void Commit() = 0;
};

class FileSystem {
 public:
  virtual ~FileSystem() = default;

  // Length in bytes. Throws run-time error 53 when there is no such file.
  virtual std::uint64_t Length(TextView path) = 0;

  // Time of the last change as text in the user's date and time format. Throws 53 like Length.
  virtual Text ModifiedText(TextView path) = 0;

  // The attribute bits above. Throws 53 like Length.
  virtual std::uint32_t Attributes(TextView path) = 0;

  // Sets the attribute bits; 0 makes the file normal. Throws 75 on failure.
  virtual void SetAttributes(TextView path, std::uint32_t attributes) = 0;

  // Whether both paths name one file that is there, however they are spelled: letter case, short names and
  // links do not count.
  virtual bool SameFile(TextView first, TextView second) = 0;

  // Copies over an existing destination, whole or not at all. Throws 53 or 75.
  virtual void Copy(TextView source, TextView destination) = 0;

  // Throws 53 when there is no such file, 75 when it cannot be read.
  virtual std::unique_ptr<FileReader> Open(TextView path) = 0;

  // Fills `room` with the first bytes of the file, as many as there are; how many. A file that is not there
  // is created empty. Throws 76 when its folder is missing, 75 on other failures, a locked file among them.
  virtual std::size_t ReadBeginning(TextView path, std::span<char> room) = 0;

  // A file that will be at `path`. It is made while the caller goes on: when there cannot be one in that
  // folder, the first call that needs it throws 75. Throws 75 itself for what is no path.
  virtual std::unique_ptr<FileWriter> Create(TextView path) = 0;

  // Writes a file of these bytes where there is none, which takes fewer looks into its folder than Write.
  // Until it is whole nobody can open it, and when that fails, or the process is killed, it goes; killed in
  // the very moment in which it is made, it may stay without a byte. Whether it is there; false as well for a
  // name that is taken.
  virtual bool WriteNew(TextView path, std::string_view bytes) = 0;

  // Writes a file of these bytes over an existing one, whole or not at all. Throws 75.
  void Write(TextView path, std::string_view bytes) {
    const std::unique_ptr<FileWriter> file = Create(path);
    file->Write(bytes);
    file->Commit();
  }

  // Throws 53 when there is no such file, 75 when it cannot be removed.
  virtual void Remove(TextView path) = 0;

  // Removes what writes that were cut off left in the folder. What a running process writes stays, and so
  // does what cannot be removed.
  virtual void RemoveLeftovers(TextView folder) noexcept = 0;

  // Whether a name matches `pattern` (wildcards in the last part): files that are neither hidden nor system
  // files, and with `folders` folders too.
  virtual bool Exists(TextView pattern, bool folders) = 0;

  // Creates one level. Throws 58 when the name is taken, 76 when the parent is missing, 75 otherwise.
  virtual void MakeFolder(TextView path) = 0;

  // The temporary folder with its trailing separator, at most 254 characters; empty on failure.
  virtual Text TempPath() = 0;
};

}  // namespace tarnwick
