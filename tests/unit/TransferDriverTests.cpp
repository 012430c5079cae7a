// The driver of the downloader with a scripted socket, timer and file system, and what hosts do in events.
#include <gtest/gtest.h>

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
  void Failed(std::int32_t ftpError, TextView, bool told) override {
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
  FakeTimer watchdog;
  Host host{log};
  std::unique_ptr<PictureDownloader> downloader =
      std::make_unique<PictureDownloader>(fake.apartment, socket, watchdog);

  void Start(TextView target = kTarget) {
    log.clear();
    downloader->Start(kUrl, target);
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

  Start(u"");
  socket.events->OnConnected();
  socket.Arrives("A\r\n\r\nxyz");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(Saved(kTarget), "abc");
  EXPECT_EQ(Saved(u"C:\\t\\a.jpg"), "xyz");
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
    Start(target);
    socket.events->OnConnected();
    socket.Arrives("A\r\n\r\nold");
    fake.apartment.CopyChanged(u"C:\\T\\A.jpg");
    socket.events->OnClosedByPeer();
    EXPECT_EQ(Saved(u"C:\\t\\a.jpg"), "new");
    EXPECT_EQ(log.back(), target.empty() ? "finished without a file" : "finished");
    EXPECT_EQ(Saved(kTarget), "old") << "what was asked for is delivered";
  }
  // Unless the target is the copy.
  Start(u"C:\\t\\A.jpg");
  socket.events->OnConnected();
  socket.Arrives("A\r\n\r\nold");
  fake.apartment.CopyChanged(u"C:\\t\\a.jpg");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(Saved(u"C:\\t\\A.jpg"), "none");
}

TEST_F(DriverTest, AnEventMayReplaceTheDownload) {
  host.in = "received";
  host.does = [&] { downloader->Start(u"http://h/b.jpg", u""); };
  Start();
  socket.events->OnConnected();
  socket.Arrives("A\r\n\r\nabc");
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

TEST_F(DriverTest, TellsWhetherTheFileIsThere) {
  fake.files.mostWritten = 2;
  Start();
  socket.events->OnConnected();
  socket.Arrives("A\r\n\r\nabc");
  socket.events->OnClosedByPeer();
  EXPECT_EQ(log.back(), "finished without a file");
}

TEST_F(DriverTest, NothingIsWrittenWithoutAUserFolder) {
  EXPECT_TRUE(downloader->CanStart(kUrl));
  EXPECT_FALSE(downloader->CanStart(u"") || downloader->CanStart(u"http://h/.."));
  fake.apartment.UserFolderPath.clear();
  EXPECT_FALSE(downloader->CanStart(kUrl));
  Start();
  EXPECT_EQ(log, (Transcript{"close", "failed 45 told"}));
}

}  // namespace
}  // namespace tarnwick
