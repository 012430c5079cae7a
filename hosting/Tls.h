// TLS for the server's connections: its certificate, from files or made for this start.
#pragma once

#include <openssl/ssl.h>

#include <filesystem>
#include <memory>
#include <string>

namespace tarnwick::hosting {

template <auto Free>
struct FreeWith {
  template <typename Object>
  void operator()(Object* object) const {
    Free(object);
  }
};
using TlsContext = std::unique_ptr<SSL_CTX, FreeWith<SSL_CTX_free>>;
using TlsSession = std::unique_ptr<SSL, FreeWith<SSL_free>>;

// A certificate, with those between it and its authority after it, and its key, both PEM. Throws
// std::runtime_error when they cannot be read or do not belong together.
TlsContext ContextFromFiles(const std::filesystem::path& certificate, const std::filesystem::path& key);

// A new certificate for this machine's loopback addresses and for `host`, signed by a new authority, whose
// own certificate is written to `authority`. Both hold for three days; no key is ever written. Throws
// std::runtime_error when that fails.
TlsContext ContextOfOwnAuthority(const std::string& host, const std::filesystem::path& authority);

}  // namespace tarnwick::hosting
