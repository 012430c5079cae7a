// The copies of the account's files in the user's folder: what was shown, fetched or uploaded. All controls
// of an apartment use the same ones.
//
// Nothing throws: a copy is a convenience, and what cannot be kept is fetched again.
#pragma once

#include <memory>
#include <string_view>

#include "base/Text.h"
#include "platform/FileSystem.h"
#include "session/Apartment.h"
#include "session/CUpload.h"

namespace tarnwick {

class LocalCopies {
 public:
  // `apartment` outlives the object.
  explicit LocalCopies(Apartment& apartment) : apartment_(apartment) {}

  // Where the copy of the file at `url` is or would be; empty when there cannot be one.
  Text PathOf(TextView url) const;

  // Whether there is a copy that can be used: of the length that the listing tells, or, once that was asked
  // for again in vain, of any.
  bool Has(const CUpload& file) const;
  // The file was fetched although there was a copy. Once in each listing is enough.
  void AskedAgain(const CUpload& file);

  // Takes out what came in place of a file, which its length tells.
  void RemoveUnless(const Text& copy, double length);

  // --- An upload, whose copy is written from the bytes that are sent ---

  // The file at `path` begins to be sent.
  void BeginUpload(const Text& path);
  void Write(std::string_view bytes);
  // The file that was sent is the one at `url` now.
  void FinishUpload(const Text& path, const Text& url);
  // The server may have the file at `path`, which began to be sent, but nobody knows.
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
  // Where the copy of the upload will be; empty when there cannot be one.
  Text writerPath_;
};

}  // namespace tarnwick
