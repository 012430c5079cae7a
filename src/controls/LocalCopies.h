// The copies of the account's files in the user's folder: what was shown, fetched or uploaded. All controls
// of an apartment use the same ones.
//
// Nothing throws: a copy is a convenience, and what cannot be kept is fetched again.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "platform/FileSystem.h"
#include "service/CUpload.h"
#include "support/Apartment.h"
#include "support/Text.h"

namespace tarnwick {

class LocalCopies {
 public:
  // `apartment` outlives the object.
  explicit LocalCopies(Apartment& apartment) : apartment_(apartment) {}

  // Where the copy of the file at `url` is or would be; empty when there cannot be one.
  Text PathOf(TextView url) const;

  // Whether the file is to be fetched: there is no copy, or one of another length than the listing tells, for
  // which this is true once in each listing.
  bool IsDue(const CUpload& file);

  // Takes out what came in place of a file, which its length tells.
  void RemoveUnless(const Text& copy, double length);

  // --- An upload, whose copy is written from the bytes that are sent ---

  // The file at `path` begins to be sent.
  void BeginUpload(const Text& path);
  void Write(std::string_view bytes);
  // The file that was sent is the one at `url` now.
  void FinishUpload(const Text& path, const Text& url);
  // The server may have the file at `path`, but nobody knows.
  void LoseUpload(const Text& path);
  // The server has not got it.
  void AbandonUpload() { writer_.reset(); }

  // --- Other changes in the account ---

  void Move(const Text& fromUrl, const Text& toUrl);
  void Remove(TextView url);

 private:
  void RemoveFile(const Text& path);

  Apartment& apartment_;
  // Null when no copy is written.
  std::unique_ptr<FileWriter> writer_;
  // Where it will be.
  Text writerPath_;
};

}  // namespace tarnwick
