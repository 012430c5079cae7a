#include <signal.h>
#include <sys/resource.h>

#include <thread>

#include "HostingFixture.h"
#include "hosting/Database.h"

namespace tarnwick::hosting {
namespace {

using Files = std::map<std::string, std::string>;

// No file may grow beyond so many bytes.
class FileSizeLimit {
 public:
  explicit FileSizeLimit(rlim_t bytes) {
    signal(SIGXFSZ, SIG_IGN);
    getrlimit(RLIMIT_FSIZE, &before_);
    const rlimit limit{bytes, before_.rlim_max};
    setrlimit(RLIMIT_FSIZE, &limit);
  }
  FileSizeLimit(const FileSizeLimit&) = delete;
  FileSizeLimit& operator=(const FileSizeLimit&) = delete;
  ~FileSizeLimit() { setrlimit(RLIMIT_FSIZE, &before_); }

 private:
  rlimit before_{};
};

class AcceptorTest : public HostingTest {
 protected:
  int PostUpload(const std::string& body, const char* type = kMultipartType) {
    const auto result = Client().Http().Post("/httpupload/UploadAcceptor.asp", body, type);
    return result ? result->status : 0;
  }
};

TEST_F(AcceptorTest, FilesAreUploadedReplacedRenamedAndDeleted) {
  std::string bytes(300'000, '\0');
  for (std::size_t i = 0; i < bytes.size(); ++i) bytes[i] = static_cast<char>(i * i >> 7);
  bytes += "\r\n------b0undar\r\n--\r\n";  // looks like a boundary for a while
  EXPECT_EQ(Client().Upload("a b.jpg", bytes), kStored);
  EXPECT_EQ(Client().Upload("a b.jpg", bytes), kNothingChanged);
  EXPECT_EQ(Client().Upload("bl\xC3\xBCte.gif", ""), kStored);
  EXPECT_EQ(Client().CheckedListing(), (Files{{"a b.jpg", bytes}, {"bl\xC3\xBCte.gif", ""}}));
  bytes[5] ^= 1;
  EXPECT_EQ(Client().Upload("a b.jpg", bytes), kStored);

  EXPECT_EQ(Client().Rename("a b.jpg", "bl\xC3\xBCte.gif"), kName);
  EXPECT_EQ(Client().Rename("gone.jpg", "b.jpg"), kNotThere);
  EXPECT_EQ(Client().Rename("a b.jpg", "b+b.jpg"), kStored);
  EXPECT_EQ(Client().CheckedListing(), (Files{{"b+b.jpg", bytes}, {"bl\xC3\xBCte.gif", ""}}));
  EXPECT_EQ(Client().Delete("a b.jpg"), kNotThere);
}

TEST_F(AcceptorTest, NamesAreRefusedThatNoClientCouldKeep) {
  ASSERT_EQ(Client().Upload("a.jpg", "1"), kStored);
  for (const std::string name :
       {"", "..", "../x", "x\\y", "a:b", "a?b", "a|b", "a#b", "a%b", "a\tb", "a\x7F"})
    EXPECT_EQ(Client().Upload(name, "1"), kName) << name;
  for (const std::string name : {"", "..", "../x", "a\"b", "a\nb", "%2e%2e"}) {
    EXPECT_EQ(Client().Rename("a.jpg", name), kName) << name;
    EXPECT_EQ(Client().Delete(name), kName) << name;
  }
  EXPECT_EQ(Client().Upload(std::string(256, 'x'), "1"), kName);
  EXPECT_EQ(Client().CheckedListing(), (Files{{"a.jpg", "1"}}));
}

TEST_F(AcceptorTest, NamesThatDifferInLetterCaseOnlyAreTaken) {
  ASSERT_EQ(Client().Upload("\xC3\x84hre.jpg", "1"), kStored);
  ASSERT_EQ(Client().Upload("b.jpg", "2"), kStored);
  EXPECT_EQ(Client().Upload("\xC3\xA4HRE.jpg", "3"), kName);
  EXPECT_EQ(Client().Rename("b.jpg", "\xC3\xA4hre.JPG"), kName);
  EXPECT_EQ(Client().Rename("b.jpg", "B.jpg"), kStored);  // not another file's
  EXPECT_EQ(Client().CheckedListing(), (Files{{"\xC3\x84hre.jpg", "1"}, {"B.jpg", "2"}}));
}

TEST_F(AcceptorTest, EveryCallNeedsUserPasswordAndProduct) {
  ASSERT_EQ(Client().Upload("a.jpg", "1"), kStored);
  EXPECT_EQ(Client().Upload("b.jpg", "1", kUser, "pa55"), kRefused);
  EXPECT_EQ(Client().Upload("b.jpg", "1", "Pat.lee+x@mail.example.com"), kRefused);
  EXPECT_EQ(Client().Upload("b.jpg", "1", kUser, kPassword, "4a7e2c51-93d0-4f1c-b2e9-6c1d08f3a270"),
            kRefused);
  EXPECT_EQ(Client().Form("DeleteAcceptor.asp", {{"FileName", "a.jpg"}}, kUser, ""), kRefused);
  EXPECT_EQ(Client().Form("RenameAcceptor.asp", {{"OldFileName", "a.jpg"}, {"NewFileName", "b"}}, "x@y.z"),
            kRefused);
  EXPECT_EQ(Client().CheckedListing(), (Files{{"a.jpg", "1"}}));
}

TEST_F(AcceptorTest, MalformedRequestsAreRefusedAndChangeNothing) {
  const Fields fields = {{"UsersBaseUrl", "u"},
                         {"Flag", "0"},
                         {"User", kUser},
                         {"Password", kPassword},
                         {"ProductID", kProduct}};
  const std::string good = UploadBody(fields, "a.jpg", "1");
  const std::string longLine(200'000, 'x');
  EXPECT_EQ(PostUpload(good.substr(0, good.size() - 6)), 400);           // no closing boundary
  EXPECT_EQ(PostUpload(good.substr(good.find("\r\n------") + 2)), 400);  // first field missing
  EXPECT_EQ(PostUpload(UploadBody({fields.begin(), fields.end() - 1}, "a.jpg", "1")), 400);
  EXPECT_EQ(PostUpload(good, "multipart/form-data; boundary=other"), 400);
  EXPECT_EQ(PostUpload(good, kFormType), 400);
  EXPECT_EQ(PostUpload(UploadBody({{"UsersBaseUrl", longLine}}, "a.jpg", "1")), 400);
  EXPECT_EQ(PostUpload(UploadBody(fields, "\xFF.jpg", "1")), 400);

  const auto form = [&](const char* page, const std::string& body) {
    const auto result = Client().Http().Post(std::string("/httpupload/") + page, body, kFormType);
    return result ? result->status : 0;
  };
  EXPECT_EQ(form("DeleteAcceptor.asp", "UsersBaseUrl=u&FileName=%FF&User=u&Password=p&ProductID=x"), 400);
  EXPECT_EQ(form("RenameAcceptor.asp", "UsersBaseUrl=u&OldFileName=a&User=u&Password=p&ProductID=x"), 400);
  EXPECT_EQ(form("DeleteAcceptor.asp", std::string((1 << 20) + 1, 'a')), 413);
  EXPECT_EQ(form("OtherAcceptor.asp", ""), 404);
  Client().Http().set_compress(true);
  EXPECT_EQ(form("DeleteAcceptor.asp", std::string((1 << 20) + 1, 'a')), 415);
  Client().Http().set_compress(false);

  EXPECT_TRUE(std::filesystem::is_empty(Data() / "work"));
  EXPECT_TRUE(Client().CheckedListing().empty());
  EXPECT_EQ(PostUpload(good), 200);
  EXPECT_EQ(Client().CheckedListing(), (Files{{"a.jpg", "1"}}));
}

TEST_F(AcceptorTest, WhatCannotBeStoredIsNotAcknowledgedAndChangesNothing) {
  const Fields account = {{"UserName", kUser}, {"ProductID", "1"}, {"Password", kPassword}};
  ASSERT_EQ(Client().Upload("a.jpg", "old"), kStored);
  {
    // A disk without room. The larger upload fails while it arrives, and is longer than what a server that
    // closes takes.
    const FileSizeLimit limit(1);
    for (const std::size_t size : {std::size_t{10}, std::size_t{20} << 20}) {
      EXPECT_EQ(Client().Upload("a.jpg", std::string(size, 'x')), kNoNumber) << size;
      EXPECT_FALSE(Client().IsLost()) << size;
    }
    EXPECT_EQ(Client().AskFor("AddUser", "AddUser", {{"UserName", "x@y"}, {"ProductID", "1"}, {"MGUID", ""}}),
              "(error)");
    EXPECT_EQ(Client().AskFor("DeleteUser", "DeleteUser", account), "(error)");
  }
  Database other(Data() / "hosting.sqlite");
  other.Run("BEGIN IMMEDIATE");
  EXPECT_EQ(Client().Delete("a.jpg"), kNoNumber);
  EXPECT_FALSE(Client().IsLost());
  EXPECT_EQ(Client().AskFor("DeleteUser", "DeleteUser", account), "(error)");
  EXPECT_EQ(Client().CheckedListing(), (Files{{"a.jpg", "old"}}));
  EXPECT_TRUE(std::filesystem::is_empty(Data() / "work"));
  other.Run("ROLLBACK");
  EXPECT_EQ(Client().Delete("a.jpg"), kStored);
}

TEST_F(AcceptorTest, UploadsAtTheSameTimeStayWholeAndWithinTheQuota) {
  Begin([](Options& options) { options.quota = 5 * 50'000; });
  std::vector<std::thread> clients;
  for (char letter = 'a'; letter < 'i'; ++letter)
    clients.emplace_back([this, letter] {
      HostingClient client(Port());
      client.Upload(std::string(1, letter) + ".jpg", std::string(50'000, letter));
      client.Upload("same.jpg", std::string(10, letter));
    });
  for (std::thread& client : clients) client.join();
  Files files = Client().CheckedListing();
  std::size_t used = 0;
  for (const auto& [name, bytes] : files) {
    EXPECT_EQ(bytes, std::string(bytes.size(), bytes[0])) << name;
    used += bytes.size();
  }
  EXPECT_GE(files.size(), 5U);
  EXPECT_LE(used, 250'000U);
}

}  // namespace
}  // namespace tarnwick::hosting
