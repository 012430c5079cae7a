#include <gtest/gtest.h>

#include <chrono>
#include <sstream>

#include "fakes/FakePlatform.h"
#include "transfer/AcceptorPages.h"
#include "transfer/FileNameGuard.h"
#include "transfer/SocketDownloader.h"
#include "transfer/UploadObject.h"

namespace tarnwick {
namespace {

// Writes down what the machine wants, a word each.
struct Actions : DownloadActions {
  std::string log;
  std::string body;
  void Connect(TextView host, std::uint16_t port) override {
    log += "connect " + Utf8FromText(host) + " " + std::to_string(port) + ";";
  }
  void Send(std::string_view bytes) override { log += "send " + std::string(bytes) + ";"; }
  void CloseSocket() override { log += "close;"; }
  void RestartWatchdog() override { log += "w+;"; }
  void StopWatchdog() override { log += "w-;"; }
  bool WriteFile(TextView path, TextView explicitPath, std::string_view bytes) override {
    log += "write " + Utf8FromText(path) + " " + Utf8FromText(explicitPath) + ";";
    body = bytes;
    return true;
  }
  void Received(std::int32_t bytes) override { log += std::to_string(bytes) + ";"; }
  void HeaderFound(std::string_view line, std::int32_t bytes) override {
    log += "reply " + std::string(line) + " " + std::to_string(bytes) + ";";
  }
  void Finished(bool) override { log += "finished;"; }
  void Failed(DownloadFailure, bool told) override { log += told ? "failed told;" : "failed;"; }
};

struct DownloaderTest : testing::Test {
  Actions actions;
  SocketDownloader machine{actions};

