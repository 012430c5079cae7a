// The proxy for HTTP, plain or over TLS, that the user has set in the system.
#pragma once

#include <string>
#include <string_view>

namespace tarnwick {

struct UserProxy {
  // "host:port"; empty when none is set.
  std::wstring server;
  // Hosts that are reached without it, separated by semicolons.
  std::wstring bypass;
};

// The one for a scheme, "http" or "https". Read anew on each call.
UserProxy GetUserProxy(std::wstring_view scheme);

// The scheme's entry of a list such as "http=host:port;ftp=host:port", or the one for all schemes; empty when
// there is none.
std::wstring ProxyOf(std::wstring_view list, std::wstring_view scheme);

}  // namespace tarnwick
