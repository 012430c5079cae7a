// The driver of the downloader with a scripted socket, timer and file system, and what hosts do in events.
#include <gtest/gtest.h>

#include <chrono>

#include "fakes/FakeTransfers.h"
#include "transfer/PictureDownloader.h"

namespace tarnwick {
namespace {

constexpr TextView kUrl = u"http://h/users/a@b/a.jpg";
constexpr TextView kTarget = u"D:\\a.jpg";

struct Host : DownloadEvents {
  explicit Host(Transcript& itsLog) : log(itsLog) {}
  Transcript& log;
  // What the host does in the event of that name, once.
  std::string in;
  std::function<void()> does;

  void Tell(const std::string& event) {
    log.push_back(event);
    if (in != event.substr(0, in.size()) || !does) return;
    std::exchange(does, nullptr)();
  }
  void Resolving() override { Tell("resolving"); }
  void Connected() override { Tell("connected"); }
  void TransferStarting() override { Tell("starting"); }
  void HeaderFound(TextView line, std::int32_t bytes) override {
    Tell("reply " + Utf8FromText(line) + " " + std::to_string(bytes));
  }
  void Received(std::int32_t bytes) override { Tell("received " + std::to_string(bytes)); }
  void Finished(bool written) override { Tell(written ? "finished" : "finished without a file"); }
  bool IsWanted() const override { return wanted; }
  bool wanted = true;
  std::string reason;
  void Failed(std::int32_t ftpError, TextView text, bool told) override {
    reason = Utf8FromText(text);
    Tell("failed " + std::to_string(ftpError) + (told ? " told" : ""));
  }
};

struct DriverTest : testing::Test {
  DriverTest() {
    fake.apartment.UserFolderPath = u"C:\\t";
    downloader->SetEvents(&host);
  }
  Transcript log;
  FakePlatform fake;
  FakeSocket socket{log};
  FakeSecureFetch secureFetch{log};
  FakeTimer watchdog;
  Host host{log};
  std::unique_ptr<PictureDownloader> downloader =
      std::make_unique<PictureDownloader>(fake.apartment, socket, secureFetch, watchdog);

