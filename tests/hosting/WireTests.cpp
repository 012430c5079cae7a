// What only plain sockets show: targets, heads, connections that stay open, and answers that are spoilt.
#include <sys/eventfd.h>
#include <sys/socket.h>

#include <chrono>
#include <iterator>
#include <sstream>
#include <thread>

#include "HostingFixture.h"
#include "hosting/Connection.h"

namespace tarnwick::hosting {
namespace {

using Clock = std::chrono::steady_clock;

class WireTest : public HostingTest {
 protected:
  RawAnswer Get(const std::string& target) {
    return RawExchange(Port(), "GET " + target + " HTTP/1.1\r\nHost: x.test:1\r\n\r\n");
  }

  static std::string Post(const std::string& target, const std::string& body, const char* more = "") {
    return "POST " + target +
           " HTTP/1.1\r\nHost: x.test:1\r\nContent-Type: application/x-www-form-urlencoded\r\n" + more +
           "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
  }
};

TEST_F(WireTest, PicturesAreFoundUnderEveryWrittenFormOfTheirPath) {
  ASSERT_EQ(Client().Upload("\xC3\xA4 b+c.jpg", "bytes"), kStored);
  const std::string folder = std::string("/users/") + kFolder;
  for (const std::string& target : {folder + "/\xC3\xA4%20b+c.jpg", folder + "/%C3%a4%20b%2Bc.jpg",
                                    "//users///" + (kFolder + std::string("//")) + "%C3%A4%20b+c.jpg",
                                    "http://x.test:1" + folder + "/\xC3\xA4%20b+c.jpg",
                                    "HTTP://other" + folder + "/\xC3\xA4%20b+c.jpg?q=1"}) {
    const RawAnswer answer = Get(target);
    EXPECT_EQ(answer.Body(), "bytes") << target;
    EXPECT_NE(answer.bytes.find("Content-Length: 5\r\n"), std::string::npos);
    EXPECT_NE(answer.bytes.find("Connection: close\r\n"), std::string::npos);
    EXPECT_NE(answer.bytes.find("Content-Type: image/jpeg\r\n"), std::string::npos);
  }
  const RawAnswer head = RawExchange(
      Port(), "HEAD " + folder + "/%C3%A4%20b+c.jpg HTTP/1.1\r\nHost: x\r\nRange: bytes=1-2\r\n\r\n");
  EXPECT_EQ(head.Status(), 200);
  EXPECT_EQ(head.Body(), "");
}

TEST_F(WireTest, PathsThatLeaveTheUsersFolderAreNotFound) {
  ASSERT_EQ(Client().Upload("a.jpg", "1"), kStored);
  WriteFile(Data() / "users" / "secret", "s");
  std::filesystem::create_symlink(Data() / "users" / "secret", Data() / "users" / kFolder / "link.jpg");
  std::filesystem::create_directory_symlink(Data() / "outbox", Data() / "users" / "linked");
  WriteFile(Data() / "outbox" / "m.txt", "m");
  const std::string folder = std::string("/users/") + kFolder;
  for (const std::string& target :
       {std::string("/hosting.sqlite"), std::string("/users/%2e%2e/hosting.sqlite"),
        std::string("/users/..%2fhosting.sqlite/x"), folder + "/../secret", folder + "/%2E%2E%2fsecret",
        folder + "/.", folder, std::string("/users/./secret"), folder + "/a.jpg%00", folder + "/a.jpg/x",
        folder + "%2F..%2Fsecret", folder + "/x\\..\\a.jpg", folder + "/link.jpg",
        std::string("/users/linked/m.txt"), std::string("*"), std::string("/users/\xFF\xFE/\xFF"),
        "/users/" + std::string(300, 'x') + "/a.jpg"})
    EXPECT_EQ(Get(target).Status(), 404) << target;
  EXPECT_EQ(Get("/bv/bin/BVServicePage.asp").Status(), 405);
}

TEST_F(WireTest, OneConnectionServesManyPostsAndTellsHostInAddresses) {
  const std::string body = FormText({{"ClientAction", Enciphered("FileUpload")},
                                     {"FileName", "a b.jpg"},
                                     {"FileSize", "1"},
                                     {"Username", kUser},
                                     {"ProductID", "1"}});
  // Absolute and doubled-slash targets; the last one ends the connection.
  const std::string requests = Post("/bv/bin/BVServicePage.asp?Request=R&Flag=1", body) +
                               Post("http://x.test:1/bv/bin/BVServicePage.asp?Request=R", body) +
                               Post("//bv//bin/BVServicePage.asp", body + "\r\n", "Connection: close\r\n");
  const RawAnswer answer = RawExchange(Port(), requests);
  std::size_t count = 0;
  const std::string wanted =
      "FileURL=http%3A%2F%2Fx.test%3A1%2Fusers%2Fpat.lee%2Bx%40mail-example-com%2Fa%20b.jpg";
  for (std::size_t at = 0; (at = answer.bytes.find(wanted, at)) != std::string::npos; ++at) ++count;
  EXPECT_EQ(count, 3U) << answer.bytes;
  EXPECT_NE(answer.bytes.find("Content-Type: application/x-www-form-urlencoded; charset=utf-8\r\n"),
            std::string::npos);
}

TEST_F(WireTest, UnescapedUserNamesAndEmptyListingsAreUnderstood) {
  // As the requests that send names unescaped write them: the form turns "+" into a blank.
  const std::string body = "ClientAction=" + FormText({{"", Enciphered("ListFiles")}}).substr(1) +
                           "&Username=" + kUser + "&ProductID=1";
  EXPECT_EQ(RawExchange(Port(), Post("/bv/bin/BVServicePage.asp", body, "Connection: close\r\n")).Body(),
            "FileName&FileURL&FileSize&FileDate");
}

TEST_F(WireTest, MalformedRequestsGetADefinedAnswerAndTheServerStaysUp) {
  const std::string service = "/bv/bin/BVServicePage.asp";
  for (const std::string& body : {std::string(), std::string("ClientAction="), std::string("ClientAction=%"),
                                  std::string("\0\xFF\r\n&&==", 8), FormText({{"ClientAction", "ListFiles"}}),
                                  FormText({{"clientaction", Enciphered("HardLimit")}})}) {
    const RawAnswer answer = RawExchange(Port(), Post(service, body, "Connection: close\r\n"));
    EXPECT_EQ(answer.Status(), 200);
    EXPECT_EQ(answer.Body(), "ErrorOccured=1") << body;
  }
  const std::string post = "POST " + service + " HTTP/1.1\r\nHost: x\r\n";
  const struct {
    std::string request;
    int status;
  } heads[] = {
      {"nonsense\r\n\r\n", 400},
      {"GET / HTTP/3.0\r\n\r\n", 400},
      {"PUT /users/x/y HTTP/1.1\r\nContent-Length: 1\r\n\r\nx", 405},
      {post + "\r\n", 411},
      {post + "Transfer-Encoding: chunked\r\n\r\n0\r\n\r\n", 411},
      {post + "Content-Length: -1\r\n\r\n", 400},
      {post + "Content-Length: 1\r\nContent-Length: 2\r\n\r\nx", 400},
      {post + "Content-Length: 99999999999999999999\r\n\r\n", 413},
      {post + "Expect: 100-continue\r\nContent-Length: 1048577\r\n\r\n", 413},
      {"POST /httpupload/UploadAcceptor.asp HTTP/1.1\r\nContent-Length: 1073741825\r\n\r\n", 413},
      {"GET /" + std::string(9000, 'x') + " HTTP/1.1\r\n\r\n", 414},
      {"GET / HTTP/1.1\r\nX: " + std::string(9000, 'x') + "\r\n\r\n", 400},
      {std::string(200'000, 'x'), 431},
  };
  for (const auto& [request, status] : heads) {
    const RawAnswer answer = RawExchange(Port(), request);
    EXPECT_EQ(answer.Status(), status) << request.substr(0, 120);
    EXPECT_FALSE(answer.isReset) << request.substr(0, 120);
  }
  EXPECT_EQ(Client().AskFor("HardLimit", "HardLimit", {{"ProductID", "1"}}), "1000");
}

TEST_F(WireTest, FaultsSpoilTheAnswerOfTheirActionOnly) {
  const std::string body = FormText({{"ClientAction", Enciphered("HardLimit")}, {"ProductID", "1"}});
  const std::string request = Post("/bv/bin/BVServicePage.asp", body, "Connection: close\r\n");
  const std::string good = "HardLimit=1000";
  struct Row {
    const char* fault;
    bool isReset;
    int status;
    std::string body;
  };
  const Row rows[] = {
      {"HardLimit=refuse", false, 0, "(no body)"},
      {"HardLimit=reset:request", true, 0, "(no body)"},
      {"HardLimit=reset:head", true, 200, "(no body)"},
      {"HardLimit=reset:body", true, 200, good.substr(0, 7)},
      {"HardLimit=cut", false, 200, good.substr(0, 7)},
      {"/bv/=cut:3", false, 200, good.substr(0, 3)},
      {"HardLimit=wrong", false, 200, "OtherHardLimit=1000"},
      {"HardLimit=status:503", false, 503, good},
      {"HardLimit=length:3", false, 200, good},
      {"HardLimit=huge:30", false, 200, good + "&Filler=xxxxxxxx"},
      {"HardLimit=drip:1", false, 200, good},
      {"SoftLimit=refuse", false, 200, good},
  };
  for (const Row& row : rows) {
    BeginWithFaults({row.fault});
    const RawAnswer answer = RawExchange(Port(), request);
    EXPECT_EQ(answer.isReset, row.isReset) << row.fault;
    EXPECT_EQ(answer.Status(), row.status) << row.fault;
    EXPECT_EQ(answer.Body(), row.body) << row.fault;
    if (std::string_view(row.fault).starts_with("HardLimit")) {
      EXPECT_EQ(Client().AskFor("SoftLimit", "SoftLimit", {{"ProductID", "1"}}), "900") << row.fault;
    }
  }
  BeginWithFaults({"HardLimit=length:3"});
  EXPECT_NE(RawExchange(Port(), request).bytes.find("Content-Length: 3\r\n"), std::string::npos);
  BeginWithFaults({"HardLimit=garbage"});
  EXPECT_EQ(Client().AskFor("HardLimit", "HardLimit", {{"ProductID", "1"}}), "(error)");
  EXPECT_FALSE(Client().IsLost());
  // The answer does not tell that the connection serves no second request.
  for (const std::string& first : {request, Post("/bv/bin/BVServicePage.asp", body)}) {
    BeginWithFaults({"HardLimit=late-close:200"});
    const auto start = Clock::now();
    const RawAnswer answer = RawExchange(Port(), first + request);
    EXPECT_EQ(answer.Body(), good);
    EXPECT_FALSE(answer.isReset);
    EXPECT_EQ(answer.bytes.find("Connection:"), std::string::npos) << answer.bytes;
    EXPECT_EQ(answer.bytes.find("Keep-Alive:"), std::string::npos) << answer.bytes;
    EXPECT_GE(Clock::now() - start, std::chrono::milliseconds(190));
  }
  BeginWithFaults({"HardLimit=huge"});
  EXPECT_GT(RawExchange(Port(), request).Body().size(), std::size_t{64} << 20);
}

TEST_F(WireTest, FaultsOfPagesAndPicturesAreShownAfterTheRequestIsCarriedOut) {
  BeginWithFaults({"UploadAcceptor.asp=reset:body", "/users/=cut:2", "ListFiles=wrong"});
  EXPECT_EQ(Client().Upload("a.jpg", "12345"), kNoNumber);
  const RawAnswer picture = Get(std::string("/users/") + kFolder + "/a.jpg");
  EXPECT_EQ(picture.Body(), "12");
  const Reply listing = Client().Ask("ListFiles", {{"Username", kUser}, {"ProductID", "1"}});
  EXPECT_EQ(listing.GetValueByVariableName(u"FileName")->size(), 1U);
  EXPECT_EQ(listing.GetValueByVariableName(u"FileDate")->size(), 0U);
  BeginWithFaults({});
  EXPECT_EQ(Client().CheckedListing().size(), 1U);
}

TEST_F(WireTest, StalledAndIdleConnectionsHoldUpNeitherClientsNorTheEnd) {
  const std::string body = FormText({{"ClientAction", Enciphered("HardLimit")}, {"ProductID", "1"}});
  const std::string request = Post("/bv/bin/BVServicePage.asp", body, "Connection: close\r\n");
  BeginWithFaults({"HardLimit=stall:1"});
  auto start = Clock::now();
  EXPECT_EQ(RawExchange(Port(), request).Body(), "HardLimit=1000");
  EXPECT_GE(Clock::now() - start, std::chrono::milliseconds(990));

  BeginWithFaults({"HardLimit=stall"});
  start = Clock::now();
  EXPECT_EQ(RawExchange(Port(), request, 200).bytes, "");
  EXPECT_EQ(Client().AskFor("SoftLimit", "SoftLimit", {{"ProductID", "1"}}), "900");
  std::thread waiting([&] { EXPECT_EQ(RawExchange(Port(), request).bytes, ""); });
  std::this_thread::sleep_for(std::chrono::milliseconds(100));
  End();
  waiting.join();
  EXPECT_LT(Clock::now() - start, std::chrono::seconds(3));
}

TEST_F(WireTest, ClientsThatAreSilentOrTrickleShutNobodyOut) {
  std::vector<FileHandle> slow;
  for (int i = 0; i < 100; ++i) {
    slow.push_back(Connected(Port()));
    if (i % 2 == 0) send(slow.back().Get(), "POST ", 5, MSG_NOSIGNAL);
  }
  EXPECT_EQ(Client().AskFor("HardLimit", "HardLimit", {{"ProductID", "1"}}), "1000");
}

TEST(ConnectionTest, AHeadHasItsTimeAndABodyTakesAsLongAsItArrives) {
  for (const bool isHeadRead : {false, true}) {
    int ends[2];
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends), 0);
    const FileHandle client(ends[1]);
    const FileHandle stop(eventfd(0, EFD_CLOEXEC));
    Connection connection(ends[0], stop.Get());
    std::thread trickle([&] {
      for (int i = 0; i < 30; ++i) {
        send(client.Get(), "x", 1, MSG_NOSIGNAL);
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
      }
      shutdown(client.Get(), SHUT_WR);
    });
    EXPECT_TRUE(connection.AwaitRequest(200));
    if (isHeadRead) connection.EndHead();
    int got = 0;
    for (char byte; connection.read(&byte, 1) > 0;) ++got;
    EXPECT_EQ(got == 30, isHeadRead) << got;
    EXPECT_EQ(connection.IsOver(), !isHeadRead);
    trickle.join();
  }
}

TEST(OptionsTest, BadOptionsAreToldApartFromGoodOnes) {
  const Options options =
      ParseOptions({"--data", "d d", "--port=80", "--port", "81", "--fault", "/a=b/=drip:5", "--fault=*=cut",
                    "--seed-user", "a@b.c", "--seed-password=x=y", "--quota", "5", "--expire-days", "0"});
  EXPECT_EQ(options.data, "d d");
  EXPECT_EQ(ServerName(options, 81), "127.0.0.1:81");
  for (const char* host : {"::1", "[::1]"})
    EXPECT_EQ(ServerName(ParseOptions({"--data", "d", "--tls-self-signed", "--host", host}), 1),
              "https://[::1]:1");
  EXPECT_EQ(options.port, 81);
  EXPECT_EQ(options.seedPassword, "x=y");
  ASSERT_EQ(options.faults.size(), 2U);
  EXPECT_EQ(options.faults[0].where, "/a=b/");
  EXPECT_EQ(options.faults[0].amount, 5U);
  EXPECT_NE(ParseOptions({"--help"}).help.find("--data"), std::string::npos);
  for (const char* bad :
       {"", "--data", "--data d --port 65536", "--data d --port x", "--data d --port 010",
        "--data d --prot 1", "--data d file", "--data d --tls-certificate c", "--data d --tls-key k",
        "--data d --tls-certificate c --tls-key k --tls-self-signed", "--data d --seed-user u",
        "--data d --seed-password p", "--data d --seed-user a#b --seed-password p",
        "--data d --seed-user u --seed-password !",
        "--data d --seed-user u --seed-password p --seed-pictures /nowhere"}) {
    std::istringstream words(bad);
    EXPECT_THROW(ParseOptions({std::istream_iterator<std::string>(words), {}}), OptionError) << bad;
  }
  for (const char* fault :
       {"ListFiles", "=refuse", "ListFiles=", "ListFiles=explode", "ListFiles=reset", "ListFiles=reset:tail",
        "ListFiles=drip", "ListFiles=drip:x", "ListFiles=stall:handshake", "ListFiles=refuse:1",
        "ListFiles=status:99", "ListFiles=cut:-1"})
    EXPECT_FALSE(ParseFault(fault)) << fault;
}

}  // namespace
}  // namespace tarnwick::hosting
