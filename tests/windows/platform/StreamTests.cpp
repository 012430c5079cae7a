// Streamed posts, sockets and timers that tell their events as messages, against real connections.
#include "LoopbackServer.h"
// LoopbackServer.h comes first: see there.
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <functional>
#include <list>

#include "base/RuntimeError.h"
#include "platform/windows/WindowsHeaders.h"
#include "platform/windows/WindowsHttpTransport.h"
#include "platform/windows/WindowsMessagePump.h"
#include "platform/windows/WindowsStreamSocket.h"
#include "platform/windows/WindowsTimer.h"

namespace tarnwick {
namespace {

using End = LoopbackServer::End;

constexpr char kOk[] = "HTTP/1.1 200 OK\r\nContent-Length: 2\r\n\r\nok";
constexpr std::size_t kLarge = 24U << 20;
// Milliseconds after which a call is not merely slow.
constexpr DWORD kHangs = 20'000;

// Milliseconds of processor time that this process has used.
std::uint64_t ProcessorMs() {
  // Created, ended, in the kernel, in the program.
  FILETIME times[4] = {};
  GetProcessTimes(GetCurrentProcess(), &times[0], &times[1], &times[2], &times[3]);
  return (std::bit_cast<std::uint64_t>(times[2]) + std::bit_cast<std::uint64_t>(times[3])) / 10'000;
}

// Pumps until `done`, for as long as a test may take.
bool PumpUntil(const std::function<bool()>& done, std::uint32_t mostMs = 5000) {
  WindowsMessagePump pump;
  WindowsTimer limit;
  bool late = false;
  limit.SetHandler([&] { late = true; });
  limit.Start(mostMs);
  while (!done() && !late) pump.Wait();
  return done();
}

// --- Timer ---

TEST(WindowsTimer, RunsOutOnceAndCountsAnew) {
  WindowsTimer timer;
  int expired = 0;
  timer.SetHandler([&] { ++expired; });
  const DWORD begin = GetTickCount();
  const std::uint64_t processor = ProcessorMs();
  timer.Start(200);
  PumpUntil([] { return false; }, 120);
  timer.Start(200);
  EXPECT_TRUE(PumpUntil([&] { return expired > 0; }));
  EXPECT_GE(GetTickCount() - begin, 300U);
  PumpUntil([] { return false; }, 500);
  EXPECT_EQ(expired, 1);
  timer.Start(50);
  timer.Stop();
  PumpUntil([] { return false; }, 150);
  EXPECT_EQ(expired, 1);
  // A wait that polls uses as much as it lasts.
  EXPECT_LE(ProcessorMs() - processor, 400U);
}

// A server whose queue is full answers nothing to who connects.
class FullServer {
 public:
  FullServer() {
    WSADATA data;
    WSAStartup(MAKEWORD(2, 2), &data);
    listener_ = ListenOnLoopback(AF_INET, 1, port_);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port_);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    for (SOCKET& client : waiting_) {
      client = socket(AF_INET, SOCK_STREAM, 0);
      unsigned long on = 1;
      ioctlsocket(client, FIONBIO, &on);
      // Does not block: under way is no failure.
      static_cast<void>(connect(client, reinterpret_cast<const sockaddr*>(&address), sizeof address));
    }
  }
  ~FullServer() {
    for (const SOCKET client : waiting_) closesocket(client);
    closesocket(listener_);
    WSACleanup();
  }
  FullServer(const FullServer&) = delete;
  FullServer& operator=(const FullServer&) = delete;

  std::uint16_t Port() const { return port_; }