  void Start(TextView target = kTarget, TextView url = kUrl) {
    log.clear();
    downloader->Start(url, target);
  }
  // All but the end of a download.
  void Fetch(TextView target, std::string_view reply) {
    Start(target);
    socket.events->OnConnected();
    socket.Arrives(reply);
  }
  std::string Saved(TextView path) {
    const auto found = fake.files.files.find(Text(path));
    return found == fake.files.files.end() ? "none" : found->second.bytes;
  }
};

TEST_F(DriverTest, TellsADownloadInOrderAndWritesBothFiles) {
  // A longer copy that begins alike.
  fake.files.files[u"C:\\t\\a.jpg"] = {6, 0, "abcold"};
  Start();
  EXPECT_EQ(watchdog.runs, kWatchdogMs);
  socket.events->OnResolved();
  socket.events->OnConnected();
  watchdog.runs = 0;
  socket.events->OnSent();
  EXPECT_EQ(watchdog.runs, kWatchdogMs);
  watchdog.runs = 0;
  socket.Arrives("HTTP/1.1 200 OK\r\n\r\nab");
  EXPECT_EQ(watchdog.runs, kWatchdogMs);
  socket.Arrives("c");
  EXPECT_EQ(Saved(u"C:\\t\\a.jpg"), "abcold");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(log, (Transcript{"connect h:80", "resolving", "connected", "send GET /users/a@b/a.jpg HTTP/1.1",
                             "starting", "received 21", "reply HTTP/1.1 200 OK 2", "received 3", "close",
                             "finished"}));
  EXPECT_EQ(Saved(kTarget), "abc");
  EXPECT_EQ(Saved(u"C:\\t\\a.jpg"), "abc");
  EXPECT_EQ(watchdog.runs, 0U);

  Fetch(u"", "A\r\n\r\nxyz");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(Saved(kTarget), "abc");
  EXPECT_EQ(Saved(u"C:\\t\\a.jpg"), "xyz");
}

TEST_F(DriverTest, AsksTheServerOrTheProxyForTheAddress) {
  const std::string rest =
      "\r\nConnection: close\r\nAccept: */*\r\n"
      "User-Agent: Mozilla/4.0 (compatible; MSIE 4.0; Windows NT)\r\n\r\n";
  Start(kTarget, u"http://h:8080/users/a@b/my \u00e9.jpg");
  EXPECT_EQ(log[0], "connect h:8080");
  socket.events->OnConnected();
  EXPECT_EQ(socket.sent, "GET /users/a@b/my%20\xC3\xA9.jpg HTTP/1.1\r\nHost: h:8080" + rest);
  downloader->Cancel();
  fake.apartment.proxy = {u"proxy", u"3128", u""};
  Start(kTarget, u"h:81/a b.jpg");
  EXPECT_EQ(log[0], "connect proxy:3128");
  socket.events->OnConnected();
  EXPECT_EQ(socket.sent, "GET http://h:81/a%20b.jpg HTTP/1.1\r\nHost: proxy" + rest);
}

TEST_F(DriverTest, FindsTheHeaderAcrossAnySplit) {
  const std::string reply = "HTTP/1.0 200\r\nA: b\r\nContent-Length: 99999999999\r\n\r\nbody\r\n\r\nmore";
  for (std::size_t first = 0; first <= reply.size(); ++first)
    for (std::size_t second = first; second <= reply.size(); ++second) {
      fake.files.files.clear();
      Fetch(kTarget, reply.substr(0, first));
      socket.Arrives(reply.substr(first, second - first));
      socket.Arrives(reply.substr(second));
      socket.events->OnClosedByPeer();
      ASSERT_EQ(Saved(kTarget), "body\r\n\r\nmore") << first << " " << second;
    }
}

// Byte by byte, and with as many beginnings of the empty line as fit: whoever searched all again for each
// arrival would still be at it.
TEST_F(DriverTest, LooksAtEachByteOfTheHeaderOnce) {
  std::string header;
  while (header.size() < 100'000) header += "\r\n\rx";
  Start();
  socket.events->OnConnected();
  const auto begin = std::chrono::steady_clock::now();
  for (const char byte : header) socket.Arrives({&byte, 1});
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(2));
  socket.Arrives("\r\n\r\nbody");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(Saved(kTarget), "body");
}

TEST_F(DriverTest, FailsAsALostConnectionDoes) {
  for (const TextView bad :
       {u"http://h/a\r\nb.jpg", u"http://h/CON.jpg", u"http://h/", u"h", u"http://h:0/a.jpg", u"http://h/a%.",
        u"/a.jpg", u"http://h/a:b", u"https://h/a.jpg"}) {
    Start(kTarget, bad);
    EXPECT_EQ(log, (Transcript{"close", "failed 45 told"})) << Utf8FromText(bad);
  }
  for (const TextView port : {u"", u"65536"}) {
    fake.apartment.proxy = {u"proxy", Text(port), u""};
    Start();
    EXPECT_EQ(log, (Transcript{"close", "failed 45 told"})) << Utf8FromText(port);
  }
  fake.apartment.proxy = {};
  Start();
  socket.Arrives("HTTP");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(log.back(), "failed 5");
  // Nothing of it is told later.
  log.clear();
  socket.Arrives("late");
  socket.events->OnConnected();
  socket.events->OnSocketError(10054);
  EXPECT_EQ(log, Transcript());

  Start();
  const std::string piece(kMostReplyBytes / 64, 'x');
  socket.Arrives("HTTP/1.1 200\r\nContent-Length: 2147483647\r\n\r\n");
  for (int i = 0; i < 63; ++i) socket.Arrives(piece);
  EXPECT_TRUE(log.back().starts_with("received"));
  socket.Arrives(piece);
  EXPECT_EQ(log.back(), "failed 45 told");
}

// Only what is asked of the network differs.
TEST_F(DriverTest, TellsADownloadOverTlsAsAnyOther) {
  fake.apartment.session.serverName = u"https://h";
  // The system's settings count instead.
  fake.apartment.proxy = {u"proxy", u"3128", u""};
  Start(kTarget, u"https://h/users/a@b/my \u00e9.jpg");
  secureFetch.events->OnConnected();
  secureFetch.Arrives("HTTP/1.1 200 OK\r\n\r\nab");
  watchdog.runs = 0;
  secureFetch.events->OnSent();
  EXPECT_EQ(watchdog.runs, kWatchdogMs);
  secureFetch.Arrives("c");
  secureFetch.events->OnClosedByPeer();
  EXPECT_EQ(
      log, (Transcript{"close", "fetch h:443/users/a@b/my%20%C3%A9.jpg", "resolving", "connected", "starting",
                       "received 21", "reply HTTP/1.1 200 OK 2", "received 3", "close", "finished"}));
  EXPECT_EQ(secureFetch.headers, kDownloadHeaders);
  EXPECT_EQ(Saved(kTarget), "abc");

  // An address in the clear goes nowhere.
  EXPECT_FALSE(downloader->CanStart(kUrl));
  Start();
  EXPECT_EQ(log, (Transcript{"close", "failed 45 told"}));
  EXPECT_EQ(host.reason, "The file's address is not a secure one, as this session needs it.");

  const TextView url = u"HTTPS://h:8443/a.jpg";
  const struct {
    std::int32_t error;
    const char* event;
    const char* reason;  // a part of it
  } rows[] = {
      {http_error::kTimeout, "failed 58 told", "silent"},
      {http_error::kNameNotResolved, "failed 9 told", "name was not found"},
      {http_error::kCannotConnect, "failed 6 told", "refused"},
      {http_error::kConnectionLost, "failed 5 told", "in the middle"},
      {http_error::kCertificateDate, "failed 5 told", "expired"},
      {http_error::kCertificateName, "failed 5 told", "another name"},
      {http_error::kUnknownAuthority, "failed 5 told", "an authority"},
      {http_error::kSecureChannel, "failed 5 told", "no secure connection"},
  };
  for (const auto& row : rows) {
    Start(kTarget, url);
    EXPECT_EQ(log.at(0), "fetch h:8443/a.jpg");
    secureFetch.events->OnSocketError(row.error);
    EXPECT_EQ(log.back(), row.event) << row.reason;
    EXPECT_NE(host.reason.find(row.reason), std::string::npos) << host.reason;
  }
  Start(kTarget, url);
  secureFetch.events->OnConnected();
  secureFetch.closed = 0;
  downloader->Cancel();
  EXPECT_EQ(secureFetch.closed, 1);
  EXPECT_EQ(watchdog.runs, 0U);

  // What fell silent in this session does not end a download of one in the clear.
  Start(kTarget, url);
  watchdog.handler();
  secureFetch.closed = 0;
  fake.apartment.session.serverName = u"h";
  Start();
  EXPECT_EQ(secureFetch.closed, 1);
  downloader.reset();
  EXPECT_EQ(secureFetch.events, nullptr);
}

// More than is kept in memory: it is written as it comes, and in the end it is there whole or not at all.
TEST_F(DriverTest, WritesALargeFileAsItComes) {
  std::string body;
  while (body.size() < 1'200'000) body += std::to_string(body.size());
  const struct {
    std::function<void()> ends;
    std::size_t room;  // on the disk
    const char* last;  // event
  } rows[] = {
      {[&] { socket.events->OnClosedByPeer(); }, SIZE_MAX, "finished"},
      {[&] { socket.events->OnClosedByPeer(); }, 600'000, "finished without a file"},
      {[&] { socket.events->OnSocketError(10054); }, SIZE_MAX, "failed 7 told"},
      {[&] { watchdog.handler(); }, SIZE_MAX, "failed 58"},
      {[&] { downloader->Cancel(); }, SIZE_MAX, "close"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.last);
    const bool whole = row.last == std::string("finished");
    fake.files.files = {{u"C:\\t\\a.jpg", {3, 0, "old"}}};
    fake.files.mostWritten = row.room;
    fake.files.bytesWritten = 0;
    // The host pumps messages before the header was searched.
    host.in = "received";
    host.does = [&] { socket.Arrives(std::string_view(body).substr(3, 500'000)); };
    Fetch(kTarget, "HTTP/1.1 200 OK\r\nContent-Length: 9\r\n\r\n" + body.substr(0, 3));
    // The second of these does not fit any more in that much room, the third would.
    socket.Arrives(std::string_view(body).substr(500'003, 300'000));
    socket.Arrives(std::string_view(body).substr(800'003));
    EXPECT_EQ(log.back(), "received " + std::to_string(body.size()));
    EXPECT_GT(fake.files.bytesWritten, 500'000U);
    EXPECT_EQ(Saved(kTarget), "none");
    row.ends();
    EXPECT_EQ(log.back(), row.last);
    EXPECT_TRUE(Saved(kTarget) == (whole ? body : "none"));
    EXPECT_TRUE(Saved(u"C:\\t\\a.jpg") == (whole ? body : "old"));
    EXPECT_EQ(fake.files.writers, 0);
  }
}

TEST_F(DriverTest, WritesOnlyThePreparedFileThatIsItsTarget) {
  const struct {
    TextView prepared;
    std::function<void()> ends;
    const char* saved;
  } rows[] = {
      {kTarget, [&] { socket.events->OnClosedByPeer(); }, "abc"},
      {u"C:\\else.jpg", [&] { socket.events->OnClosedByPeer(); }, "abc"},
      {kTarget, [&] { socket.events->OnSocketError(10054); }, "none"},
  };
  for (const auto& row : rows) {
    downloader->Prepare(row.prepared);
    EXPECT_EQ(fake.files.writers, 1);
    Fetch(kTarget, "A\r\n\r\nabc");
    EXPECT_EQ(fake.files.writers, 1);
    row.ends();
    EXPECT_EQ(Saved(kTarget), row.saved);
    EXPECT_EQ(Saved(u"C:\\else.jpg"), "none");
    EXPECT_EQ(fake.files.writers, 0);
    fake.files.files.clear();
  }
  downloader->Prepare(kTarget);
  downloader->Cancel();
  EXPECT_EQ(fake.files.writers, 0);
}

// Hosts pump messages in their handlers, so whatever the socket has to tell may be told there.
TEST_F(DriverTest, TakesWhatIsToldInsideAnEvent) {
  const std::string head = "HTTP/1.1 200 OK\r\nContent-Length: 3\r\n\r\n";
  const struct {
    const char* in;
    std::function<void()> does;
    std::string first;  // what arrives
    const char* saved;
    const char* last;  // event
  } rows[] = {
      {"received", [&] { socket.events->OnClosedByPeer(); }, head + "abc", "abc", "finished"},
      {"reply", [&] { socket.Arrives("c"), socket.events->OnClosedByPeer(); }, head + "ab", "abc",
       "finished"},
      {"received", [&] { socket.events->OnSocketError(10054); }, head + "abc", "none", "failed 7 told"},
      {"received", [&] { downloader->Cancel(); }, head + "abc", "none", "close"},
      {"starting", [&] { socket.events->OnClosedByPeer(); }, "", "none", "failed 5 told"},
      {"resolving", [&] { downloader->Cancel(); }, "", "none", "close"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(std::string(row.in) + " " + row.last);
    fake.files.files.clear();
    host.in = row.in;
    host.does = row.does;
    Start();
    socket.events->OnConnected();
    if (!row.first.empty()) socket.Arrives(row.first);
    socket.events->OnClosedByPeer();
    EXPECT_EQ(Saved(kTarget), row.saved);
    EXPECT_EQ(log.back(), row.last);
    EXPECT_EQ(watchdog.runs, 0U);
  }
}

TEST_F(DriverTest, EndsBeforeItDoesAnythingUnwanted) {
  const std::function<void()> steps[] = {
      [&] { socket.events->OnConnected(); },
      [&] { socket.Arrives("HTTP/1.1 200 OK\r\n\r\nabc"); },
      [&] { socket.events->OnClosedByPeer(); },
  };
  for (std::size_t last = 0; last < std::size(steps); ++last) {
    host.wanted = true;
    Start();
    for (std::size_t i = 0; i < last; ++i) steps[i]();
    host.wanted = false;
    log.clear();
    for (std::size_t i = last; i < std::size(steps); ++i) steps[i]();
    EXPECT_EQ(log, Transcript{"close"}) << last;
    EXPECT_EQ(Saved(kTarget), "none");
  }
}

TEST_F(DriverTest, AChangeInTheAccountOvertakesTheCopy) {
  for (const TextView target : {kTarget, TextView()}) {
    fake.files.files[u"C:\\t\\a.jpg"] = {3, 0, "new"};
    Fetch(target, "A\r\n\r\nold");
    fake.apartment.CopyChanged(u"C:\\T\\A.jpg");
    socket.events->OnClosedByPeer();
    EXPECT_EQ(Saved(u"C:\\t\\a.jpg"), "new");
    EXPECT_EQ(log.back(), target.empty() ? "finished without a file" : "finished");
    EXPECT_EQ(Saved(kTarget), "old") << "what was asked for is delivered";
  }
  // Unless the target is the copy.
  Fetch(u"C:\\t\\A.jpg", "A\r\n\r\nold");
  fake.apartment.CopyChanged(u"C:\\t\\a.jpg");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(Saved(u"C:\\t\\A.jpg"), "none");
}

TEST_F(DriverTest, AnEventMayReplaceTheDownload) {
  host.in = "received";
  host.does = [&] { downloader->Start(u"http://h/b.jpg", u""); };
  Fetch(kTarget, "A\r\n\r\nabc");
  socket.events->OnConnected();
  socket.Arrives("HTTP/1.1 200\r\n\r\nxyz");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(Saved(u"C:\\t\\b.jpg"), "xyz");
  EXPECT_EQ(Saved(kTarget), "none");
}

TEST_F(DriverTest, WatchdogQuitAndEnd) {
  Start();
  watchdog.handler();
  EXPECT_EQ(log.back(), "failed 58");
  EXPECT_EQ(std::ranges::count(log, "close"), 0) << "the socket stays as it is";
  // Of an upload: the flag is set all the same.
  log.clear();
  downloader->RestartWatchdog();
  watchdog.handler();
  EXPECT_EQ(log, Transcript{"failed 58"});
  EXPECT_EQ(watchdog.runs, 0U);

  Start();
  socket.events->OnSocketError(10061);
  EXPECT_EQ(log.back(), "failed 6 told");
  Start();
  fake.pump.onWait = [] { return true; };
  downloader->Wait();
  EXPECT_EQ(log.back(), "resolving");
  fake.pump.onWait = [] { return false; };
  downloader->Wait();
  EXPECT_EQ(log.back(), "failed 5");
  EXPECT_EQ(std::ranges::count(log, "close"), 1);

  Start();
  downloader.reset();
  EXPECT_EQ(log.back(), "close");
  EXPECT_EQ(socket.events, nullptr);
  EXPECT_EQ(watchdog.runs, 0U);
}

TEST_F(DriverTest, WritesAFileOnlyWhereThereIsRoomAndAUserFolder) {
  fake.files.mostWritten = 2;
  Fetch(kTarget, "A\r\n\r\nabc");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(log.back(), "finished without a file");
  EXPECT_TRUE(downloader->CanStart(kUrl));
  EXPECT_FALSE(downloader->CanStart(u"") || downloader->CanStart(u"http://h/.."));
  fake.apartment.UserFolderPath.clear();
  EXPECT_FALSE(downloader->CanStart(kUrl));
  Start();
  EXPECT_EQ(log, (Transcript{"close", "failed 45 told"}));
}

}  // namespace
}  // namespace tarnwick
