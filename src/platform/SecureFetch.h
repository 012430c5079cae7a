// The seam to a fetch over TLS that tells what happens to it through the thread's messages, and hands over
// the answer as a socket would: the status line, the lines of the head, an empty one, then the bytes of the
// body, without the marks of chunks.
#pragma once

#include "platform/HttpTransport.h"
#include "platform/StreamSocket.h"

namespace tarnwick {

class SecureFetch : public ByteStream {
 public:
  // Begins to fetch; closes what was open. Failures are told as events: an http_error. One of them is an
  // answer that is not known to be whole, because it ended before its announced length or chunk, or announced
  // neither.
  virtual void Begin(const HttpGet& get) = 0;
};

}  // namespace tarnwick
