// A hosting server on loopback with a data folder of its own, and clients for it.
#pragma once

#include <gtest/gtest.h>
#include <httplib.h>

#include <filesystem>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "hosting/Files.h"
#include "hosting/Options.h"
#include "hosting/Server.h"
#include "transfer/Reply.h"

namespace tarnwick::hosting {

using Fields = std::vector<std::pair<std::string, std::string>>;

inline constexpr const char* kUser = "pat.lee+x@mail.example.com";
inline constexpr const char* kFolder = "pat.lee+x@mail-example-com";
inline constexpr const char* kPassword = "pa55 wörd!";
inline constexpr const char* kProduct = "4a7e2c51-93d0-4f1c-b2e9-6c1d08f3a27e";

// Error numbers of the acceptor pages.
inline constexpr int kStored = 0;
inline constexpr int kNothingChanged = -2147220891;
inline constexpr int kRefused = -2147220878;
inline constexpr int kFolderState = -2147220840;
inline constexpr int kName = -2147220881;
inline constexpr int kNotThere = -2147220880;
inline constexpr int kNoNumber = 1;  // any other answer than a number

class TemporaryFolder {
 public:
  TemporaryFolder();
  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;
  ~TemporaryFolder();
  const std::filesystem::path& Path() const { return path_; }

 private:
  std::filesystem::path path_;
};

std::string ReadFile(const std::filesystem::path& path);
void WriteFile(const std::filesystem::path& path, std::string_view bytes);

// What a client of plain sockets sees: all bytes until the end, and whether that was a reset.
struct RawAnswer {
  std::string bytes;
  bool isReset = false;

  int Status() const;
  std::string Body() const;
};

// A connection to the server, with the longest wait for a byte.
FileHandle Connected(int port, int patienceMs = 5000);

// Sends the bytes and reads to the end; `patience` is the longest wait for a byte.
RawAnswer RawExchange(int port, std::string_view request, int patienceMs = 5000);

// Talks to a server as the library does.
class HostingClient {
 public:
  // Over TLS when it is told which authority to trust.
  explicit HostingClient(int port, const std::filesystem::path& authority = {});

  // A service request; the action is enciphered.
  Reply Ask(std::string_view action, const Fields& parameters = {});
  // Element 0 of a variable of the above; "(none)" when it is missing, "(error)" for a failed exchange.
  std::string AskFor(std::string_view variable, std::string_view action, const Fields& parameters = {});

  // The ErrorNumber of a form page.
  int Form(std::string_view page, const Fields& fields, const char* user = kUser,
           const std::string& password = kPassword);
  int Upload(const std::string& name, const std::string& bytes, const char* user = kUser,
             const std::string& password = kPassword, const char* product = kProduct);

  int Rename(const std::string& oldName, const std::string& newName);
  int Delete(const std::string& name);

  // Names and sizes of the listing, checked against the bytes that the addresses give.
  std::map<std::string, std::string> CheckedListing(const char* user = kUser);

  httplib::Client& Http() { return http_; }
  // Whether the last exchange got no answer at all.
  bool IsLost() const { return isLost_; }

 private:
  int NumberIn(const httplib::Result& result);

  int port_;
  httplib::Client http_;
  bool isLost_ = false;
};

// The multipart body of an upload, with the boundary "----b0undary".
std::string UploadBody(const Fields& fields, const std::string& fileName, const std::string& bytes);
inline constexpr const char* kMultipartType = "multipart/form-data; boundary=----b0undary";

std::string Enciphered(std::string_view value);
// A form body with every value escaped.
std::string FormText(const Fields& fields);

class HostingTest : public testing::Test {
 protected:
  // Starts the server with the seeded user, in place of one that runs; `change` may alter the options.
  void Begin(const std::function<void(Options&)>& change = {});
  void BeginWithFaults(std::initializer_list<const char*> faults, bool tls = false);
  void End();
  void SetUp() override { Begin(); }
  void TearDown() override { End(); }

  HostingClient& Client() { return *client_; }
  int Port() const { return port_; }
  std::filesystem::path Authority() const { return Data() / "authority.pem"; }
  std::filesystem::path Data() const { return data_.Path() / "data"; }
  std::string LogText();

 private:
  TemporaryFolder data_;
  std::unique_ptr<Server> server_;
  std::unique_ptr<HostingClient> client_;
  int port_ = 0;
  std::mutex logMutex_;
  std::string log_;
};

}  // namespace tarnwick::hosting
