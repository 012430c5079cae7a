#include "hosting/Tls.h"

#include <arpa/inet.h>
#include <openssl/err.h>
#include <openssl/evp.h>
#include <openssl/pem.h>
#include <openssl/rand.h>
#include <openssl/x509v3.h>

#include <cstdint>
#include <cstring>
#include <stdexcept>

namespace tarnwick::hosting {
namespace {

using Certificate = std::unique_ptr<X509, FreeWith<X509_free>>;
using Key = std::unique_ptr<EVP_PKEY, FreeWith<EVP_PKEY_free>>;

// Clocks differ, and a certificate that is not valid yet is refused like an expired one.
constexpr long kBeforeSeconds = 3600;
constexpr long kSeconds = 3L * 24 * 3600;

// Throws with OpenSSL's own reason, which names neither keys nor passwords.
void Check(bool isDone, const std::string& what) {
  if (isDone) return;
  const unsigned long error = ERR_get_error();
  const char* const reason =
      ERR_SYSTEM_ERROR(error) ? std::strerror(ERR_GET_REASON(error)) : ERR_reason_error_string(error);
  throw std::runtime_error(reason ? what + ": " + reason : what);
}

TlsContext NewContext() {
  ERR_clear_error();
  TlsContext context(SSL_CTX_new(TLS_server_method()));
  Check(context && SSL_CTX_set_min_proto_version(context.get(), TLS1_2_VERSION) == 1, "cannot set up TLS");
  SSL_CTX_set_options(context.get(), SSL_OP_NO_RENEGOTIATION);
  // A connection that waits keeps no buffers.
  SSL_CTX_set_mode(context.get(), SSL_MODE_RELEASE_BUFFERS);
  return context;
}

Key NewKey() {
  return Key(EVP_EC_gen("P-256"));
}

void AddExtension(X509* certificate, X509* issuer, int kind, const std::string& value) {
  X509V3_CTX context;
  X509V3_set_ctx(&context, issuer, certificate, nullptr, nullptr, 0);
  const std::unique_ptr<X509_EXTENSION, FreeWith<X509_EXTENSION_free>> extension(
      X509V3_EXT_conf_nid(nullptr, &context, kind, value.c_str()));
  Check(extension && X509_add_ext(certificate, extension.get(), -1) == 1,
        "cannot make a certificate with " + value);
}

// Without extensions and signature. The number makes the name one of its own: clients find an authority by
// name, and may still know that of an earlier start.
Certificate NewCertificate(const char* title, EVP_PKEY* key) {
  constexpr long kVersion3 = 2;
  Certificate certificate(X509_new());
  std::uint32_t number = 0;
  Check(certificate && key && RAND_bytes(reinterpret_cast<unsigned char*>(&number), sizeof number) == 1,
        "cannot make a key");
  const std::string name = title + std::to_string(number);
  X509* const made = certificate.get();
  Check(
      X509_set_version(made, kVersion3) == 1 &&
          ASN1_INTEGER_set_uint64(X509_get_serialNumber(made), number) == 1 &&
          X509_gmtime_adj(X509_getm_notBefore(made), -kBeforeSeconds) &&
          X509_gmtime_adj(X509_getm_notAfter(made), kSeconds) &&
          X509_NAME_add_entry_by_txt(X509_get_subject_name(made), "CN", MBSTRING_UTF8,
                                     reinterpret_cast<const unsigned char*>(name.c_str()), -1, -1, 0) == 1 &&
          X509_set_pubkey(made, key) == 1,
      "cannot make a certificate");
  return certificate;
}

void Sign(X509* certificate, X509* issuer, EVP_PKEY* key) {
  Check(X509_set_issuer_name(certificate, X509_get_subject_name(issuer)) == 1 &&
            X509_sign(certificate, key, EVP_sha256()) > 0,
        "cannot sign a certificate");
}

// An address stands among the names too, where some clients look for it alone, as they write it.
std::string AlternativeNames(const std::string& host) {
  unsigned char address[sizeof(in6_addr)];
  std::string names = ",DNS:" + host;
  if (inet_pton(AF_INET, host.c_str(), address) == 1)
    names += ",IP:" + host;
  else if (inet_pton(AF_INET6, host.c_str(), address) == 1)
    names += ",DNS:[" + host + "],IP:" + host;
  return names;
}

}  // namespace

TlsContext ContextFromFiles(const std::filesystem::path& certificate, const std::filesystem::path& key) {
  TlsContext context = NewContext();
  Check(SSL_CTX_use_certificate_chain_file(context.get(), certificate.c_str()) == 1,
        "cannot use the certificate " + certificate.string());
  // Without this OpenSSL would ask on the terminal for the password of an encrypted key.
  SSL_CTX_set_default_passwd_cb(context.get(), [](char*, int, int, void*) { return -1; });
  Check(SSL_CTX_use_PrivateKey_file(context.get(), key.c_str(), SSL_FILETYPE_PEM) == 1,
        "cannot use the key " + key.string());
  return context;
}

TlsContext ContextOfOwnAuthority(const std::string& host, const std::filesystem::path& authority) {
  TlsContext context = NewContext();
  const Key rootKey = NewKey();
  const Certificate root = NewCertificate("Tarnwick test authority ", rootKey.get());
  AddExtension(root.get(), root.get(), NID_basic_constraints, "critical,CA:TRUE,pathlen:0");
  AddExtension(root.get(), root.get(), NID_key_usage, "critical,keyCertSign");
  AddExtension(root.get(), root.get(), NID_subject_key_identifier, "hash");
  Sign(root.get(), root.get(), rootKey.get());

  const Key key = NewKey();
  const Certificate own = NewCertificate("Tarnwick hosting server ", key.get());
  AddExtension(own.get(), root.get(), NID_basic_constraints, "critical,CA:FALSE");
  AddExtension(own.get(), root.get(), NID_key_usage, "critical,digitalSignature");
  AddExtension(own.get(), root.get(), NID_ext_key_usage, "serverAuth");
  AddExtension(own.get(), root.get(), NID_authority_key_identifier, "keyid:always");
  std::string names = "DNS:localhost";
  for (const std::string& name : {host, std::string("127.0.0.1"), std::string("::1")})
    names += AlternativeNames(name);
  AddExtension(own.get(), root.get(), NID_subject_alt_name, names);
  Sign(own.get(), root.get(), rootKey.get());
  Check(SSL_CTX_use_certificate(context.get(), own.get()) == 1 &&
            SSL_CTX_use_PrivateKey(context.get(), key.get()) == 1,
        "cannot use the certificate");

  const std::unique_ptr<BIO, FreeWith<BIO_free>> file(BIO_new_file(authority.c_str(), "w"));
  Check(file && PEM_write_bio_X509(file.get(), root.get()) == 1 && BIO_flush(file.get()) == 1,
        "cannot write " + authority.string());
  return context;
}

}  // namespace tarnwick::hosting
