#include "hosting/Server.h"

#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <chrono>
#include <exception>
#include <semaphore>
#include <stdexcept>
#include <utility>

#include "hosting/AcceptorRoutes.h"
#include "hosting/Answers.h"
#include "hosting/Connection.h"
#include "hosting/LogNote.h"
#include "transfer/Reply.h"

namespace tarnwick::hosting {

// One request while it is served.
struct Exchange {
  explicit Exchange(Connection& itsConnection) : connection(itsConnection) {}

  Connection& connection;
  httplib::Request* request = nullptr;  // none as long as its head is not read
  std::vector<std::string> segments;    // of its path, unescaped; empty ones left out
  LogNote note;
  std::vector<Fault> faults;
  int rejection = 0;  // status with which the head alone is refused; 0: none
  bool closes = true;

  bool IsService() const { return segments == std::vector<std::string>{"bv", "bin", "BVServicePage.asp"}; }
  bool IsUpload() const {
    return segments.size() == 2 && segments[0] == "httpupload" && segments[1] == kUploadPage;
  }
  bool IsAcceptor() const {
    return IsUpload() || (segments.size() == 2 && segments[0] == "httpupload" && IsFormPage(segments[1]));
  }

  // Closes the connection after the answer, which says so.
  void Close() {
    if (!closes) request->set_header("Connection", "close");
    closes = true;
  }
};

namespace {

// Each connection has a thread, which costs little while it waits: a client that sends a byte now and then
// keeps one and no more. With a file for each this stays well below the 1024 descriptors of a process.
constexpr std::ptrdiff_t kMostConnections = 256;
constexpr std::size_t kRequestsPerConnection = 10'000;  // only told
constexpr int kIdlePatience = 10;  // seconds that a request may take to begin, and once more for its head

constexpr std::uint64_t kMostFormBytes = std::uint64_t{1} << 20;
constexpr std::uint64_t kMostUploadBytes = std::uint64_t{1} << 30;

constexpr const char* kOnlyRoute = "/";

// Takes no connection more than there are threads: those that wait in the system's queue use no descriptors.
class Threads : public httplib::ThreadPool {
 public:
  Threads() : ThreadPool(kMostConnections) {}

  void enqueue(std::function<void()> connection) override {
    free_.acquire();
    ThreadPool::enqueue([this, connection = std::move(connection)] {
      connection();
      free_.release();
    });
  }