 private:
  SOCKET listener_ = INVALID_SOCKET;
  SOCKET waiting_[8] = {};
  std::uint16_t port_ = 0;
};

std::uint16_t PortOfNobody() {
  return LoopbackServer({}).Port();
}

// --- Socket ---

// Writes down what a socket tells, and reads what it has.
struct Sink : SocketEvents {
  WindowsStreamSocket socket;
  std::string log;
  std::string bytes;
  std::size_t room = 64 * 1024;
  Sink() { socket.SetEvents(this); }
  Sink(std::unique_ptr<Resolver> resolver, std::uint32_t connectMs) : socket(std::move(resolver), connectMs) {
    socket.SetEvents(this);
  }
  void OnResolved() override { log += "resolved;"; }
  void OnConnected() override {
    log += "connected;";
    socket.Send("GET / HTTP/1.1\r\n\r\n");
  }
  void OnReadable() override {
    std::string piece(room, '\0');
    piece.resize(socket.Read(piece));
    bytes += piece;
  }
  void OnClosedByPeer() override { log += "closed;"; }
  void OnSent() override { log += "sent;"; }
  void OnSocketError(std::int32_t number) override { log += "error " + std::to_string(number) + ";"; }
  bool Over() const {
    return log.find("closed") != std::string::npos || log.find("error") != std::string::npos;
  }
};

std::string Pattern(std::size_t length) {
  std::string bytes(length, '\0');
  for (std::size_t i = 0; i < length; ++i) bytes[i] = static_cast<char>(i * 7 + i / 251);
  return bytes;
}

TEST(WindowsStreamSocket, BringsWhatThePeerSendsAndTellsItsClose) {
  const std::string bytes = Pattern(3'000'000);
  for (const TextView host : {u"127.0.0.1", u"localhost", u"[::1]", u"::1"}) {
    SCOPED_TRACE(Utf8FromText(host));
    Sink sink;
    const int family = host.find(u':') == TextView::npos ? AF_INET : AF_INET6;
    // Not every machine knows its own name, or has IPv6.
    std::uint16_t port = 0;
    const SOCKET probe = ListenOnLoopback(family, 1, port);
    closesocket(probe);
    if (host == u"localhost" && !gethostbyname("localhost")) continue;
    if (family == AF_INET6 && probe == INVALID_SOCKET) continue;
    LoopbackServer server({{bytes}}, family);
    sink.room = 10'007;
    sink.socket.Connect(host, server.Port());
    EXPECT_TRUE(sink.log.empty()) << "told inside a call";
    EXPECT_TRUE(PumpUntil([&] { return sink.Over(); }));
    EXPECT_EQ(sink.log, std::string(host == u"localhost" ? "resolved;" : "") + "connected;sent;closed;");
    EXPECT_TRUE(sink.bytes == bytes) << sink.bytes.size();
    EXPECT_EQ(server.Requests(), std::vector<std::string>{"GET / HTTP/1.1\r\n\r\n"});
  }
  // A reset is no close, also when the system says so.
  LoopbackServer server(std::vector<LoopbackServer::Answer>(20, {"A\r\n\r\nabc", End::kReset}));
  for (int i = 0; i < 20; ++i) {
    Sink sink;
    sink.socket.Connect(u"127.0.0.1", server.Port());
    EXPECT_TRUE(PumpUntil([&] { return sink.Over(); }));
    EXPECT_EQ(sink.log, "connected;sent;error 10054;") << i;
  }
}

TEST(WindowsStreamSocket, TellsWhyThereIsNoConnection) {
  const std::uint16_t nobody = PortOfNobody();
  for (const TextView host : {u"127.0.0.1", u"\u65E5", u"[::1", u"[127.0.0.1]"}) {
    Sink sink;
    sink.socket.Connect(host, nobody);
    EXPECT_TRUE(sink.log.empty());
    EXPECT_TRUE(PumpUntil([&] { return sink.Over(); }));
    EXPECT_EQ(sink.log, host == u"127.0.0.1" ? "error 10061;" : "error 11001;") << Utf8FromText(host);
  }
}

struct FakeResolver : Resolver {
  // Told with the ports of 127.0.0.1 by the test.
  Taker taker;
  void LookUp(TextView, std::uint16_t, Taker its) override { taker = std::move(its); }
  void Cancel() override { taker = nullptr; }
  void Tell(const std::vector<std::uint16_t>& ports) {
    std::vector<SocketAddress> addresses;
    for (const std::uint16_t port : ports) {
      sockaddr_in address{};
      address.sin_family = AF_INET;
      address.sin_port = htons(port);
      address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
      addresses.emplace_back(reinterpret_cast<const char*>(&address), sizeof address);
    }
    const Taker told = std::move(taker);
    told(addresses);
  }
};

TEST(WindowsStreamSocket, TriesTheAddressesOfANameOneAfterTheOther) {
  constexpr std::uint32_t kConnectMs = 900;
  const FullServer full;
  const std::uint16_t nobody = PortOfNobody();
  const std::uint16_t silent = full.Port();
  LoopbackServer server(std::vector<LoopbackServer::Answer>(4, {"A\r\n\r\nabc"}));
  const std::string good = "resolved;connected;sent;closed;";
  const struct {
    std::vector<std::uint16_t> ports;
    std::string log;
    DWORD leastMs;
    DWORD mostMs;
  } rows[] = {
      {{}, "error 11001;", 0, 800},
      {{server.Port()}, good, 0, 800},
      {{nobody, server.Port(), nobody}, good, 0, 800},
      {{silent, server.Port()}, good, 400, 800},
      {{silent, nobody, silent, server.Port()}, good, 400, 800},
      {{nobody, nobody}, "resolved;error 10061;", 0, 800},
      {{silent, nobody}, "resolved;error 10061;", 400, 800},
      {{nobody, silent}, "resolved;error 10060;", 800, 1800},
      // Only who waits for it ends a single one.
      {{silent}, "resolved;", 1900, 3000},
  };
  std::list<Sink> sinks;
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::PrintToString(row.ports));
    auto resolver = std::make_unique<FakeResolver>();
    FakeResolver& names = *resolver;
    Sink& sink = sinks.emplace_back(std::move(resolver), kConnectMs);
    sink.socket.Connect(u"pictures.example.org", 80);
    const DWORD begin = GetTickCount();
    names.Tell(row.ports);
    PumpUntil([&] { return sink.Over(); }, 2000);
    const DWORD took = GetTickCount() - begin;
    EXPECT_GE(took, row.leastMs);
    EXPECT_LE(took, row.mostMs);
    EXPECT_EQ(sink.log, row.log);
  }
  // Nothing more is told when a share runs out.
  PumpUntil([] { return false; }, kConnectMs + 100);
  auto sink = sinks.begin();
  for (const auto& row : rows) EXPECT_EQ((sink++)->log, row.log);
}

