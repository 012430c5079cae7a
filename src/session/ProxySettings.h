// The current user's proxy settings of the system, in the two readings that the library makes of them.
#pragma once

#include <optional>

#include "base/Text.h"
#include "platform/Registry.h"

namespace tarnwick {

struct Apartment;

// Reads the browser's proxy for picture downloads into the apartment's proxy values and returns ProxyHost,
// empty when none is enabled. A list of proxies by protocol is not picked apart. Throws run-time error 9 when
// the setting has no port (ProxyPort keeps what it held), 5 when a value cannot be read (both keep what they
// held).
Text GetProxySettings(Apartment& apartment);

// The proxy that the FTP session uses: the entry "ftp" of a list by protocol, else the whole setting.
struct FtpProxy {
  Text host;
  Text port;
};

// nullopt when no proxy is enabled or the settings cannot be read.
std::optional<FtpProxy> ReadFtpProxy(Registry& registry);

}  // namespace tarnwick
