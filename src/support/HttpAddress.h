// Server names and addresses: scheme, host, port and path, as the requests to the hosting server need them.
#pragma once

#include <cstdint>
#include <optional>

#include "base/Text.h"

namespace tarnwick {

struct HttpAddress {
  // Over TLS.
  bool secure = false;
  // An IPv6 literal has its brackets.
  Text host;
  std::uint16_t port = 80;
  // From the first "/" on; empty when there is none.
  Text path;
};

// Splits "host[:port][/path]". nullopt when the host is none (it is empty, holds a blank or a user, or is a
// literal without its bracket), the port is not 1 to 65535, or a control character stands anywhere, which
// could otherwise end a request line.
std::optional<HttpAddress> SplitHttpAddress(TextView address);

// The same for an address that may begin with "http://" or "https://", whose port is 443 when it has none.
std::optional<HttpAddress> SplitUrl(TextView url);

// Whether the address, or the server name, begins with "https://" in any letter case.
bool IsSecureUrl(TextView url);

// "http://NAME" for a server name "host[:port]"; the name itself, with its scheme in small letters, for one
// that begins with "https://". Empty for what cannot be a server's name, such as one with another scheme; but
// "http://" alone for no name at all.
Text ServerUrl(TextView serverName);

// `text` in UTF-8 with %XX (upper-case hex) for each byte outside 0x21 to 0x7E.
std::string EscapeUnprintable(TextView text);

// `text` in UTF-8 with %XX for everything but letters, digits and "-._~".
std::string EscapeFormValue(TextView text);

}  // namespace tarnwick