// The numbers of closed sockets come again, and messages of theirs may still wait.
TEST(WindowsStreamSocket, TellsNothingOfAnEarlierConnection) {
  const std::vector<LoopbackServer::Answer> answers(40, {"A\r\n\r\nabc"});
  LoopbackServer server(answers);
  Sink sink;
  for (std::size_t i = 0; i < answers.size() / 2; ++i) {
    // Closed before, or when, what it has to tell is told. The first ones fail at once.
    sink.socket.Connect(u"\u65E5", 80);
    sink.socket.Connect(u"localhost", server.Port());
    if (i % 4 < 2) Sleep(20);
    sink.socket.Connect(u"127.0.0.1", server.Port());
    Sleep(i % 2 == 0 ? 0 : 20);
    sink.log.clear();
    sink.bytes.clear();
    sink.socket.Connect(u"127.0.0.1", server.Port());
    EXPECT_TRUE(PumpUntil([&] { return sink.Over(); }));
    EXPECT_EQ(sink.log, "connected;sent;closed;") << i;
    EXPECT_EQ(sink.bytes, "A\r\n\r\nabc") << i;
  }
}

TEST(WindowsStreamSocket, WaitsForASilentPeerAtNoCost) {
  LoopbackServer server({{"", End::kSilence}});
  Sink sink;
  sink.socket.Connect(u"127.0.0.1", server.Port());
  EXPECT_TRUE(PumpUntil([&] { return !sink.log.empty(); }));
  const std::uint64_t processor = ProcessorMs();
  PumpUntil([&] { return sink.Over(); }, 700);
  EXPECT_LE(ProcessorMs() - processor, 300U);
  EXPECT_EQ(sink.log, "connected;sent;");
}

