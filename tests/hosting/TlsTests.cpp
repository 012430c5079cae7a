// The server over TLS: who can talk to it, and how its faults look there.
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <openssl/x509v3.h>
#include <sys/socket.h>

#include <cerrno>
#include <chrono>
#include <cstdlib>

#include "HostingFixture.h"
#include "hosting/Tls.h"

namespace tarnwick::hosting {
namespace {

// What a client of TLS sees: the bytes, and how they end.
struct TlsAnswer {
  std::string bytes;
  std::string end;  // handshake: there was none; notify: as TLS wants it; cut, reset; silence
};

class TlsTest : public HostingTest {
 protected:
  void SetUp() override { BeginWithFaults({}, true); }

  // Speaks no version above the one given; 0 is the newest.
  TlsAnswer Exchange(std::string_view request, int version = 0) {
    const TlsContext context(SSL_CTX_new(TLS_client_method()));
    SSL_CTX_set_cipher_list(context.get(), "ALL:@SECLEVEL=0");
    SSL_CTX_set_min_proto_version(context.get(), TLS1_VERSION);
    SSL_CTX_set_max_proto_version(context.get(), version);
    const FileHandle socket = Connected(Port(), 500);
    const TlsSession session(SSL_new(context.get()));
    SSL_set_fd(session.get(), socket.Get());
    if (SSL_connect(session.get()) != 1) return {"", "handshake"};
    SSL_write(session.get(), request.data(), static_cast<int>(request.size()));
    TlsAnswer answer;
    char block[4096];
    int got = 0;
    ERR_clear_error();
    while ((got = SSL_read(session.get(), block, sizeof block)) > 0)
      answer.bytes.append(block, static_cast<std::size_t>(got));
    switch (SSL_get_error(session.get(), got)) {
      case SSL_ERROR_ZERO_RETURN:
        answer.end = "notify";
        break;
      case SSL_ERROR_WANT_READ:
        answer.end = "silence";
        break;
      case SSL_ERROR_SYSCALL:
        answer.end = errno == ECONNRESET ? "reset" : "lost";
        break;
      default:
        answer.end = ERR_GET_REASON(ERR_peek_error()) == SSL_R_UNEXPECTED_EOF_WHILE_READING ? "cut" : "error";
    }
    return answer;
  }
};

TEST_F(TlsTest, AnAccountIsKeptOverTlsByClientsThatTrustItsAuthority) {
  // More than sockets hold, so that both sides wait in the middle of a record.
  const std::string large(5'000'011, 'x');
  ASSERT_EQ(Client().Upload("large.jpg", large), kStored);
  const std::string url = Client().AskFor("FileURL", "ListFiles", {{"Username", kUser}, {"ProductID", "1"}});
  const std::string server = "https://127.0.0.1:" + std::to_string(Port());
  EXPECT_EQ(url, server + "/users/" + kFolder + "/large.jpg");
  const auto picture = Client().Http().Get(url.substr(server.size()));
  ASSERT_TRUE(picture);
  EXPECT_TRUE(picture->body == large);
  // The server sees the password in clear, and once without what the cipher drops.
  const std::string validate = Client().AskFor(
      "UserAuthenticationStatus", "UserValidate",
      {{"UserName", Enciphered(kUser)}, {"Password", Enciphered(kPassword)}, {"ProductID", "1"}});
  EXPECT_EQ(validate, "TRUE");

  EXPECT_FALSE(httplib::Client(server).Get("/"));
  EXPECT_EQ(RawExchange(Port(), "GET / HTTP/1.1\r\n\r\n").Status(), 0);
  for (const auto& [version, end] :
       {std::pair(TLS1_1_VERSION, "handshake"), std::pair(TLS1_2_VERSION, "notify")})
    EXPECT_EQ(Exchange("GET / HTTP/1.1\r\n\r\n", version).end, end) << version;
  // Nor does a handshake that does not go on hold up the end.
  const FileHandle silent = Connected(Port());
  send(silent.Get(), "\x16\x03\x01", 3, MSG_NOSIGNAL);
  const auto start = std::chrono::steady_clock::now();
  End();
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
  const std::string log = LogText();
  EXPECT_NE(log.find(" UserValidate user="), std::string::npos) << log;
  for (const std::string& secret : {std::string("pa55"), Enciphered(kPassword)})
    EXPECT_EQ(log.find(secret), std::string::npos) << log;
}

TEST_F(TlsTest, FaultsEndTheConnectionAsTheyDoWithoutTls) {
  const std::string target = std::string("/users/") + kFolder + "/a.jpg";
  const std::string request = "GET " + target + " HTTP/1.1\r\nHost: x\r\n\r\n";
  const struct {
    const char* fault;
    const char* end;
    const char* body;
  } rows[] = {
      {"SoftLimit=refuse", "notify", "0123456789"},
      {"*=refuse", "notify", "(no body)"},
      {"*=reset:request", "reset", "(no body)"},
      {"*=reset:body", "reset", "01234"},
      {"*=cut", "cut", "01234"},
      {"*=length:999999", "notify", "0123456789"},
      {"*=drip:1", "notify", "0123456789"},
      {"*=late-close:50", "notify", "0123456789"},
      {"*=stall", "silence", "(no body)"},
      {"*=stall:handshake", "handshake", "(no body)"},
  };
  ASSERT_EQ(Client().Upload("a.jpg", "0123456789"), kStored);
  for (const auto& [fault, end, body] : rows) {
    BeginWithFaults({fault}, true);
    const TlsAnswer answer = Exchange(request);
    EXPECT_EQ(answer.end, end) << fault;
    EXPECT_EQ(RawAnswer{answer.bytes}.Body(), body) << fault;
  }
}

TEST_F(TlsTest, CertificatesComeFromFilesAndHoldForTheAddressOfTheServer) {
  const std::string folder = Data().parent_path();
  const std::string certificate = folder + "/certificate.pem";
  const std::string key = folder + "/key.pem";
  const std::string make =
      "cd '" + folder +
      "' && openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -subj /CN=x "
      "-addext subjectAltName=IP:127.0.0.1 -keyout key.pem -out certificate.pem -days 1 && "
      "openssl ec -in key.pem -out encrypted.pem -aes256 -passout pass:Linden42";
  ASSERT_EQ(std::system(("(" + make + ") 2>/dev/null").c_str()), 0);
  const auto begin = [&](const std::string& itsCertificate, const std::string& itsKey) {
    Begin([&](Options& options) {
      options.tlsCertificate = itsCertificate;
      options.tlsKey = itsKey;
    });
  };
  begin(certificate, key);
  EXPECT_EQ(HostingClient(Port(), certificate).AskFor("HardLimit", "HardLimit", {{"ProductID", "1"}}),
            "1000");
  const std::string other = Authority();
  for (const auto& [itsCertificate, itsKey] :
       {std::pair(folder + "/none.pem", key), std::pair(certificate, folder + "/none.pem"),
        std::pair(key, key), std::pair(certificate, certificate), std::pair(other, key),
        std::pair(certificate, folder + "/encrypted.pem")})
    EXPECT_THROW(begin(itsCertificate, itsKey), std::runtime_error) << itsCertificate << " " << itsKey;

  Begin([](Options& options) {
    options.tlsSelfSigned = true;
    options.host = "::1";
  });
  // The client of cpp-httplib 0.11 reads past the end of an IPv4 address that stands beside an IPv6 one.
  const TlsContext context(SSL_CTX_new(TLS_client_method()));
  SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER, nullptr);
  SSL_CTX_load_verify_locations(context.get(), Authority().c_str(), nullptr);
  X509_VERIFY_PARAM_set1_ip_asc(SSL_CTX_get0_param(context.get()), "::1");
  const std::unique_ptr<BIO, FreeWith<BIO_free_all>> client(BIO_new_ssl_connect(context.get()));
  BIO_set_conn_hostname(client.get(), ("[::1]:" + std::to_string(Port())).c_str());
  EXPECT_EQ(BIO_do_handshake(client.get()), 1);
}

}  // namespace
}  // namespace tarnwick::hosting
