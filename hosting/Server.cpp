#include "hosting/Server.h"

#include <httplib.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <chrono>
#include <mutex>
#include <stdexcept>
#include <thread>

#include "hosting/AcceptorRoutes.h"
#include "hosting/Answers.h"
#include "hosting/Connection.h"
#include "hosting/Exchange.h"
#include "hosting/ServicePage.h"
#include "service/Reply.h"

namespace tarnwick::hosting {
namespace {

constexpr std::size_t kThreads = 32;
constexpr std::size_t kRequestsPerConnection = 10'000;
constexpr int kIdlePatience = 10;  // seconds that a connection may stay open between two requests

constexpr std::uint64_t kMostFormBytes = std::uint64_t{1} << 20;
constexpr std::uint64_t kMostUploadBytes = std::uint64_t{1} << 30;

constexpr const char* kOnlyRoute = "/";

std::string LowerAscii(std::string text) {
  for (char& character : text)
    character = static_cast<char>(std::tolower(static_cast<unsigned char>(character)));
  return text;
}

// One request while it is served.
struct Exchange {
  RequestHead head;
  LogNote note;
  std::vector<Fault> faults;
  int rejection = 0;  // status with which the head alone is refused; 0: none
  bool closes = false;
  httplib::Request* request = nullptr;
};

// The request that this thread serves. The library's handlers get only its request and answer.
thread_local Exchange* currentExchange = nullptr;
thread_local Connection* currentConnection = nullptr;

}  // namespace

class Server::Http : public httplib::Server {
 public:
  Http(const hosting::Options& options, Store& store, Log log)
      : options_(options),
        store_(store),
        log_(std::move(log)),
        service_(store, options),
        acceptors_(store, options) {
    new_task_queue = [] { return new httplib::ThreadPool(kThreads); };
    set_keep_alive_timeout(kIdlePatience);
    set_keep_alive_max_count(kRequestsPerConnection);
    // The library's own choice lets two servers share a port, and each gets some of the requests.
    set_socket_options([](socket_t listener) {
      const int on = 1;
      setsockopt(listener, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
    });
    set_expect_100_continue_handler([](const httplib::Request&, httplib::Response& answer) {
      const int rejection = currentExchange->rejection;
      if (rejection != 0) answer.status = rejection;
      return rejection != 0 ? rejection : 100;
    });
    set_pre_routing_handler([](const httplib::Request&, httplib::Response& answer) {
      const Exchange& exchange = *currentExchange;
      if (exchange.rejection == 0 && !currentConnection->IsOver()) return HandlerResponse::Unhandled;
      answer.status = exchange.rejection != 0 ? exchange.rejection : 400;
      return HandlerResponse::Handled;
    });
    Get(kOnlyRoute, [this](const httplib::Request&, httplib::Response& answer) { AnswerGet(answer); });
    Post(kOnlyRoute,
         [this](const httplib::Request&, httplib::Response& answer, const httplib::ContentReader& reader) {
           try {
             AnswerPost(answer, reader);
           } catch (const std::exception& failure) {
             // Disk or database: nothing was acknowledged.
             answer.status = 500;
             Close();
             currentExchange->note.result = std::string("failure:") + failure.what();
           }
         });
  }

  ~Http() override { End(); }

  int Listen() {
    port_ = options_.port;
    if (port_ == 0)
      port_ = bind_to_any_port(options_.host);
    else if (!bind_to_port(options_.host, port_))
      port_ = -1;
    if (port_ <= 0)
      throw std::runtime_error("cannot listen on " + options_.host + ":" + std::to_string(options_.port));
    return port_;
  }

  void Begin() {
    thread_ = std::thread([this] { listen_after_bind(); });
    // Stopping a server that does not run yet would have no effect.
    while (!is_running()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }

  void End() {
    if (!thread_.joinable()) return;
    const std::uint64_t one = 1;
    [[maybe_unused]] const ssize_t written = ::write(stopEvent_.Get(), &one, sizeof one);
    stop();
    thread_.join();
  }

 private:
  // Serves a connection to its end. The library's own version reads and writes the socket in ways that faults
  // cannot reach, and closes it while the client may still be sending.
  bool process_and_close_socket(socket_t socket) override {
    Connection connection(socket, stopEvent_.Get());
    currentConnection = &connection;
    bool isServed = true;
    std::size_t left = keep_alive_max_count_;
    while (isServed && connection.AwaitRequest(kIdlePatience * 1000)) {
      const auto start = std::chrono::steady_clock::now();
      Exchange exchange;
      currentExchange = &exchange;
      bool closes = --left == 0;
      try {
        isServed = process_request(connection, closes, closes,
                                   [this](httplib::Request& request) { Prepare(request); });
      } catch (const std::exception& failure) {
        exchange.note.result = std::string("failure:") + failure.what();
        isServed = false;
      }
      currentExchange = nullptr;
      isServed = isServed && !closes && !exchange.closes && exchange.request && !connection.IsOver();
      if (connection.ReadBytes() > 0) WriteLog(exchange, connection, start);
    }
    currentConnection = nullptr;
    return isServed;
  }

  // Reads the head of a request and takes the library's own ways of reading it out of its hands: every path
  // goes to one route (routes are regular expressions, which long or odd paths upset), ranges are not served,
  // and the body arrives as it was sent.
  void Prepare(httplib::Request& request) {
    Exchange& exchange = *currentExchange;
    exchange.request = &request;
    exchange.head.method = request.method;
    ReadTarget(request.target, exchange.head);
    exchange.head.hostName = request.get_header_value("Host");
    if (exchange.head.hostName.empty()) exchange.head.hostName = options_.host + ":" + std::to_string(port_);
    exchange.head.contentType = request.get_header_value("Content-Type");
    currentConnection->EndHead();
    exchange.rejection = CheckBodyLength(request);

    const std::string connection = LowerAscii(request.get_header_value("Connection"));
    const bool isOld = request.version == "HTTP/1.0";
    const bool wantsClose =
        isOld ? connection != "keep-alive" : connection.find("close") != std::string::npos;
    request.path = kOnlyRoute;
    request.ranges.clear();
    request.headers.erase("Content-Type");
    request.headers.erase("Connection");
    if (wantsClose || exchange.rejection != 0 || request.method != "POST") Close();

    exchange.faults = FaultsForPath(options_.faults, exchange.head.path);
    currentConnection->Show(exchange.faults);
  }

  // Closes the connection after the answer, which says so.
  static void Close() {
    Exchange& exchange = *currentExchange;
    if (!exchange.closes) exchange.request->set_header("Connection", "close");
    exchange.closes = true;
  }

  static int CheckBodyLength(const httplib::Request& request) {
    if (request.method != "GET" && request.method != "HEAD" && request.method != "POST") return 405;
    if (request.has_header("Transfer-Encoding")) return 411;
    const std::string text = request.get_header_value("Content-Length");
    if (request.method == "POST" && text.empty()) return 411;
    if (text.empty()) return 0;
    std::uint64_t length = 0;
    const auto [stop, status] = std::from_chars(text.data(), text.data() + text.size(), length);
    if (status == std::errc::result_out_of_range) return 413;
    if (status != std::errc{} || stop != text.data() + text.size()) return 400;
    if (request.get_header_value_count("Content-Length") != 1) return 400;
    const bool isUpload = IsAcceptor() && AcceptorRoutes::IsUpload(currentExchange->head.segments[1]);
    return length > (isUpload ? kMostUploadBytes : kMostFormBytes) ? 413 : 0;
  }

  static bool IsService() {
    const auto& segments = currentExchange->head.segments;
    return segments.size() == 3 && segments[0] == "bv" && segments[1] == "bin" &&
           segments[2] == "BVServicePage.asp";
  }

  static bool IsAcceptor() {
    const auto& segments = currentExchange->head.segments;
    return segments.size() == 2 && segments[0] == "httpupload" &&
           (AcceptorRoutes::IsUpload(segments[1]) || AcceptorRoutes::IsForm(segments[1]));
  }

  void AnswerPost(httplib::Response& answer, const httplib::ContentReader& reader) {
    Exchange& exchange = *currentExchange;
    if (IsAcceptor()) {
      const std::string& page = exchange.head.segments[1];
      exchange.note.action = page;
      const ErrorNumber number = AcceptorRoutes::IsUpload(page)
                                     ? TakeUpload(reader)
                                     : acceptors_.Answer(page, ReadForm(answer, reader), exchange.note);
      if (answer.status == 413 || currentConnection->IsOver()) return;
      if (!number) {
        exchange.note.result = "malformed";
        answer.status = 400;
        return;
      }
      exchange.note.result = std::to_string(*number);
      SetForm(answer, {"ErrorNumber", exchange.note.result}, exchange.faults);
    } else if (IsService()) {
      const Reply form = ReadForm(answer, reader);
      if (answer.status == 413) return;
      const std::string action = ServicePage::ActionOf(form);
      const std::vector<Fault> faults = FaultsForAction(options_.faults, action);
      currentConnection->Show(faults);
      exchange.faults.insert(exchange.faults.end(), faults.begin(), faults.end());
      if (currentConnection->IsOver()) {
        exchange.note.action = action;
        return;
      }
      SetForm(answer, service_.Answer(action, form, exchange.head.hostName, exchange.note), exchange.faults);
    } else {
      answer.status = 404;
      Close();
    }
  }

  // The form in the body; a failed one when it is malformed. Sets the status 413 for a body that is too long.
  static Reply ReadForm(httplib::Response& answer, const httplib::ContentReader& reader) {
    std::string body;
    bool isTooLong = false;
    const bool isWhole = reader([&](const char* bytes, std::size_t size) {
      // The announced length is checked already, but an encoded body grows when the library unpacks it.
      isTooLong = size > kMostFormBytes - body.size();
      if (!isTooLong) body.append(bytes, size);
      return !isTooLong;
    });
    if (isWhole) return Reply::FromBody(body);
    // The library has set a status of its own for a body that was not read to its end.
    answer.status = isTooLong ? 413 : -1;
    Close();
    return {};
  }

  ErrorNumber TakeUpload(const httplib::ContentReader& reader) {
    UploadRequest upload(acceptors_, currentExchange->head.contentType, currentExchange->note);
    const bool isWhole = reader([&](const char* bytes, std::size_t size) {
      return upload.Take({bytes, size});
    });
    if (isWhole) return upload.Finish();
    Close();
    return std::nullopt;
  }

  void AnswerGet(httplib::Response& answer) {
    Exchange& exchange = *currentExchange;
    const auto& segments = exchange.head.segments;
    exchange.note.action = "picture";
    answer.status = 404;
    if (IsService() || IsAcceptor()) {
      answer.status = 405;
      return;
    }
    if (segments.size() != 3 || segments[0] != "users") return;
    if (FileHandle file = store_.OpenPicture(segments[1], segments[2]))
      SetPicture(answer, std::move(file), segments[2], exchange.faults);
  }

  void WriteLog(const Exchange& exchange, const Connection& connection,
                std::chrono::steady_clock::time_point start) {
    const auto elapsed = std::chrono::steady_clock::now() - start;
    const auto milliseconds = std::chrono::duration_cast<std::chrono::milliseconds>(elapsed).count();
    std::string line = Printable(exchange.head.method) + ' ' + Printable(exchange.head.path) + ' ' +
                       Printable(exchange.note.action) + " user=" + Printable(exchange.note.user);
    line += " status=" + (connection.Status() == 0 ? "none" : std::to_string(connection.Status()));
    line += " result=" + Printable(exchange.note.result);
    line +=
        " in=" + std::to_string(connection.ReadBytes()) + " out=" + std::to_string(connection.SentBytes());
    line += " ms=" + std::to_string(milliseconds);
    const std::lock_guard lock(logMutex_);
    log_(line);
  }

  const hosting::Options& options_;  // qualified: the library has a function of that name
  Store& store_;
  Log log_;
  std::mutex logMutex_;
  ServicePage service_;
  AcceptorRoutes acceptors_;
  FileHandle stopEvent_{eventfd(0, EFD_CLOEXEC)};
  int port_ = 0;
  std::thread thread_;
};

Server::Server(Options options, Log log) : options_(std::move(options)), store_(options_.data) {
  if (!options_.seedUser.empty() && !store_.FindByName(options_.seedUser) &&
      !store_.SeedAccount(options_.seedUser, options_.seedPassword, options_.seedProduct,
                          options_.seedPictures))
    throw std::runtime_error("the name or folder of --seed-user is taken");
  http_ = std::make_unique<Http>(options_, store_, std::move(log));
}

Server::~Server() = default;

int Server::Listen() {
  return http_->Listen();
}

void Server::Start() {
  http_->Begin();
}

void Server::Stop() {
  http_->End();
}

}  // namespace tarnwick::hosting
