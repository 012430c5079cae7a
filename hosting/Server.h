// The hosting server: the service page, the acceptor pages and the pictures, over one port, with TLS or
// without.
#pragma once

#include <httplib.h>

#include <functional>
#include <mutex>
#include <string>
#include <thread>

#include "hosting/Files.h"
#include "hosting/Options.h"
#include "hosting/ServicePage.h"
#include "hosting/Store.h"
#include "hosting/Tls.h"

namespace tarnwick::hosting {

struct Exchange;

class Server : private httplib::Server {
 public:
  // Takes one line, without its end, for each request. Called by any thread, by one at a time.
  using Log = std::function<void(const std::string& line)>;

  // Opens the data folder and seeds it; with --tls-self-signed, makes the certificates. Throws std::exception
  // when that fails.
  Server(hosting::Options options, Log log);
  ~Server() override;

  // Takes the port, to which clients can connect from then on, and returns it. Throws std::runtime_error when
  // it cannot.
  int Listen();

  // Serves, in threads of its own. Listen comes first.
  void Start();

  // Ends every connection and waits for the threads. Harmless when it does not run.
  void Stop();

 private:
  bool process_and_close_socket(socket_t socket) override;
  void Prepare(Exchange& exchange, httplib::Request& request);
  void AnswerGet(Exchange& exchange, httplib::Response& answer);
  void AnswerPost(Exchange& exchange, httplib::Response& answer, const httplib::ContentReader& reader);
  void AnswerService(Exchange& exchange, httplib::Response& answer, const httplib::ContentReader& reader);
  void AnswerAcceptor(Exchange& exchange, httplib::Response& answer, const httplib::ContentReader& reader);

  hosting::Options options_;
  TlsContext tls_;  // none: without TLS
  Store store_;
  ServicePage service_;
  Log log_;
  std::mutex logMutex_;
  FileHandle stopEvent_;
  std::thread thread_;
};

}  // namespace tarnwick::hosting
