// The upload component: puts files on the hosting server through its acceptor pages, deletes and renames them
// there.
#pragma once

#include "platform/Platform.h"
#include "transfer/Transfers.h"

namespace tarnwick {

class UploadObject : public Uploader {
 public:
  explicit UploadObject(const Platform& platform) : platform_(platform) {}

  // Streams the file, whatever its size up to 4 GiB, and pumps messages meanwhile. Throws 53 when there is no
  // such file, 75 when it cannot be read or changes its length meanwhile, 18 when it was not wanted any more
  // before its last byte had left, the page's error number, or acceptor::kUnspecified when there is no usable
  // answer.
  void UploadFile(TextView localPath, TextView usersBaseUrl, TextView acceptorPath, std::int32_t flag,
                  TextView user, TextView password, TextView productGuid, UploadEvents& events) override;

  // Block without pumping. Throw the page's error number.
  void DeleteFile(TextView usersBaseUrl, TextView name, TextView acceptorPath, TextView user,
                  TextView password, TextView productGuid) override;
  void RenameFile(TextView usersBaseUrl, TextView oldName, TextView newName, TextView acceptorPath,
                  TextView user, TextView password, TextView productGuid) override;

 private:
  const Platform platform_;
};

}  // namespace tarnwick
