#include "controls/LocalCopies.h"

#include <utility>

#include "base/RuntimeError.h"
#include "controls/FileNames.h"
#include "support/PathHelpers.h"
#include "transfer/FileNameGuard.h"

namespace tarnwick {

Text LocalCopies::PathOf(TextView url) const {
  // The name comes from the server; it must not lead out of the folder.
  const TextView name = FileNameFromUrl(url);
  if (apartment_.UserFolderPath.empty() || !IsSafeFileName(name)) return {};
  return apartment_.UserFolderPath + u"\\" + Text(name);
}

bool LocalCopies::Has(const CUpload& file) const {
  return ResultAsItStood(false, [&](bool& has) {
    const Text copy = PathOf(Text(file.FilePath));
    FileSystem& files = apartment_.platform.files;
    if (copy.empty() || !FileExists(files, copy)) return;
    // A size of 2 GiB and more is negative after an upload.
    has = file.FileSize < 0 || static_cast<double>(files.Length(copy)) == file.FileSize ||
          apartment_.listing.copiesAskedAgain.contains(file.FilePath);
  });
}

void LocalCopies::AskedAgain(const CUpload& file) {
  ResultAsItStood(0, [&](int&) { apartment_.listing.copiesAskedAgain.insert(file.FilePath); });
}

void LocalCopies::RemoveUnless(const Text& copy, double length) {
  ResultAsItStood(0, [&](int&) {
    FileSystem& files = apartment_.platform.files;
    if (static_cast<double>(files.Length(copy)) != length) files.Remove(copy);
  });
}

void LocalCopies::RemoveFile(const Text& path) {
  ResultAsItStood(0, [&](int&) { apartment_.platform.files.Remove(path); });
}

// --- Uploads ---

void LocalCopies::BeginUpload(const Text& path) {
  writer_ = ResultAsItStood(std::unique_ptr<FileWriter>(), [&](std::unique_ptr<FileWriter>& writer) {
    FileSystem& files = apartment_.platform.files;
    writerPath_ = PathOf(FileNameFromPath(path));
    if (!writerPath_.empty() && !files.SameFile(writerPath_, path)) writer = files.Create(writerPath_);
  });
}

void LocalCopies::Write(std::string_view bytes) {
  if (!writer_) return;
  // A full disk here is no reason to lose the upload.
  const bool written = ResultAsItStood(false, [&](bool& done) {
    writer_->Write(bytes);
    done = true;
  });
  if (!written) writer_.reset();
}

void LocalCopies::FinishUpload(const Text& path, const Text& url) {
  const std::unique_ptr<FileWriter> writer = std::move(writer_);
  ResultAsItStood(0, [&](int&) {
    const Text copy = PathOf(url);
    if (copy.empty()) return;
    apartment_.CopyChanged(copy);
    FileSystem& files = apartment_.platform.files;
    // Also under another spelling of its name: what the user sent is never removed.
    if (files.SameFile(copy, path)) return;
    const bool finished = writer && copy == writerPath_ && ResultAsItStood(false, [&](bool& done) {
                            // Some file systems write a file out before it may replace another, which takes
                            // as long as the upload.
                            RemoveFile(copy);
                            writer->Commit();
                            done = true;
                          });
    const bool copied = finished || ResultAsItStood(false, [&](bool& done) {
                          files.Copy(path, copy);
                          done = true;
                        });
    // The copy of the picture that was there before must not be shown for the new one.
    if (!copied) RemoveFile(copy);
  });
}

void LocalCopies::LoseUpload(const Text& path) {
  writer_.reset();
  ResultAsItStood(0, [&](int&) {
    // As it was at the beginning: another user may be logged on by now.
    if (writerPath_.empty()) return;
    apartment_.CopyChanged(writerPath_);
    if (!apartment_.platform.files.SameFile(writerPath_, path)) RemoveFile(writerPath_);
  });
}

// --- Renames and deletes ---

void LocalCopies::Move(const Text& fromUrl, const Text& toUrl) {
  ResultAsItStood(0, [&](int&) {
    const Text from = PathOf(fromUrl);
    const Text to = PathOf(toUrl);
    apartment_.CopyChanged(from);
    apartment_.CopyChanged(to);
    // The file system takes both for one.
    if (EqualsIgnoringCase(from, to)) return;
    FileSystem& files = apartment_.platform.files;
    // What is there under the new name is another picture's.
    if (from.empty() || !FileExists(files, from)) {
      if (!to.empty()) RemoveFile(to);
      return;
    }
    if (!to.empty()) CopyLocalFile(files, from, to);
    RemoveFile(from);
  });
}

void LocalCopies::Remove(TextView url) {
  ResultAsItStood(0, [&](int&) {
    const Text copy = PathOf(url);
    if (copy.empty()) return;
    apartment_.CopyChanged(copy);
    RemoveFile(copy);
  });
}

}  // namespace tarnwick
