// Host, port and path of an address without a scheme, as the requests to the hosting server need them.
#pragma once

#include <cstdint>
#include <optional>

#include "base/Text.h"

namespace tarnwick {

struct HttpAddress {
  Text host;
  std::uint16_t port = 80;
  // From the first "/" on; empty when there is none.
  Text path;
};

// Splits "host[:port][/path]". nullopt when the host is empty or holds a blank, the port is not 1 to 65535,
// or a control character stands anywhere, which could otherwise end a request line.
std::optional<HttpAddress> SplitHttpAddress(TextView address);

// `text` in UTF-8 with %XX (upper-case hex) for each byte outside 0x21 to 0x7E.
std::string EscapeUnprintable(TextView text);

// `text` in UTF-8 with %XX for everything but letters, digits and "-._~".
std::string EscapeFormValue(TextView text);

}  // namespace tarnwick
