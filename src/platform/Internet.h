// The seam to the system's Internet functions, for the FTP session.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>

#include "base/Text.h"

namespace tarnwick {

// An open FTP connection; closed by its destructor.
class FtpConnection {
 public:
  virtual ~FtpConnection() = default;

  virtual bool SetDirectory(TextView path) = 0;

  // nullopt when the server does not say, or says more than 254 bytes.
  virtual std::optional<Text> Directory() = 0;

  // Fetches `serverFile` (binary) into `localFile`, replacing a file of that name. On failure it returns
  // false and leaves what was there.
  virtual bool GetFile(TextView serverFile, TextView localFile) = 0;

  // Sends the command; no reply with data is expected.
  virtual bool Command(TextView command) = 0;
};

// An initialised use of the Internet functions; outlives the connections that it opens.
class InternetSession {
 public:
  virtual ~InternetSession() = default;

  // Null when there is no connection. Port 0 means the protocol's own.
  virtual std::unique_ptr<FtpConnection> ConnectFtp(TextView host, std::uint16_t port, TextView userName,
                                                    TextView password) = 0;
};

class Internet {
 public:
  virtual ~Internet() = default;

  // Direct access without a proxy of the system's; null on failure.
  virtual std::unique_ptr<InternetSession> Open(TextView agent) = 0;
};

}  // namespace tarnwick
