#include "HostingFixture.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <iterator>

#include "base/RuntimeError.h"
#include "service/modEnctyption.h"
#include "support/HttpAddress.h"

namespace tarnwick::hosting {
namespace {

constexpr const char* kServicePath = "/bv/bin/BVServicePage.asp?Request=R&Flag=0";

std::string Escaped(std::string_view value) {
  return EscapeFormValue(TextFromUtf8(value).value());
}

}  // namespace

TemporaryFolder::TemporaryFolder() {
  std::string name = (std::filesystem::temp_directory_path() / "hosting-XXXXXX").string();
  if (!mkdtemp(name.data())) throw std::runtime_error("no temporary folder");
  path_ = name;
}

TemporaryFolder::~TemporaryFolder() {
  std::filesystem::remove_all(path_);
}

std::string ReadFile(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

void WriteFile(const std::filesystem::path& path, std::string_view bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

int RawAnswer::Status() const {
  return bytes.starts_with("HTTP/1.1 ") ? std::atoi(bytes.c_str() + 9) : 0;
}

std::string RawAnswer::Body() const {
  const std::size_t end = bytes.find("\r\n\r\n");
  return end == std::string::npos ? "(no body)" : bytes.substr(end + 4);
}

FileHandle Connected(int port, int patienceMs) {
  FileHandle socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0));
  const timeval patience{patienceMs / 1000, (patienceMs % 1000) * 1000};
  setsockopt(socket.Get(), SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
  setsockopt(socket.Get(), SOL_SOCKET, SO_SNDTIMEO, &patience, sizeof patience);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_port = htons(static_cast<std::uint16_t>(port));
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  if (connect(socket.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) return {};
  return socket;
}

RawAnswer RawExchange(int port, std::string_view request, int patienceMs) {
  RawAnswer answer;
  const FileHandle socket = Connected(port, patienceMs);
  while (!request.empty()) {
    const ssize_t sent = send(socket.Get(), request.data(), request.size(), MSG_NOSIGNAL);
    if (sent <= 0) break;
    request.remove_prefix(static_cast<std::size_t>(sent));
  }
  std::array<char, 65536> block;
  ssize_t got = 0;
  while ((got = recv(socket.Get(), block.data(), block.size(), 0)) > 0)
    answer.bytes.append(block.data(), static_cast<std::size_t>(got));
  answer.isReset = got < 0 && errno == ECONNRESET;
  return answer;
}

HostingClient::HostingClient(int port, const std::filesystem::path& authority)
    : port_(port),
      http_((authority.empty() ? "http://127.0.0.1:" : "https://127.0.0.1:") + std::to_string(port)) {
  if (!authority.empty()) http_.set_ca_cert_path(authority.c_str());
  http_.set_keep_alive(true);
  http_.set_tcp_nodelay(true);
}

Reply HostingClient::Ask(std::string_view action, const Fields& parameters) {
  std::string body = FormText({{"ClientAction", Enciphered(action)}});
  if (!parameters.empty()) body += "&" + FormText(parameters);
  const auto result = http_.Post(kServicePath, body, kFormType);
  isLost_ = !result;
  return result && result->status == 200 ? Reply::FromBody(result->body) : Reply();
}

std::string HostingClient::AskFor(std::string_view variable, std::string_view action,
                                  const Fields& parameters) {
  const Reply reply = Ask(action, parameters);
  if (reply.ErrorOccured() == 1) return "(error)";
  const auto* values = reply.GetValueByVariableName(TextFromUtf8(variable).value());
  return values && !values->empty() ? std::string(values->front()) : "(none)";
}

int HostingClient::Form(std::string_view page, const Fields& fields, const char* user,
                        const std::string& password) {
  Fields all = {{"UsersBaseUrl", "http://127.0.0.1/users/"}};
  all.insert(all.end(), fields.begin(), fields.end());
  all.insert(all.end(), {{"User", user}, {"Password", password}, {"ProductID", kProduct}});
  return NumberIn(http_.Post("/httpupload/" + std::string(page), FormText(all), kFormType));
}

int HostingClient::Upload(const std::string& name, const std::string& bytes, const char* user,
                          const std::string& password, const char* product) {
  const Fields fields = {{"UsersBaseUrl", "http://127.0.0.1/users/"},
                         {"Flag", "0"},
                         {"User", user},
                         {"Password", password},
                         {"ProductID", product}};
  return NumberIn(
      http_.Post("/httpupload/UploadAcceptor.asp", UploadBody(fields, name, bytes), kMultipartType));
}

int HostingClient::Rename(const std::string& oldName, const std::string& newName) {
  return Form("RenameAcceptor.asp", {{"OldFileName", oldName}, {"NewFileName", newName}});
}

int HostingClient::Delete(const std::string& name) {
  return Form("DeleteAcceptor.asp", {{"FileName", name}});
}

std::map<std::string, std::string> HostingClient::CheckedListing(const char* user) {
  std::map<std::string, std::string> files;
  const Reply reply = Ask("ListFiles", {{"Username", user}, {"ProductID", "1"}});
  const auto* names = reply.GetValueByVariableName(u"FileName");
  const auto* urls = reply.GetValueByVariableName(u"FileURL");
  const auto* sizes = reply.GetValueByVariableName(u"FileSize");
  const auto* dates = reply.GetValueByVariableName(u"FileDate");
  if (!names || !urls || !sizes || !dates || urls->size() != names->size() ||
      sizes->size() != names->size() || dates->size() != names->size()) {
    ADD_FAILURE() << "the listing's arrays do not belong together";
    return files;
  }
  const std::string server = "http://127.0.0.1:" + std::to_string(port_);
  for (std::size_t i = 0; i < names->size(); ++i) {
    const std::string name((*names)[i]);
    const std::string url((*urls)[i]);
    EXPECT_TRUE(url.starts_with(server + "/users/") && url.ends_with("/" + name)) << url;
    // As the downloader asks: blanks escaped, everything else as it is.
    const std::string target =
        Utf8FromText(ReplaceAll(TextFromUtf8(url).value(), u" ", u"%20")).substr(server.size());
    const RawAnswer picture = RawExchange(port_, "GET " + target + " HTTP/1.1\r\nHost: 127.0.0.1\r\n\r\n");
    EXPECT_EQ(picture.Status(), 200) << target;
    EXPECT_NE(picture.bytes.find("Connection: close\r\n"), std::string::npos);
    EXPECT_EQ(std::to_string(picture.Body().size()), (*sizes)[i]) << target;
    files[name] = picture.Body();
  }
  return files;
}

int HostingClient::NumberIn(const httplib::Result& result) {
  isLost_ = !result;
  return ResultAsItStood(kNoNumber, [&](int& number) {
    if (result && result->status == 200)
      number = NumberFromText(Reply::FromBody(result->body).First(u"ErrorNumber"));
  });
}

std::string UploadBody(const Fields& fields, const std::string& fileName, const std::string& bytes) {
  std::string body;
  for (const auto& [name, value] : fields)
    body.append("------b0undary\r\nContent-Disposition: form-data; name=\"")
        .append(name)
        .append("\"\r\n\r\n")
        .append(value)
        .append("\r\n");
  body += "------b0undary\r\nContent-Disposition: form-data; name=\"File\"; filename=\"" + fileName +
          "\"\r\nContent-Type: application/octet-stream\r\n\r\n" + bytes + "\r\n------b0undary--\r\n";
  return body;
}

std::string Enciphered(std::string_view value) {
  return Utf8FromText(EncryptParameter(TextFromUtf8(value).value()));
}

std::string FormText(const Fields& fields) {
  std::string body;
  for (const auto& [name, value] : fields) {
    if (!body.empty()) body += '&';
    body += name + "=" + Escaped(value);
  }
  return body;
}

void HostingTest::Begin(const std::function<void(Options&)>& change) {
  End();
  Options options;
  options.data = Data();
  options.seedUser = kUser;
  options.seedPassword = kPassword;
  if (change) change(options);
  server_ = std::make_unique<Server>(options, [this](const std::string& line) {
    const std::lock_guard lock(logMutex_);
    log_ += line + "\n";
  });
  port_ = server_->Listen();
  server_->Start();
  const bool hasAuthority = options.tlsSelfSigned;
  client_ = std::make_unique<HostingClient>(port_, hasAuthority ? Authority() : std::filesystem::path());
}

void HostingTest::BeginWithFaults(std::initializer_list<const char*> faults, bool tls) {
  Begin([&](Options& options) {
    options.tlsSelfSigned = tls;
    for (const char* fault : faults) options.faults.push_back(ParseFault(fault).value());
  });
}

void HostingTest::End() {
  client_.reset();
  server_.reset();
}

std::string HostingTest::LogText() {
  const std::lock_guard lock(logMutex_);
  return log_;
}

}  // namespace tarnwick::hosting
