#pragma once

#include "platform/Internet.h"

namespace tarnwick {

// FTP through the system's Internet functions.
class WindowsInternet : public Internet {
 public:
  std::unique_ptr<InternetSession> Open(TextView agent) override;
};

}  // namespace tarnwick
