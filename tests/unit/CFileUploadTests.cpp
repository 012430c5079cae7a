#include <gtest/gtest.h>

#include "fakes/FakePlatform.h"
#include "service/CFileUpload.h"
#include "service/modEnctyption.h"

namespace tarnwick {
namespace {

std::string Enciphered(TextView text) { return Utf8FromText(CFileUpload::EnCodeString(EncryptParameter(text))); }

class CFileUploadTest : public testing::Test {
 protected:
  void Answer(const char* body) { fake.http.answers.push_back({200, body}); }
  bool Logon(TextView user) { return client.LogonAs(u"7", user, u"pw", u"{M}"); }

  FakePlatform fake;
  CFileUpload client{fake.apartment};
};

TEST_F(CFileUploadTest, LogonIsOneExchangeOnTheWire) {
  client.SetHTTPServer(u"h:8080");
  Answer("UserAuthenticationStatus=true");
  ASSERT_TRUE(Logon(u"a+b@c.d"));
  ASSERT_EQ(fake.http.sent.size(), 1U);
  EXPECT_EQ(fake.http.sent[0].port, 8080);
  EXPECT_EQ(fake.http.sent[0].target, "/bv/bin/BVServicePage.asp?Request=ValidationRequest&Flag=0");
  EXPECT_EQ(fake.http.sent[0].body, "ClientAction=" + Enciphered(u"UserValidate") + "&UserName=" +
                                        Enciphered(u"a+b@c.d") + "&Password=" + Enciphered(u"pw") +
                                        "&ProductID=7&MGUID={M}");
}

TEST_F(CFileUploadTest, EveryFalseLogonRestoresTheUser) {
  client.SetHTTPServer(u"h");
  Answer("UserAuthenticationStatus=TRUE");
  ASSERT_TRUE(Logon(u"first"));
  for (const char* body : {"UserAuthenticationStatus=yes", "UserAuthenticationStatus", "", "ErrorOccured=1"}) {
    Answer(body);
    EXPECT_FALSE(client.LogonAs(u"9", u"second", u"other", u"{N}"));
    EXPECT_EQ(fake.apartment.session.userName, u"first");
    EXPECT_EQ(fake.apartment.session.password, u"pw");
    EXPECT_EQ(fake.apartment.session.mguid, u"{N}");
    EXPECT_EQ(fake.apartment.session.productNumber, 9);
  }
  EXPECT_FALSE(client.LogonAs(u"no number", u"second", u"other", u"{N}"));
  EXPECT_EQ(fake.apartment.session.userName, u"first");
}

TEST_F(CFileUploadTest, ListingKeepsWhatItReadBeforeAnError) {
  client.SetHTTPServer(u"h");
  std::vector<Text> keys;
  const auto sink = [&](const std::shared_ptr<CUpload>&, TextView key) { keys.emplace_back(key); };
  Answer("FileName=a&FileName=b&FileURL=u1&FileURL=u2&FileSize=1&FileDate=d&FileDate=d");
  EXPECT_FALSE(client.ListFilesForUser(sink));
  EXPECT_EQ(keys, (std::vector<Text>{u"u1"}));
  Answer("FileName&FileURL&FileSize&FileDate");
  EXPECT_TRUE(client.ListFilesForUser(sink));
  Answer("FileURL=u");
  EXPECT_FALSE(client.ListFilesForUser(sink));
  fake.apartment.allFiles.Add(std::make_shared<CUpload>());
  fake.apartment.listingIsCurrent = true;
  EXPECT_TRUE(client.ListFilesForUser(sink));
  EXPECT_EQ(fake.http.sent.size(), 3U);
}

TEST_F(CFileUploadTest, RegistrationRestoresAttributesOnEveryWayOut) {
  client.SetHTTPServer(u"h");
  fake.files.files[u"C:\\a b.jpg"] = {12, attribute::kReadOnly};
  Answer("FileURL=http%3A%2F%2Fh%2Fa");
  EXPECT_EQ(client.SaveUploadFile(u"C:\\a b.jpg"), u"http://h/a");
  EXPECT_NE(fake.http.sent[0].body.find("&FileName=a%20b.jpg&FileSize=12&Username="), std::string::npos);
  EXPECT_EQ(client.SaveUploadFile(u"C:\\a b.jpg"), u"");
  EXPECT_EQ(fake.files.attributesSet, (std::vector<std::uint32_t>{0, 1, 0, 1}));
  EXPECT_EQ(client.SaveUploadFile(u"C:\\missing.jpg"), u"");
  EXPECT_EQ(fake.http.sent.size(), 2U);
}

TEST_F(CFileUploadTest, FailureValues) {
  client.SetHTTPServer(u"h");
  EXPECT_EQ(client.RenameFile(u"7", u"u", u"a", u"b"), 1033);
  EXPECT_EQ(client.DeleteFileForUser(u"a"), 1004);
  EXPECT_EQ(client.CanUploadFile(), 1004);
  EXPECT_EQ(client.GetKeyForUser(u"7", u"u"), u"1004");
  EXPECT_EQ(client.GetHardLimit(u"7"), 0);
  EXPECT_EQ(client.ManagePassword(u"7", u"u", u"a", u"b"), 1004);
  EXPECT_EQ(client.AddUser(u"7", u"u", u""), u"1004");
  EXPECT_FALSE(client.GetTotalUsedQuota(u"7", u"u"));
  EXPECT_FALSE(client.ConnectToServer(u"h"));
}

TEST_F(CFileUploadTest, AddUserRollsBackWhenTheNewUserCannotLogOn) {
  client.SetHTTPServer(u"h");
  Answer("AddUser=1001&BasePath=x&UserFolder=f&Password=p&MGUID=m");
  Answer("UserAuthenticationStatus=FALSE");
  Answer("ValidUser=TRUE");
  Answer("ErrorNumber=0");
  Answer("UserAuthenticationStatus=TRUE");
  Answer("DeleteUser=1001");
  EXPECT_EQ(client.AddUser(u"7", u"a@b.c", u""), u"1004");
  EXPECT_TRUE(fake.http.answers.empty());
  EXPECT_EQ(fake.http.sent[3].target, "/httpupload/DeleteFolderAcceptor.asp");
  EXPECT_EQ(fake.http.sent[3].body,
            "UsersBaseUrl=http%3A%2F%2Fh%2Fusers%2F&Folder=a%40b-c&Action=6&User=a%40b.c&Password=p&"
            "ProductID=4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E");
}

TEST_F(CFileUploadTest, FtpSessionGoesThroughTheProxyOncePerLogon) {
  client.SetHTTPServer(u"h:8080");
  auto& settings = fake.registry.keys[u"Software\\Microsoft\\Windows\\CurrentVersion\\Internet Settings"];
  settings[u"ProxyEnable"] = {1, std::string("1") + '\0'};
  settings[u"ProxyServer"] = {1, std::string("Proxy:3128") + '\0'};
  Answer("UserAuthenticationStatus=TRUE");
  ASSERT_TRUE(Logon(u"u"));
  Answer("PathFromRoot=%2Fusers%2Fu");
  ASSERT_TRUE(client.OpenSession());
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"b");
  client.DisconnectFromServer();
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"");
  EXPECT_EQ(fake.internet.calls, (std::vector<Text>{u"proxy|0|u@h:21|pw", u"cd /users/u", u"get a b", u"QUIT",
                                                    u"close"}));
}

TEST(EnCodeString, EscapesFourCharacters) {
  EXPECT_EQ(CFileUpload::EnCodeString(u"100%+#& =?"), u"100%25%2B%23%26 =?");
  EXPECT_EQ(CFileUpload::EnCodeString(u"%2B"), u"%252B");
}

}  // namespace
}  // namespace tarnwick
