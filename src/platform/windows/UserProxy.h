// The proxy for HTTP that the user has set in the system.
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

// Read anew on each call.
UserProxy GetUserProxy();

// The entry for HTTP of a list such as "http=host:port;ftp=host:port", or the one for all schemes; empty when
// there is none.
std::wstring HttpProxyOf(std::wstring_view list);

}  // namespace tarnwick
