// The seam to the system's HTTP client, for the service requests, the acceptor pages and what is fetched over
// TLS.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

inline constexpr std::uint32_t kConnectTimeoutMs = 10'000;
inline constexpr std::uint32_t kSilenceTimeoutMs = 30'000;

// Why there was no answer, where something can be said to it: the system's numbers.
namespace http_error {
inline constexpr std::int32_t kTimeout = 12002;
inline constexpr std::int32_t kNameNotResolved = 12007;
inline constexpr std::int32_t kCannotConnect = 12029;
inline constexpr std::int32_t kConnectionLost = 12030;
inline constexpr std::int32_t kCertificateDate = 12037;  // expired, or not valid yet
inline constexpr std::int32_t kCertificateName = 12038;  // made out for another name
inline constexpr std::int32_t kUnknownAuthority = 12045;
inline constexpr std::int32_t kSecureChannel = 12157;  // whatever else is wrong with the secure connection
}  // namespace http_error

struct HttpPost {
  // Over TLS 1.2 or a later version, to a server whose certificate the system takes.
  bool secure = false;
  Text host;
  std::uint16_t port = 80;
  // Absolute path with its query, printable ASCII only.
  std::string target;
  std::string_view contentType;
  // Used only during the call.
  std::string_view body;
};

// A fetch over TLS, as above.
struct HttpGet {
  Text host;
  std::uint16_t port = 443;
  // Absolute path with its query, printable ASCII only.
  std::string target;
  // Lines of the head, each with CR LF at its end, beside those that the system writes.
  std::string headers;
};

struct HttpAnswer {
  int status = 0;
  std::string body;
};

// The bytes of a long body, one piece after the other.
class BodySource {
 public:
  virtual ~BodySource() = default;

  // Bytes of the whole body.
  virtual std::uint64_t Length() const = 0;

  // The next bytes, which fill `room` as long as there are enough; how many. Throws a run-time error when the
  // source fails or holds fewer bytes than its length.
  virtual std::size_t Read(std::span<char> room) = 0;

  // Told when `sent` bytes have left, first with 0 before the first one. May pump messages.
  virtual void Sent(std::uint64_t sent) = 0;

  // Whether the rest of the body is still to be sent. Asked after each Sent, each Read and each message that
  // was handled, and once more when all but a small last piece has left. From when that piece is handed to
  // the system, the post is carried out, whatever this says.
  virtual bool IsWanted() const = 0;
};

class HttpTransport {
 public:
  virtual ~HttpTransport() = default;

  // The same as Post with the body from `source` (post.body is empty), which is called on the calling thread.
  // Handles messages while it waits, so that windows are painted even when the server is silent. A quit
  // message ends it with nullopt, and so does a source that is not wanted any more: the connection is closed
  // at once, and the server has not got the whole body then. What the source throws ends it too, and is
  // passed on.
  virtual std::optional<HttpAnswer> PostStream(const HttpPost& post, BodySource& source,
                                               std::size_t maxBodyBytes) = 0;

  // Sends the post through the system's proxy settings and collects the whole answer; blocks without pumping
  // messages. Redirects are not followed, nothing is cached. Returns nullopt when the connection fails, stays
  // silent longer than its time-out, ends before the announced length, or the body exceeds `maxBodyBytes`.
  virtual std::optional<HttpAnswer> Post(const HttpPost& post, std::size_t maxBodyBytes) = 0;

  // Takes the next bytes of a body; false ends the exchange. Must not throw.
  using Sink = std::function<bool(std::string_view bytes)>;

  // Hands the whole body of the answer to `sink`, piece by piece; blocks without pumping messages. The
  // status, or nullopt for the same reasons as Post, and when the sink said so.
  virtual std::optional<int> Get(const HttpGet& get, std::uint64_t maxBodyBytes, const Sink& sink) = 0;

  // Why the exchange that ended last had no answer: an http_error, or 0 when it had one or nothing can be
  // said.
  virtual std::int32_t LastFailure() const = 0;
};

}  // namespace tarnwick
