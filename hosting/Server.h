// The hosting server: the service page, the acceptor pages and the pictures, over one port.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "hosting/Options.h"
#include "hosting/Store.h"

namespace tarnwick::hosting {

class Server {
 public:
  // Takes one line, without its end, for each request. Called by any thread, by one at a time.
  using Log = std::function<void(const std::string& line)>;

  // Opens the data folder and seeds it. Throws std::exception when that fails.
  Server(Options options, Log log);
  ~Server();

  // Takes the port, to which clients can connect from then on, and returns it. Throws std::runtime_error when
  // it cannot.
  int Listen();

  // Serves, in threads of its own. Listen comes first.
  void Start();

  // Ends every connection and waits for the threads. Harmless when it does not run.
  void Stop();

 private:
  class Http;

  Options options_;
  Store store_;
  std::unique_ptr<Http> http_;
};

}  // namespace tarnwick::hosting
