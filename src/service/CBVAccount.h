#pragma once

#include <cstdint>

#include "base/Text.h"

namespace tarnwick {

// The details of one account, as the service tells them.
struct CBVAccount {
  Text ServiceLevelName;
  // Days.
  std::int32_t ExpiryPeriod = 0;
  Text CurrentDate;
  Text StartDate;
  // Bytes, as the server's text.
  Text UsedQuota;
  Text Quota;
  Text EmailAddress;
};

}  // namespace tarnwick