// --- Streamed posts ---

struct Source : BodySource {
  explicit Source(std::uint64_t itsLength) : length(itsLength) {}
  std::uint64_t length;
  std::uint64_t position = 0;
  // At which it fails.
  std::uint64_t failsAt = std::numeric_limits<std::uint64_t>::max();
  std::size_t largestRoom = 0;
  std::vector<std::uint64_t> told;
  // From when so many bytes have left, it is not wanted.
  std::uint64_t wantedTo = std::numeric_limits<std::uint64_t>::max();
  bool wanted = true;
  DWORD thread = GetCurrentThreadId();

  std::uint64_t Length() const override { return length; }
  std::size_t Read(std::span<char> room) override {
    EXPECT_EQ(GetCurrentThreadId(), thread);
    if (position >= failsAt) throw RuntimeError(75);
    largestRoom = std::max(largestRoom, room.size());
    const auto count = static_cast<std::size_t>(std::min<std::uint64_t>(room.size(), length - position));
    for (std::size_t i = 0; i < count; ++i)
      room[i] = static_cast<char>((position + i) * 7 + (position + i) / 251);
    position += count;
    return count;
  }
  void Sent(std::uint64_t sent) override {
    EXPECT_EQ(GetCurrentThreadId(), thread);
    told.push_back(sent);
    if (sent >= wantedTo) wanted = false;
  }
  bool IsWanted() const override { return wanted; }
};

std::optional<HttpAnswer> Stream(std::uint16_t port, Source& source, std::uint32_t silenceMs = 5000) {
  WindowsHttpTransport http(5000, silenceMs);
  HttpPost post;
  post.host = u"127.0.0.1";
  post.port = port;
  post.target = "/p";
  post.contentType = "multipart/form-data; boundary=x";
  return http.PostStream(post, source, 1000);
}

TEST(PostStream, SendsALargeBodyPieceByPiece) {
  LoopbackServer server({{kOk}});
  Source source(kLarge);
  const auto answer = Stream(server.Port(), source);
  ASSERT_TRUE(answer);
  EXPECT_EQ(answer->status, 200);
  EXPECT_EQ(answer->body, "ok");
  EXPECT_LE(source.largestRoom, std::size_t{1} << 20);
  ASSERT_FALSE(source.told.empty());
  EXPECT_EQ(source.told.front(), 0U);
  EXPECT_EQ(source.told.back(), kLarge);
  EXPECT_TRUE(std::is_sorted(source.told.begin(), source.told.end()));

  ASSERT_EQ(server.Requests().size(), 1U);
  const std::string& request = server.Requests()[0];
  const std::size_t headEnd = request.find("\r\n\r\n");
  const std::string head = request.substr(0, headEnd + 2);
  for (const std::string& line : {"Content-Length: " + std::to_string(kLarge),
                                  std::string("Content-Type: multipart/form-data; boundary=x")})
    EXPECT_NE(head.find("\r\n" + line + "\r\n"), std::string::npos) << line << " in\n" << head;
  EXPECT_TRUE(request.substr(headEnd + 4) == Pattern(kLarge)) << request.size();
}

