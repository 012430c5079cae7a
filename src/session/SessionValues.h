// Who is connected to what.
#pragma once

#include <cstdint>

#include "base/Secret.h"
#include "base/Text.h"
#include "support/HttpAddress.h"

namespace tarnwick {

// One user's account at one server. What began for one account must not go on in another. The product number
// does not count: a refused log-on changes it, and the user stays the same.
struct AccountKey {
  Text serverName;
  Text userName;
  bool operator==(const AccountKey&) const = default;
};

// Who is connected to what; set by `ConnectToServer` and `LogonAs`.
struct SessionValues {
  // "host" or "host:port", or the same behind "https://".
  Text serverName;
  Text userName;
  Secret password;
  std::int32_t productNumber = 0;
  Text mguid;
  // Set by a log-on in clear text; cleared once its FTP values were rewritten for the proxy.
  bool loggedOn = false;

  // Whether everything goes over TLS.
  bool IsSecure() const { return IsSecureUrl(serverName); }
  // A password that was given for TLS does not go on in clear text.
  void SetServer(TextView name) {
    const bool wasSecure = IsSecure();
    serverName = name;
    if (wasSecure && !IsSecure()) password = {};
  }
  AccountKey Account() const { return {serverName, userName}; }
};

}  // namespace tarnwick