  void Start(TextView url, TextView proxyHost = {}, TextView proxyPort = {}) {
    actions.log.clear();
    machine.StartDownload(url, u"C:\\t", u"", proxyHost, proxyPort);
  }
  void Data(std::string_view bytes) {
    while (!bytes.empty()) {
      const std::span<char> room = machine.Room(bytes.size());
      if (room.empty()) return;
      machine.OnArrived(bytes.copy(room.data(), room.size()));
      bytes.remove_prefix(room.size());
    }
  }
};

TEST_F(DownloaderTest, FetchesAFile) {
  machine.StartDownload(u"http://h:8080/users/a@b/my \u00e9.jpg", u"C:\\t", u"D:\\x.jpg", u"", u"");
  machine.OnConnected();
  machine.OnSent();
  Data("HTTP/1.1 404 Nope\r\nContent-Length: 3\r\n\r\nab");
  Data("c");
  machine.OnClosedByPeer();
  machine.OnClosedByPeer();
  EXPECT_EQ(actions.log,
            "w+;connect h 8080;send GET /users/a@b/my%20\xC3\xA9.jpg HTTP/1.1\r\nHost: h:8080\r\nConnection: "
            "close\r\n"
            "Accept: */*\r\nUser-Agent: Mozilla/4.0 (compatible; MSIE 4.0; Windows NT)\r\n\r\n;w+;"
            "42;w+;reply HTTP/1.1 404 Nope 2;3;w+;close;w-;write C:\\t\\my \xC3\xA9.jpg D:\\x.jpg;finished;");
  EXPECT_EQ(actions.body, "abc");
  EXPECT_EQ(machine.ContentLength(), 3);
  Start(u"h/a.gif");
  EXPECT_EQ(machine.ContentLength(), 0);
}

TEST_F(DownloaderTest, FindsTheHeaderAcrossAnySplit) {
  const std::string reply = "HTTP/1.0 200\r\nA: b\r\nContent-Length: 99999999999\r\n\r\nbody\r\n\r\nmore";
  for (std::size_t first = 0; first <= reply.size(); ++first)
    for (std::size_t second = first; second <= reply.size(); ++second) {
      Start(u"h/a.gif");
      machine.OnConnected();
      Data(reply.substr(0, first));
      Data(reply.substr(first, second - first));
      Data(reply.substr(second));
      machine.OnClosedByPeer();
      ASSERT_EQ(actions.body, "body\r\n\r\nmore") << first << " " << second;
      ASSERT_EQ(machine.ContentLength(), 0);
    }
  Start(u"h/a.gif");
  Data("A\r\nContent-Length: 3x\r\nContent-Length: 4\r\n\r\n");
  EXPECT_EQ(machine.ContentLength(), 0);
}

// Byte by byte, and with as many beginnings of the empty line as fit: whoever searched all again for each
// arrival would still be at it.
TEST_F(DownloaderTest, LooksAtEachByteOfTheHeaderOnce) {
  std::string header;
  while (header.size() < 300'000) header += "\r\n\rx";
  Start(u"h/a.gif");
  machine.OnConnected();
  const auto begin = std::chrono::steady_clock::now();
  for (const char byte : header) Data({&byte, 1});
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(2));
  Data("\r\n\r\nbody");
  machine.OnClosedByPeer();
  EXPECT_EQ(actions.body, "body");
}

TEST_F(DownloaderTest, FailsBeyondItsBound) {
  Start(u"h/a.gif");
  machine.OnConnected();
  const std::string piece(kMostReplyBytes / 16, 'x');
  Data("HTTP/1.1 200\r\nContent-Length: 2147483647\r\n\r\n");
  for (int i = 0; i < 15; ++i) Data(piece);
  EXPECT_TRUE(machine.IsRunning());
  actions.log.clear();
  Data(piece);
  EXPECT_EQ(actions.log, "close;w-;failed told;");
}

TEST_F(DownloaderTest, FailsAsALostConnectionDoes) {
  const std::string atOnce = "w+;close;w-;failed told;";
  for (const TextView bad : {u"http://h/a\r\nb.jpg", u"http://h/CON.jpg", u"http://h/", u"h",
                             u"http://h:0/a.jpg", u"http://h/a%.", u"/a.jpg", u"http://h/a:b"}) {
    Start(bad);
    EXPECT_EQ(actions.log, atOnce) << Utf8FromText(bad);
  }
  for (const TextView port : {u"", u"65536"}) {
    Start(u"h/a.jpg", u"proxy", port);
    EXPECT_EQ(actions.log, atOnce) << Utf8FromText(port);
  }
  actions.log.clear();
  machine.StartDownload(u"h/a.jpg", u"", u"", u"", u"");
  EXPECT_EQ(actions.log, atOnce);

  const struct {
    const char* name;
    std::function<void()> happens;
    const char* log;
  } rows[] = {
      {"closed without a byte", [&] { machine.OnClosedByPeer(); }, "close;w-;failed told;"},
      {"closed in the header", [&] { Data("HTTP"), machine.OnClosedByPeer(); }, "4;w+;close;w-;failed;"},
      {"reset", [&] { Data("A\r\n\r\nx"), machine.OnSocketError(); }, "6;w+;reply A 1;close;w-;failed told;"},
      {"silence", [&] { machine.OnWatchdog(); }, "w-;failed;"},
      {"cancelled", [&] { machine.Cancel(); }, "close;w-;"},
  };
  for (const auto& row : rows) {
    Start(u"h/a.jpg");
    actions.log.clear();
    row.happens();
    EXPECT_EQ(actions.log, row.log) << row.name;
    actions.log.clear();
    Data("late");
    machine.OnConnected();
    machine.OnSocketError();
    machine.OnWatchdog();
    EXPECT_EQ(actions.log, "") << row.name;
  }
}

TEST_F(DownloaderTest, AsksTheProxyForTheWholeAddress) {
  Start(u"h:81/a b.jpg", u"proxy", u"3128");
  machine.OnConnected();
  EXPECT_EQ(actions.log.substr(0, actions.log.find("\r\nConn")),
            "w+;connect proxy 3128;send GET http://h:81/a%20b.jpg HTTP/1.1\r\nHost: proxy");
  Start(u"");
  EXPECT_EQ(actions.log, "");
}

TEST(FileNameGuard, AcceptsAndRefuses) {
  for (const TextView good :
       {u"a", u"a b.jpg", u".x", u"a..b", u"\u00e9.gif", u"con1", u"comx.jpg", u"com", u"nully"})
    EXPECT_TRUE(IsSafeFileName(good)) << Utf8FromText(good);
  for (const TextView bad :
       {u"",        u".",      u"..",   u"a.",   u"a ",       u"a/b",       u"a\\b",    u"a:b", u"*",
        u"a?",      u"\"",     u"<",    u">",    u"|",        u"a\nb",      u"a\u007f", u"NUL", u"con",
        u"CoN.jpg", u"aux .x", u"com1", u"COM0", u"LPT9.gif", u"com\u00b9", u"CONOUT$"})
    EXPECT_FALSE(IsSafeFileName(bad)) << Utf8FromText(bad);
}

struct Uploads : UploadEvents {
  // The event that tells this is the last one that is wanted.
  std::string stop = "nothing";
  bool IsWanted() const override { return !log.ends_with(stop); }
  std::string log;
  std::string file;
  void ActionComplete() override { log += "complete;"; }
  void Connecting() override { log += "connecting;"; }
  void Initializing() override { log += "initializing;"; }
  void ServerProcess() override { log += "server;"; }
  void UploadStarted() override { log += "started;"; }
  void FileBytes(std::string_view bytes) override { file += bytes; }
  void UploadProgress(std::int32_t percent, std::int32_t bytes) override {
    log += std::to_string(percent) + " " + std::to_string(bytes) + ";";
  }
  void UploadComplete() override { log += "upload complete;"; }
};

// The number of the failure, 0 for none.
std::int32_t Upload(FakePlatform& fake, TextView path, TextView base, Uploads& events) {
  if (path != u"C:\\none") fake.files.files[Text(path)] = {3, 0, "abc"};
  try {
    UploadObject(fake.apartment.platform).UploadFile(path, base, u"/p", 0, u"u", u"p", u"g", events);
  } catch (const RuntimeError& failure) {
    return failure.Number();
  }
  return 0;
}

TEST(UploadObject, SendsTheFileAndTellsItsProgress) {
  FakePlatform fake;
  fake.files.files[u"C:\\a b.jpg"] = {20, 0, "12345678901234567890"};
  UploadObject uploader(fake.apartment.platform);
  const auto upload = [&](const char* answer) {
    Uploads events;
    if (answer) fake.http.answers.push_back(HttpAnswer{200, answer});
    std::int32_t error = 0;
    try {
      uploader.UploadFile(u"C:\\a b.jpg", u"http://h:81/users/", u"/httpupload/UploadAcceptor.asp", 0, u"u",
                          u"p", kProductGuid, events);
    } catch (const RuntimeError& failure) {
      error = failure.Number();
    }
    return std::to_string(error) + " " + events.log;
  };
  const std::string begin = "initializing;connecting;started;0 0;";
  const std::string good = upload("ErrorNumber=0");
  EXPECT_EQ(good.substr(0, 2 + begin.size()), "0 " + begin);
  EXPECT_NE(good.find(";100 20;server;upload complete;complete;"), std::string::npos) << good;
  EXPECT_NE(upload("ErrorNumber=-2147220891").find("server;upload complete;complete;"), std::string::npos);
  EXPECT_EQ(upload("ErrorNumber=-2147220891").substr(0, 11), "-2147220891");
  EXPECT_EQ(upload("ErrorNumber=-2147220881").find("upload complete"), std::string::npos);
  EXPECT_EQ(upload(nullptr).substr(0, 11), "-2147467259");

  const auto& sent = fake.http.sent[0];
  EXPECT_EQ(sent.target, "/httpupload/UploadAcceptor.asp");
  EXPECT_EQ(sent.port, 81);
  std::string body = sent.body;
  const std::string boundary = "--" + sent.contentType.substr(sent.contentType.find('=') + 1);
  for (std::size_t at; (at = body.find(boundary)) != std::string::npos;)
    body.replace(at, boundary.size(), "|");
  const auto field = [](const std::string& name, const std::string& value) {
    return "|\r\nContent-Disposition: form-data; name=\"" + name + "\"\r\n\r\n" + value + "\r\n";
  };
  EXPECT_EQ(body, field("UsersBaseUrl", "http://h:81/users/") + field("Flag", "0") + field("User", "u") +
                      field("Password", "p") + field("ProductID", Utf8FromText(kProductGuid)) +
                      "|\r\nContent-Disposition: form-data; name=\"File\"; filename=\"a b.jpg\"\r\n"
                      "Content-Type: application/octet-stream\r\n\r\n12345678901234567890\r\n|--\r\n");

  EXPECT_NE(fake.http.sent[0].contentType, fake.http.sent[1].contentType) << "a boundary can be foreseen";

  // A file that is shorter or longer than it was said to be must not be sent as if it were whole.
  for (const std::uint64_t length : {21U, 19U}) {
    fake.files.files[u"C:\\a b.jpg"].length = length;
    EXPECT_EQ(upload("ErrorNumber=0").substr(0, 3), "75 ");
  }
}

TEST(UploadObject, EndsWhenItIsNotWanted) {
  for (const auto& [stop, error] : {std::pair{"connecting;", error::kInterrupted},
                                    {"0 0;", error::kInterrupted},
                                    {"100 3;", error::kInterrupted},
                                    {"server;", 0}}) {
    SCOPED_TRACE(stop);
    FakePlatform fake;
    fake.http.answers.push_back(HttpAnswer{200, "ErrorNumber=0"});
    Uploads events;
    events.stop = stop;
    EXPECT_EQ(Upload(fake, u"a", u"http://h/users/", events), error);
    EXPECT_EQ(fake.http.sent.size(), error == 0 ? 1U : 0U);
    EXPECT_EQ(events.log.ends_with("upload complete;complete;"), error == 0) << "the server has the file";
  }
}

// A transport that takes the body in pieces of one size.
struct PiecewiseHttp : FakeHttp {
  std::size_t piece = 1;
  std::optional<HttpAnswer> PostStream(const HttpPost& post, BodySource& source, std::size_t most) override {
    std::string body;
    std::string room(piece, '?');
    source.Sent(0);
    while (body.size() < source.Length()) {
      body.append(room, 0, source.Read(room));
      source.Sent(body.size());
    }
    EXPECT_EQ(source.Read(room), 0U);
    HttpPost whole = post;
    whole.body = body;
    return Post(whole, most);
  }
};

TEST(UploadObject, TellsRisingPercentsInPiecesOfAnySize) {
  for (const std::size_t length : {0U, 7U, 12345U}) {
    for (const std::size_t piece : {1U, 1000U, 1U << 20}) {
      SCOPED_TRACE(std::to_string(length) + " in " + std::to_string(piece));
      FakePlatform fake;
      PiecewiseHttp http;
      http.piece = piece;
      http.answers.push_back(HttpAnswer{200, "ErrorNumber=0"});
      std::string bytes(length, 'x');
      fake.files.files[u"C:\\\u00e9.jpg"] = {length, 0, bytes};
      Platform platform = fake.apartment.platform;
      UploadObject uploader(
          {platform.registry, http, platform.internet, platform.files, platform.strings, platform.pump});
      Uploads events;
      uploader.UploadFile(u"C:\\\u00e9.jpg", u"http://h/users/", u"/p", 0, u"u", u"p", u"g", events);

      std::istringstream log(events.log);
      std::vector<std::string> told;
      for (std::string event; std::getline(log, event, ';');) told.push_back(event);
      ASSERT_GE(told.size(), 8U) << events.log;
      EXPECT_EQ(told[2], "started");
      EXPECT_EQ(told[3], "0 0");
      EXPECT_EQ(told[told.size() - 4], "100 " + std::to_string(length));
      for (std::size_t i = 4; i + 3 < told.size(); ++i)
        EXPECT_LT(std::stoi(told[i - 1]), std::stoi(told[i])) << events.log;
      const std::string& body = http.sent[0].body;
      EXPECT_NE(body.find("filename=\"\xC3\xA9.jpg\"\r\nContent-Type: application/octet-stream\r\n\r\n" +
                          bytes + "\r\n--"),
                std::string::npos);
      EXPECT_TRUE(body.ends_with("--\r\n"));
      EXPECT_EQ(events.file, bytes);
    }
  }
}

TEST(UploadObject, FailsWithTheNumberOfTheFailure) {
  const struct {
    const char* name;
    TextView path;
    TextView base;
    std::optional<HttpAnswer> answer;
    std::int32_t error;
    std::size_t posts;
  } rows[] = {
      {"no file", u"C:\\none", u"http://h/users/", {}, 53, 0},
      {"no server", u"C:\\a", u"http:///users/", {}, acceptor::kUnspecified, 0},
      {"a head in the address", u"C:\\a", u"http://h\r\nX: y/users/", {}, acceptor::kUnspecified, 0},
      {"a head in the name", u"C:\\a:\"\r\nX: y", u"http://h/users/", {}, acceptor::kNameRefused, 0},
      {"no answer", u"C:\\a", u"http://h/users/", {}, acceptor::kUnspecified, 1},
      {"an error", u"C:\\a", u"h/users/", HttpAnswer{500, "ErrorNumber=0"}, acceptor::kUnspecified, 1},
      {"another success", u"C:\\a", u"h/users/", HttpAnswer{201, "ErrorNumber=0"}, acceptor::kUnspecified, 1},
      {"no number", u"C:\\a", u"h/users/", HttpAnswer{200, "ErrorNumber=none"}, acceptor::kUnspecified, 1},
      {"nothing said", u"C:\\a", u"h/users/", HttpAnswer{200, "OK"}, acceptor::kUnspecified, 1},
      {"the page's own", u"C:\\a", u"h/users/", HttpAnswer{200, "ErrorNumber=380"}, 380, 1},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    FakePlatform fake;
    if (row.answer) fake.http.answers.push_back(row.answer);
    Uploads events;
    EXPECT_EQ(Upload(fake, row.path, row.base, events), row.error);
    EXPECT_EQ(fake.http.sent.size(), row.posts);
    EXPECT_EQ(events.log.find("upload complete"), std::string::npos);
  }
}

// The forms of the two other operations, and that each failure is the page's number.
TEST(UploadObject, DeletesAndRenames) {
  FakePlatform fake;
  UploadObject uploader(fake.apartment.platform);
  fake.http.answers = {HttpAnswer{200, "ErrorNumber=0"}, HttpAnswer{200, "ErrorNumber=0"},
                       HttpAnswer{200, "ErrorNumber=-2147220880"}};
  uploader.DeleteFile(u"http://h:81/users/", u"a b&\u00e9.jpg", u"/httpupload/DeleteAcceptor.asp", u"u", u"p",
                      u"g");
  uploader.RenameFile(u"http://h:81/users/", u"old", u"new", u"/httpupload/RenameAcceptor.asp", u"u", u"p",
                      u"g");
  EXPECT_THROW(uploader.DeleteFile(u"h/users/", u"a", u"/p", u"u", u"p", u"g"), RuntimeError);
  EXPECT_THROW(uploader.RenameFile(u"h/users/", u"a", u"b", u"/p", u"u", u"p", u"g"), RuntimeError);
  ASSERT_EQ(fake.http.sent.size(), 4U);
  EXPECT_EQ(fake.http.sent[0].target, "/httpupload/DeleteAcceptor.asp");
  EXPECT_EQ(fake.http.sent[0].body,
            "UsersBaseUrl=http%3A%2F%2Fh%3A81%2Fusers%2F&FileName=a%20b%26%C3%A9.jpg&User=u&Password=p&"
            "ProductID=g");
  EXPECT_EQ(fake.http.sent[1].body,
            "UsersBaseUrl=http%3A%2F%2Fh%3A81%2Fusers%2F&OldFileName=old&NewFileName=new&User=u&Password=p&"
            "ProductID=g");
}

}  // namespace
}  // namespace tarnwick
