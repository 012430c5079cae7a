#pragma once

#include "base/Text.h"

namespace tarnwick {

// One file of the account, as the server lists it. Plain values without rules of their own.
struct CUpload {
  Text FileName;
  // The server's text, "M/D/YYYY h:mm:ss AM" as a rule.
  Text FileDate;
  // The file's web address.
  Text FilePath;
  // Bytes.
  double FileSize = 0;
};

}  // namespace tarnwick