TEST(PostStream, FailsWithinItsTimeOutAndHandlesMessagesMeanwhile) {
  WindowsTimer timer;
  int ticks = 0;
  timer.SetHandler([&] {
    ++ticks;
    timer.Start(20);
  });
  timer.Start(20);
  const struct {
    const char* name;
    LoopbackServer::Answer answer;
  } rows[] = {
      {"reset in the body", {"", End::kReset, 100'000}},
      {"no more is read", {"", End::kSilence, 100'000}},
      {"no answer", {"", End::kSilence}},
      {"half an answer", {"HTTP/1.1 200 OK\r\nContent-Length: 9\r\n\r\nErr", End::kSilence}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    LoopbackServer server({row.answer});
    Source source(kLarge);
    const DWORD begin = GetTickCount();
    ticks = 0;
    EXPECT_FALSE(Stream(server.Port(), source, 1000));
    EXPECT_LT(GetTickCount() - begin, kHangs);
    // Of the fifty in a second of silence.
    EXPECT_TRUE(ticks > 12 || row.answer.end == End::kReset) << ticks;
  }
}

TEST(PostStream, EndsWithItsSourceAndWithAQuitMessage) {
  {
    LoopbackServer server({{kOk}});
    Source source(kLarge);
    source.failsAt = kLarge / 2;
    EXPECT_THROW(Stream(server.Port(), source), RuntimeError);
  }
  // To a peer that reads so slowly that all of it would take seconds.
  LoopbackServer server({{kOk, End::kClose, std::numeric_limits<std::size_t>::max(), 10}});
  Source source(kLarge);
  WindowsTimer timer;
  timer.SetHandler([] { PostQuitMessage(7); });
  timer.Start(150);
  EXPECT_FALSE(Stream(server.Port(), source));
  EXPECT_LT(source.position, kLarge);
  MSG message{};
  ASSERT_TRUE(PeekMessageW(&message, nullptr, WM_QUIT, WM_QUIT, PM_REMOVE));
  EXPECT_EQ(message.wParam, WPARAM{7});
}

TEST(PostStream, EndsWhenItsSourceIsNotWanted) {
  const struct {
    const char* name;
    LoopbackServer::Answer answer;
    std::uint64_t length;
    std::uint64_t wantedTo;
    bool answered;
  } rows[] = {
      {"before the only piece", {kOk}, 10, 0, false},
      {"in the body", {kOk}, kLarge, kLarge / 2, false},
      {"in a message, to a peer that reads no more", {"", End::kSilence, 100'000}, kLarge, kLarge, false},
      {"after the last byte", {kOk}, kLarge, kLarge, true},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    LoopbackServer server({row.answer});
    Source source(row.length);
    source.wantedTo = row.wantedTo;
    WindowsTimer timer;
    timer.SetHandler([&] { source.wanted = false; });
    if (row.answer.end == End::kSilence) timer.Start(300);
    const DWORD begin = GetTickCount();
    EXPECT_EQ(Stream(server.Port(), source).has_value(), row.answered);
    // Of a time-out of 5 s.
    EXPECT_LT(GetTickCount() - begin, 4000U);
    timer.Stop();
    const std::string& request = server.Requests().at(0);
    EXPECT_EQ(request.size() - request.find("\r\n\r\n") - 4 == row.length, row.answered) << request.size();
  }
}

TEST(PostStream, GivesUpAnAddressThatSwallowsPackets) {
  FullServer full;
  WindowsHttpTransport http(500, 30'000);
  HttpPost post;
  post.host = u"127.0.0.1";
  post.port = full.Port();
  post.target = "/";
  post.body = "a=1";
  for (const bool streamed : {false, true}) {
    Source source(3);
    const DWORD begin = GetTickCount();
    EXPECT_FALSE(streamed ? http.PostStream(post, source, 1000) : http.Post(post, 1000));
    const DWORD took = GetTickCount() - begin;
    EXPECT_GE(took, 450U) << streamed;
    EXPECT_LT(took, 2000U) << streamed;
  }
}

}  // namespace
}  // namespace tarnwick