 private:
  std::counting_semaphore<kMostConnections> free_{kMostConnections};
};

// The request that this thread serves. The library's handlers get only its request and answer.
thread_local Exchange* current = nullptr;

std::string LowerAscii(std::string text) {
  for (char& character : text)
    character = static_cast<char>(std::tolower(static_cast<unsigned char>(character)));
  return text;
}

// `path` is unescaped: that an escaped "/" parts segments too harms nobody, since each is checked. A proxy
// writes the server before it.
std::vector<std::string> Segments(std::string_view path) {
  constexpr std::string_view kScheme = "http://";
  if (LowerAscii(std::string(path.substr(0, kScheme.size()))) == kScheme)
    path = path.substr(std::min(path.find('/', kScheme.size()), path.size()));
  std::vector<std::string> segments;
  while (!path.empty()) {
    const std::string_view segment = path.substr(0, path.find('/'));
    path.remove_prefix(std::min(segment.size() + 1, path.size()));
    if (!segment.empty()) segments.emplace_back(segment);
  }
  return segments;
}

// The status with which the head of a request is refused; 0: none.
int CheckHead(const httplib::Request& request, std::uint64_t mostBytes) {
  if (request.method != "GET" && request.method != "HEAD" && request.method != "POST") return 405;
  if (request.has_header("Transfer-Encoding")) return 411;
  if (request.has_header("Content-Encoding")) return 415;
  const std::string text = request.get_header_value("Content-Length");
  if (text.empty()) return request.method == "POST" ? 411 : 0;
  std::uint64_t length = 0;
  const auto [stop, status] = std::from_chars(text.data(), text.data() + text.size(), length);
  if (status == std::errc::result_out_of_range) return 413;
  if (status != std::errc{} || stop != text.data() + text.size()) return 400;
  if (request.get_header_value_count("Content-Length") != 1) return 400;
  return length > mostBytes ? 413 : 0;
}

// The form in the body; a failed one when it is malformed or does not come.
Reply ReadForm(Exchange& exchange, const httplib::ContentReader& reader) {
  std::string body;
  const bool isWhole = reader([&](const char* bytes, std::size_t size) {
    body.append(bytes, size);
    return true;
  });
  if (isWhole) return Reply::FromBody(body);
  exchange.Close();
  return {};
}

std::string LogLine(const Exchange& exchange, std::chrono::steady_clock::time_point start) {
  const LogNote& note = exchange.note;
  const Connection& connection = exchange.connection;
  const auto elapsed = std::chrono::steady_clock::now() - start;
  return Printable(note.method) + ' ' + Printable(note.path) + ' ' + Printable(note.action) +
         " user=" + Printable(note.user) +
         " status=" + (connection.Status() == 0 ? "none" : std::to_string(connection.Status())) +
         " result=" + Printable(note.result) + " in=" + std::to_string(connection.ReadBytes()) +
         " out=" + std::to_string(connection.SentBytes()) +
         " ms=" + std::to_string(std::chrono::duration_cast<std::chrono::milliseconds>(elapsed).count());
}

}  // namespace

Server::Server(hosting::Options options, Log log)
    : options_(std::move(options)),
      store_(options_.data),
      service_(store_, options_),
      log_(std::move(log)),
      stopEvent_(eventfd(0, EFD_CLOEXEC)) {
  if (!options_.seedUser.empty() && !store_.FindByName(options_.seedUser) &&
      !store_.SeedAccount(options_.seedUser, options_.seedPassword, options_.seedProduct,
                          options_.seedPictures))
    throw std::runtime_error("the name or folder of --seed-user is taken");

  if (options_.tlsSelfSigned)
    tls_ = ContextOfOwnAuthority(options_.host, options_.Authority());
  else if (options_.HasTls())
    tls_ = ContextFromFiles(options_.tlsCertificate, options_.tlsKey);

  new_task_queue = [] { return new Threads; };
  set_keep_alive_timeout(kIdlePatience);
  set_keep_alive_max_count(kRequestsPerConnection);
  // The library's own choice lets two servers share a port, and each gets some of the requests.
  set_socket_options([](socket_t listener) {
    const int on = 1;
    setsockopt(listener, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
  });
  set_expect_100_continue_handler([](const httplib::Request&, httplib::Response& answer) {
    if (current->rejection == 0) return 100;
    return answer.status = current->rejection;
  });
  set_pre_routing_handler([](const httplib::Request&, httplib::Response& answer) {
    if (current->rejection == 0 && !current->connection.IsOver()) return HandlerResponse::Unhandled;
    answer.status = current->rejection != 0 ? current->rejection : 400;
    return HandlerResponse::Handled;
  });
  set_exception_handler([](const httplib::Request&, httplib::Response& answer, std::exception_ptr failure) {
    // Disk or database: nothing was acknowledged.
    answer.status = 500;
    current->Close();
    try {
      std::rethrow_exception(std::move(failure));
    } catch (const std::exception& error) {
      current->note.result = std::string("failure:") + error.what();
    }
  });
  Get(kOnlyRoute,
      [this](const httplib::Request&, httplib::Response& answer) { AnswerGet(*current, answer); });
  Post(kOnlyRoute, [this](const httplib::Request&, httplib::Response& answer,
                          const httplib::ContentReader& reader) { AnswerPost(*current, answer, reader); });
}

Server::~Server() {
  Stop();
}

int Server::Listen() {
  int port = options_.port;
  if (port == 0)
    port = bind_to_any_port(options_.host);
  else if (!bind_to_port(options_.host, port))
    port = -1;
  if (port <= 0) throw std::runtime_error("cannot listen on " + ServerName(options_, options_.port));
  // The library lets 5 clients queue; the next one would try again after a second.
  ::listen(svr_sock_, SOMAXCONN);
  return port;
}

void Server::Start() {
  thread_ = std::thread([this] { listen_after_bind(); });
  // Stopping a server that does not run yet would have no effect.
  while (!is_running()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

void Server::Stop() {
  if (!thread_.joinable()) return;
  const std::uint64_t one = 1;
  [[maybe_unused]] const ssize_t written = ::write(stopEvent_.Get(), &one, sizeof one);
  stop();
  thread_.join();
}

// Serves a connection to its end. The library's own version reads and writes the socket in ways that faults
// cannot reach, and closes it while the client may still be sending.
bool Server::process_and_close_socket(socket_t socket) {
  Connection connection(socket, stopEvent_.Get(), TlsSession(tls_ ? SSL_new(tls_.get()) : nullptr));
  if (tls_ && StallsHandshakes(options_.faults)) connection.Stall();
  bool stays = true;
  while (stays && connection.AwaitRequest(kIdlePatience * 1000)) {
    const auto start = std::chrono::steady_clock::now();
    Exchange exchange(connection);
    current = &exchange;
    try {
      bool closes = false;
      stays = process_request(connection, false, closes,
                              [&](httplib::Request& request) { Prepare(exchange, request); });
    } catch (const std::exception& failure) {
      exchange.note.result = std::string("failure:") + failure.what();
      stays = false;
    }
    stays = stays && !exchange.closes && !connection.IsOver();
    if (connection.ReadBytes() > 0) {
      const std::lock_guard lock(logMutex_);
      log_(LogLine(exchange, start));
    }
  }
  return true;
}

// Reads the head of a request and takes the library's own ways of reading it out of its hands: every path
// goes to one route (routes are regular expressions, which long or odd paths upset), ranges are not served,
// and only an upload is read in parts.
void Server::Prepare(Exchange& exchange, httplib::Request& request) {
  exchange.connection.EndHead();
  exchange.request = &request;
  exchange.segments = Segments(request.path);
  exchange.note.method = request.method;
  for (const std::string& segment : exchange.segments) exchange.note.path.append("/").append(segment);
  if (exchange.segments.empty()) exchange.note.path = "/";
  exchange.rejection = CheckHead(request, exchange.IsUpload() ? kMostUploadBytes : kMostFormBytes);

  const bool stays = request.method == "POST" && request.version != "HTTP/1.0" && exchange.rejection == 0 &&
                     LowerAscii(request.get_header_value("Connection")).find("close") == std::string::npos;
  request.path = kOnlyRoute;
  request.ranges.clear();
  request.headers.erase("Connection");
  if (!exchange.IsUpload()) request.headers.erase("Content-Type");
  exchange.closes = false;
  if (!stays) exchange.Close();

  exchange.faults = FaultsForPath(options_.faults, exchange.note.path);
  exchange.connection.Show(exchange.faults);
}

void Server::AnswerGet(Exchange& exchange, httplib::Response& answer) {
  const auto& segments = exchange.segments;
  exchange.note.action = "picture";
  answer.status = exchange.IsService() || exchange.IsAcceptor() ? 405 : 404;
  if (segments.size() != 3 || segments[0] != "users") return;
  if (FileHandle file = store_.OpenPicture(segments[1], segments[2]))
    SetPicture(answer, std::move(file), segments[2], exchange.faults);
}

void Server::AnswerPost(Exchange& exchange, httplib::Response& answer, const httplib::ContentReader& reader) {
  if (exchange.IsService()) {
    AnswerService(exchange, answer, reader);
  } else if (exchange.IsAcceptor()) {
    AnswerAcceptor(exchange, answer, reader);
  } else {
    answer.status = 404;
    exchange.Close();
  }
}

void Server::AnswerService(Exchange& exchange, httplib::Response& answer,
                           const httplib::ContentReader& reader) {
  const Reply form = ReadForm(exchange, reader);
  const std::string action = ServicePage::ActionOf(form);
  const std::vector<Fault> faults = FaultsForAction(options_.faults, action);
  exchange.connection.Show(faults);
  exchange.faults.insert(exchange.faults.end(), faults.begin(), faults.end());
  exchange.note.action = action;
  if (exchange.connection.IsOver()) return;
  const std::string server = (tls_ ? "https://" : "http://") + exchange.request->get_header_value("Host");
  SetForm(answer, service_.Answer(action, form, server, exchange.note), exchange.faults);
}

void Server::AnswerAcceptor(Exchange& exchange, httplib::Response& answer,
                            const httplib::ContentReader& reader) {
  const std::string& page = exchange.segments[1];
  exchange.note.action = page;
  const ErrorNumber number =
      exchange.IsUpload() ? TakeUpload(store_, options_.quota, *exchange.request, reader, exchange.note)
                          : AnswerFormPage(store_, page, ReadForm(exchange, reader), exchange.note);
  if (number) {
    exchange.note.result = std::to_string(*number);
    SetForm(answer, {"ErrorNumber", exchange.note.result}, exchange.faults);
  } else {
    exchange.note.result = "malformed";
    answer.status = 400;
    exchange.Close();
  }
}

}  // namespace tarnwick::hosting
