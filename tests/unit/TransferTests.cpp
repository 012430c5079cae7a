#include <gtest/gtest.h>

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
  void WriteFile(TextView path, TextView explicitPath, std::string_view bytes) override {
    log += "write " + Utf8FromText(path) + " " + Utf8FromText(explicitPath) + ";";
    body = bytes;
  }
  void Received(std::int32_t bytes) override { log += std::to_string(bytes) + ";"; }
  void ReplyLine(std::string_view line) override { log += "reply " + std::string(line) + ";"; }
  void Finished() override { log += "finished;"; }
  void Failed(bool told) override { log += told ? "failed told;" : "failed;"; }
};

struct DownloaderTest : testing::Test {
  Actions actions;
  SocketDownloader machine{actions};

  void Start(TextView url, TextView proxyHost = {}, TextView proxyPort = {}) {
    actions.log.clear();
    machine.StartDownload(url, u"C:\\t", u"", proxyHost, proxyPort);
  }
  void Data(std::string_view bytes) { machine.OnData(bytes); }
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
            "42;w+;reply HTTP/1.1 404 Nope;3;w+;close;w-;write C:\\t\\my \xC3\xA9.jpg D:\\x.jpg;finished;");
  EXPECT_EQ(actions.body, "abc");
  EXPECT_EQ(machine.ContentLength(), 3);
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
}

TEST_F(DownloaderTest, FailsAsALostConnectionDoes) {
  const std::string atOnce = "w+;close;w-;failed told;";
  for (const TextView bad : {u"http://h/a\r\nb.jpg", u"http://h/CON.jpg", u"http://h/", u"h",
                             u"http://h:0/a.jpg", u"http://h/a%.", u"/a.jpg", u"http://h/a:b"}) {
    Start(bad);
    EXPECT_EQ(actions.log, atOnce) << Utf8FromText(bad);
  }
  for (const TextView badPort : {u"", u"0", u"65536", u"x"}) {
    Start(u"h/a.jpg", u"proxy", badPort);
    EXPECT_EQ(actions.log, atOnce) << Utf8FromText(badPort);
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
      {"reset", [&] { Data("A\r\n\r\nx"), machine.OnSocketError(); }, "6;w+;reply A;close;w-;failed told;"},
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
       {u"",    u".",   u"..",      u"a.",     u"a ",   u"a/b",      u"a\\b",      u"a:b",
        u"*",   u"a?",  u"\"",      u"<",      u">",    u"|",        u"a\nb",      u"a\u007f",
        u"NUL", u"con", u"CoN.jpg", u"aux .x", u"com1", u"LPT9.gif", u"com\u00b9", u"CONOUT$"})
    EXPECT_FALSE(IsSafeFileName(bad)) << Utf8FromText(bad);
}

struct Uploads : UploadEvents {
  std::string log;
  void ActionComplete() override { log += "complete;"; }
  void Connecting() override { log += "connecting;"; }
  void Initializing() override { log += "initializing;"; }
  void ServerProcess() override { log += "server;"; }
  void UploadStarted() override { log += "started;"; }
  void UploadProgress(std::int32_t percent, std::int32_t bytes) override {
    log += std::to_string(percent) + " " + std::to_string(bytes) + ";";
  }
  void UploadComplete() override { log += "upload complete;"; }
};

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

  // A file that is shorter than it was said to be must not be sent as if it were whole.
  fake.files.files[u"C:\\a b.jpg"].length = 21;
  EXPECT_EQ(upload("ErrorNumber=0").substr(0, 3), "75 ");
  fake.files.files.clear();
  EXPECT_EQ(upload("ErrorNumber=0"), "53 ");
}

}  // namespace
}  // namespace tarnwick
