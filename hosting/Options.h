// What the server is started with.
#pragma once

#include <cstdint>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <vector>

#include "hosting/Faults.h"

namespace tarnwick::hosting {

struct Options {
  std::string host = "127.0.0.1";  // without the brackets of an IPv6 address
  int port = 0;                    // 0: any free one
  std::filesystem::path data;

  std::filesystem::path tlsCertificate;  // with its key; empty: none
  std::filesystem::path tlsKey;
  bool tlsSelfSigned = false;

  std::string seedUser;  // empty: none
  std::string seedPassword;
  std::int64_t seedProduct = 0;
  std::filesystem::path seedPictures;  // empty: none

  std::int64_t softLimit = 900;                    // of accounts; only told
  std::int64_t hardLimit = 1000;                   // of accounts
  std::uint64_t quota = std::uint64_t{100} << 20;  // of each account, in bytes
  std::int64_t expireDays = 365;
  std::vector<Fault> faults;

  bool HasTls() const { return tlsSelfSigned || !tlsCertificate.empty(); }
  // What the server writes its own authority's certificate to.
  std::filesystem::path Authority() const { return data / "authority.pem"; }

  std::string help;  // what --help asked for; empty: nothing did
};

class OptionError : public std::runtime_error {
  using std::runtime_error::runtime_error;
};

// The server as clients name it: HOST:PORT, over TLS https://HOST:PORT.
std::string ServerName(const Options& options, int port);

// Reads the arguments after the program's name. Throws OptionError with a sentence for the user.
Options ParseOptions(std::vector<std::string> arguments);

}  // namespace tarnwick::hosting
