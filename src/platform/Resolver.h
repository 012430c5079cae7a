// The seam to the system's look-up of names in the network.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "base/Text.h"

namespace tarnwick {

// An address with its port, in the bytes that the system's sockets take.
using SocketAddress = std::string;

class Resolver {
 public:
  // Takes the addresses in the order in which the system would try them; none when the name is not known.
  using Taker = std::function<void(std::vector<SocketAddress>)>;

  virtual ~Resolver() = default;

  // Begins to look `host` up, and gives up what was looked up before. The addresses are told once, through
  // the messages of this thread and never inside a call.
  virtual void LookUp(TextView host, std::uint16_t port, Taker taker) = 0;
  // Nothing is told any more. Does not wait for the look-up.
  virtual void Cancel() = 0;
};

}  // namespace tarnwick
