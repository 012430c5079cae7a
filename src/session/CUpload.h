#pragma once

#include "base/SharedText.h"

namespace tarnwick {

// One file of the account, as the server lists it. Plain values without rules of their own.
struct CUpload {
  SharedText FileName;
  // The server's text, "M/D/YYYY h:mm:ss AM" as a rule.
  SharedText FileDate;
  // The file's web address.
  SharedText FilePath;
  // Bytes.
  double FileSize = 0;
};

}  // namespace tarnwick
