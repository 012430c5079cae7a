// The seam to the system's HTTP client, for the service requests and the acceptor pages.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "support/Text.h"

namespace tarnwick {

inline constexpr std::uint32_t kConnectTimeoutMs = 10'000;
inline constexpr std::uint32_t kSilenceTimeoutMs = 30'000;

struct HttpPost {
  Text host;
  std::uint16_t port = 80;
  // Absolute path with its query, printable ASCII only.
  std::string target;
  std::string_view contentType;
  // Used only during the call.
  std::string_view body;
};

struct HttpAnswer {
  int status = 0;
  std::string body;
};

class HttpTransport {
 public:
  virtual ~HttpTransport() = default;

  // Sends the post through the system's proxy settings and collects the whole answer; blocks without pumping
  // messages. Redirects are not followed, nothing is cached. Returns nullopt when the connection fails, stays
  // silent longer than its time-out, ends before the announced length, or the body exceeds `maxBodyBytes`.
  virtual std::optional<HttpAnswer> Post(const HttpPost& post, std::size_t maxBodyBytes) = 0;
};

}  // namespace tarnwick
