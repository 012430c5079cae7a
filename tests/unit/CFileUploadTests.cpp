// What CFileUpload does beyond single exchanges: session, registration, accounts and the FTP connection.
#include "service/CFileUpload.h"

#include <gtest/gtest.h>

#include "fakes/FakePlatform.h"

namespace tarnwick {
namespace {

using Calls = std::vector<Text>;

class CFileUploadTest : public testing::Test {
 protected:
  CFileUploadTest() { fake.apartment.session.serverName = u"h:8080"; }

  void Answer(const char* body) { fake.http.answers.push_back(HttpAnswer{200, body}); }
  bool Logon(TextView user) {
    Answer("UserAuthenticationStatus=TRUE");
    return client.LogonAs(u"7", user, u"pw", u"{M}");
  }
  bool OpenSession() {
    Answer("PathFromRoot=/p");
    return client.OpenSession();
  }

  // The requests so far, by request name or acceptor page.
  std::string Requests() const {
    std::string names;
    for (const FakeHttp::Sent& sent : fake.http.sent) {
      const std::size_t name = sent.target.find("Request=");
      names += (names.empty() ? "" : " ") +
               (name == std::string::npos ? sent.target.substr(sent.target.rfind('/') + 1)
                                          : sent.target.substr(name + 8, sent.target.find('&') - name - 8));
    }
    return names;
  }

  FakePlatform fake;
  CFileUpload client{fake.apartment};
};

TEST_F(CFileUploadTest, ServerName) {
  client.SetHTTPServer(u"first");
  client.ConnectToServer(u"second");
  // The property keeps what was assigned to it; the apartment speaks to the latest.
  EXPECT_EQ(client.GetHTTPServer(), u"first");
  EXPECT_EQ(fake.apartment.session.serverName, u"second");
  ASSERT_EQ(fake.http.sent.size(), 1U);
  EXPECT_EQ(fake.http.sent[0].host, u"second");
  // Nothing is sent to a name that would break the request.
  for (const TextView name : {u"", u"h\r\nX: y", u"h:0", u"http://h", u"https://", u"https://u@h",
                              u"https://h:0", u"https://h/p", u"https://h\r\nX: y"}) {
    EXPECT_FALSE(client.ConnectToServer(name));
    EXPECT_EQ(client.GetUserBasePath(), name.empty() ? u"http://" : u"") << Utf8FromText(name);
  }
  EXPECT_EQ(fake.http.sent.size(), 1U);
}

TEST_F(CFileUploadTest, EverythingOfASecureSessionGoesOverTls) {
  for (const auto& [name, port] : {std::pair(u"https://h", 443), std::pair(u"HTTPS://h:8443", 8443)}) {
    fake.http.sent.clear();
    client.ConnectToServer(name);
    ASSERT_TRUE(Logon(u"u"));
    for (const char* body : {"AddUser=1001&BasePath=b&UserFolder=f&Password=p&MGUID=m",
                             "UserAuthenticationStatus=TRUE", "ErrorNumber=0", "SendMail=1001"})
      Answer(body);
    EXPECT_EQ(client.AddUser(u"7", u"a@b.c", u"{g}"), u"m");
    EXPECT_EQ(Requests(),
              "EstablishConnection ValidationRequest UserKeyRequest ValidationRequest "
              "CreateFolderAcceptor.asp EmailKeyRequest");
    for (const FakeHttp::Sent& sent : fake.http.sent)
      EXPECT_TRUE(sent.secure && sent.host == u"h" && sent.port == port) << sent.target;
  }
}

TEST_F(CFileUploadTest, EveryFalseLogonRestoresTheUser) {
  ASSERT_TRUE(Logon(u"first"));
  fake.apartment.UserFolderPath = u"C:\\first";
  ASSERT_TRUE(Logon(u"first"));
  for (const char* body :
       {"UserAuthenticationStatus=yes", "UserAuthenticationStatus", "", "ErrorOccured=1"}) {
    Answer(body);
    EXPECT_FALSE(client.LogonAs(u"9", u"second", u"other", u"{N}"));
    EXPECT_EQ(fake.apartment.session.userName, u"first");
    EXPECT_EQ(TextView(fake.apartment.session.password), u"pw");
    EXPECT_EQ(fake.apartment.session.mguid, u"{N}");
    EXPECT_EQ(fake.apartment.session.productNumber, 9);
    EXPECT_EQ(fake.apartment.ftp.userName, u"first");
  }
  EXPECT_FALSE(client.LogonAs(u"no number", u"second", u"other", u"{N}"));
  EXPECT_EQ(fake.apartment.session.userName, u"first");
  EXPECT_EQ(fake.apartment.UserFolderPath, u"C:\\first");
  ASSERT_TRUE(Logon(u"second"));
  EXPECT_EQ(fake.apartment.UserFolderPath, u"") << "the pictures of the first user are not the second one's";
}

TEST_F(CFileUploadTest, LogonRenewsTheListing) {
  ASSERT_TRUE(Logon(u"first"));
  const auto sink = [&](const std::shared_ptr<CUpload>& file) { fake.apartment.listing.all.Add(file); };
  // A second file of the address ends the listing; the first stays.
  Answer("FileName=a&FileName=b&FileURL=u&FileURL=u&FileSize=1&FileSize=2&FileDate=d&FileDate=d");
  EXPECT_FALSE(client.ListFilesForUser(sink));
  EXPECT_TRUE(client.FileExists(u"a") && !client.FileExists(u"A") && !client.FileExists(u"b"));

  fake.apartment.listing.isCurrent = fake.apartment.listing.isLoaded = true;
  EXPECT_TRUE(client.ListFilesForUser(sink));
  EXPECT_EQ(Requests(), "ValidationRequest ListFilesRequest");

  Answer("UserAuthenticationStatus=FALSE");
  EXPECT_FALSE(client.LogonAs(u"9", u"second", u"other", u"{N}"));
  EXPECT_TRUE(client.ListIsCurrent() && fake.apartment.listing.isLoaded)
      << "what is shown is still the first user's";
  ASSERT_TRUE(Logon(u"second"));
  EXPECT_TRUE(client.IsAccountEmpty());
  EXPECT_FALSE(fake.apartment.listing.isCurrent);
  EXPECT_FALSE(fake.apartment.listing.isLoaded);
  // Current but empty: the service is asked.
  fake.apartment.listing.isCurrent = true;
  EXPECT_FALSE(client.ListFilesForUser(sink));
}

TEST_F(CFileUploadTest, CollectionsMayCallTheClient) {
  // A collection is code of the host, which may ask the service for more while it takes a file.
  Answer("FileName=a&FileName=b&FileURL=u1&FileURL=u2&FileSize=1&FileSize=2&FileDate=d1&FileDate=d2");
  Text names;
  EXPECT_TRUE(client.ListFilesForUser([&](const std::shared_ptr<CUpload>& file) {
    EXPECT_EQ(client.CanUploadFile(), 1004);
    for (const SharedText& text : {file->FileName, file->FileDate, file->FilePath}) names += Text(text);
  }));
  EXPECT_EQ(names, u"ad1u1bd2u2");
}

TEST_F(CFileUploadTest, ListedRecordsStandAlone) {
  // More than share a block of memory.
  std::string reply;
  Text expected;
  for (int i = 0; i < 150; ++i) {
    const std::string number = std::to_string(i);
    std::string name(static_cast<std::size_t>(i), 'n');
    name.append("\u00e9\U0001F600").append(number);
    reply.append("&FileName=").append(name).append("&FileURL=u%2F").append(name);
    reply.append("&FileDate=d&FileSize=").append(number);
    const Text listed = TextFromUtf8(name).value();
    expected.append(listed)
        .append(u"|u/")
        .append(listed)
        .append(u"|d")
        .append(TextFromNumber(i))
        .append(u"\n");
  }
  Answer(reply.c_str());
  std::vector<std::shared_ptr<CUpload>> files;
  ASSERT_TRUE(client.ListFilesForUser([&](const std::shared_ptr<CUpload>& file) { files.push_back(file); }));
  Text listed;
  for (const auto& file : files) {
    listed += Text(file->FileName) + u"|" + Text(file->FilePath) + u"|" + Text(file->FileDate) +
              TextFromNumber(static_cast<std::int64_t>(file->FileSize)) + u"\n";
  }
  EXPECT_EQ(listed, expected);

  // Another name changes nothing else, and a copy does not need the listing.
  const CUpload copy = *files[3];
  files[3]->FileName = u"other";
  EXPECT_EQ(files[3]->FilePath, copy.FilePath);
  files.clear();
  EXPECT_EQ(copy.FileName, u"nnn\u00e9\U0001F6003");
  EXPECT_EQ(copy.FilePath, u"u/nnn\u00e9\U0001F6003");
}

TEST_F(CFileUploadTest, RegistrationRestoresAttributesOnEveryWayOut) {
  fake.files.files[u"C:\\a.jpg"] = {12, attribute::kReadOnly};
  for (const auto& [body, url] : {std::pair{"FileURL=u", u"u"}, {"", u""}, {"ErrorOccured=1", u""}}) {
    Answer(body);
    EXPECT_EQ(client.SaveUploadFile(u"C:\\a.jpg"), url);
  }
  EXPECT_EQ(fake.files.attributesSet, (std::vector<std::uint32_t>{0, 1, 0, 1, 0, 1}));
  const CUpload& record = *client.GetUploadObject();
  EXPECT_EQ(Text(record.FileName) + u"|" + Text(record.FilePath), u"a.jpg|C:\\a.jpg");
  EXPECT_EQ(client.SaveUploadFile(u"C:\\missing.jpg"), u"");
  EXPECT_EQ(fake.http.sent.size(), 3U);
  // On a medium that cannot be written the file is registered as it is, and nothing is restored.
  fake.http.onPost = [&](const FakeHttp::Sent&) { fake.files.writable = true; };
  fake.files.writable = false;
  fake.files.attributesSet.clear();
  Answer("FileURL=u");
  EXPECT_EQ(client.SaveUploadFile(u"C:\\a.jpg"), u"u");
  EXPECT_TRUE(fake.files.attributesSet.empty());
}

// --- Accounts ---

struct Transcript {
  std::vector<const char*> answers;
  const char* requests;
  const char* result;
};

constexpr const char* kLoggedOn = "UserAuthenticationStatus=TRUE";
constexpr const char* kRefused = "UserAuthenticationStatus=FALSE";
constexpr const char* kDone = "ErrorNumber=0";

TEST_F(CFileUploadTest, AddUserBranches) {
  const char* added = "AddUser=1001&BasePath=b&UserFolder=f&Password=p&MGUID=%7Bm%7D";
  const char* addedWithoutMguid = "AddUser=1001&BasePath=b%5C&UserFolder=f&Password=p&MGUID=";
  const char* finished = "UserKeyRequest ValidationRequest CreateFolderAcceptor.asp EmailKeyRequest";
  const char* folderFailed =
      "UserKeyRequest ValidationRequest CreateFolderAcceptor.asp "
      "ValidUserID DeleteFolderAcceptor.asp ValidationRequest DeleteUserRequest";
  const Transcript transcripts[] = {
      {{added, kLoggedOn, "ErrorNumber=-2147220840", "SendMail=1001"}, finished, "{m}"},
      {{added, kLoggedOn, kDone, "ErrorOccured=1"}, finished, "{m}"},
      {{addedWithoutMguid, kLoggedOn, kDone, "SendMail=1001"}, finished, "1002"},
      {{added, kRefused, "ValidUser=TRUE", kDone, kLoggedOn, "DeleteUser=1001"},
       "UserKeyRequest ValidationRequest ValidUserID DeleteFolderAcceptor.asp ValidationRequest "
       "DeleteUserRequest",
       "1004"},
      {{added, kLoggedOn, "ErrorNumber=-2147220878", "ValidUser=TRUE", kDone, kLoggedOn, "DeleteUser=1001"},
       folderFailed,
       "1004"},
      {{added, kLoggedOn, "<html>", "ValidUser=TRUE", kDone, kLoggedOn, "DeleteUser=1001"},
       folderFailed,
       "1004"},
      {{"AddUser=1011"}, "UserKeyRequest", "1011"},
      {{"AddUser=x"}, "UserKeyRequest", ""},
      {{"ErrorOccured=1"}, "UserKeyRequest", "1004"},
      {{"AddUser=1001&BasePath=b&UserFolder=f&MGUID=m"}, "UserKeyRequest", ""},
  };
  for (const Transcript& transcript : transcripts) {
    for (const char* body : transcript.answers) Answer(body);
    EXPECT_EQ(Utf8FromText(client.AddUser(u"7", u"a+1@b.c", u"{g}")), transcript.result)
        << transcript.answers[0];
    EXPECT_EQ(Requests(), transcript.requests);
    EXPECT_TRUE(fake.http.answers.empty());
    fake.http.sent.clear();
    fake.http.answers.clear();
  }
}

TEST_F(CFileUploadTest, AddUserSendsWhatTheServiceIssued) {
  for (const char* body :
       {"AddUser=1001&BasePath=b&UserFolder=f+1&Password=p%26w&MGUID=m", kLoggedOn, kDone, "SendMail=1001"})
    Answer(body);
  ASSERT_EQ(client.AddUser(u"7", u"a+b@c.d", u"{g&}"), u"m");
  EXPECT_EQ(fake.http.sent[0].body, "ClientAction=dLJT4bA&UserName=a%2Bb@c.d&ProductID=7&MGUID={g&}");
  EXPECT_EQ(fake.http.sent[1].body,
            "ClientAction=l_-7S$0$LM@A&UserName=DCuKqB&Password=52&ProductID=7&MGUID=m");
  EXPECT_EQ(fake.http.sent[2].body,
            "UsersBaseUrl=http%3A%2F%2Fh%3A8080%2Fusers%2F&Folder=f%201&Action=5&User=a%2Bb%40c.d&"
            "Password=p%26w&ProductID=4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E");
  EXPECT_EQ(fake.http.sent[3].body, "ClientAction=VASOQCb$$0&UserName=a%2Bb@c.d&ProductID=7&NewUser=1");
  EXPECT_EQ(fake.apartment.session.userName, u"a+b@c.d");
}

TEST_F(CFileUploadTest, DeleteUserBranches) {
  const char* valid = "ValidUser=TRUE";
  const char* asFarAsTheFolder = "ValidUserID DeleteFolderAcceptor.asp";
  const char* whole = "ValidUserID DeleteFolderAcceptor.asp ValidationRequest DeleteUserRequest";
  const Transcript transcripts[] = {
      {{valid, "ErrorNumber=-2147220840", kLoggedOn, "DeleteUser=1001"}, whole, "1001"},
      {{valid, kDone, kLoggedOn, "ErrorOccured=1"}, whole, "1004"},
      {{valid, kDone, kLoggedOn, "Other=1"}, whole, "0"},
      {{valid, kDone, kRefused}, "ValidUserID DeleteFolderAcceptor.asp ValidationRequest", "1002"},
      {{valid, "ErrorNumber=-2147220878"}, asFarAsTheFolder, "1002"},
      {{valid, "ErrorNumber=x"}, asFarAsTheFolder, "1004"},
      {{"ErrorOccured=1"}, "ValidUserID", "1003"},
  };
  fake.apartment.session.mguid = u"{S}";
  for (const Transcript& transcript : transcripts) {
    for (const char* body : transcript.answers) Answer(body);
    EXPECT_EQ(std::to_string(client.DeleteUser(u"7", u"a+b@c.d.e", u"p&w")), transcript.result);
    EXPECT_EQ(Requests(), transcript.requests);
    for (const FakeHttp::Sent& sent : fake.http.sent) {
      if (sent.target == "/httpupload/DeleteFolderAcceptor.asp") {
        EXPECT_EQ(sent.body,
                  "UsersBaseUrl=http%3A%2F%2Fh%3A8080%2Fusers%2F&Folder=a%2Bb%40c-d-e&Action=6&"
                  "User=a%2Bb%40c.d.e&Password=p%26w&ProductID=4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E");
      } else if (sent.target.find("ValidationRequest") != std::string::npos) {
        EXPECT_TRUE(sent.body.ends_with("&ProductID=7&MGUID={S}")) << sent.body;
      } else if (sent.target.find("DeleteUserRequest") != std::string::npos) {
        EXPECT_TRUE(sent.target.ends_with("&Flag=1"));
        EXPECT_EQ(sent.body, "ClientAction=kAUN1CTu_4&UserName=a%2Bb@c.d.e&ProductID=7&Password=p&w");
      }
    }
    fake.http.sent.clear();
    fake.http.answers.clear();
  }
}

// --- FTP ---

TEST_F(CFileUploadTest, FtpSessionInOrder) {
  ASSERT_TRUE(Logon(u"u"));
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"");
  ASSERT_TRUE(OpenSession());
  EXPECT_TRUE(fake.apartment.ftp.connected);
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"b");
  // Opening again closes the connection first, whatever the server makes of the farewell. A refused folder
  // leaves the connection open.
  fake.internet.takesCommands = fake.internet.changesDirectory = false;
  ASSERT_TRUE(OpenSession());
  EXPECT_FALSE(fake.apartment.ftp.connected);
  fake.internet.directory.reset();
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"");
  client.DisconnectFromServer();
  client.DisconnectFromServer();
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"");
  EXPECT_EQ(fake.internet.calls, (Calls{u"open FileUploadClient", u"connect h|21|u|pw", u"cd /p", u"pwd",
                                        u"get a b", u"QUIT", u"close", u"open FileUploadClient",
                                        u"connect h|21|u|pw", u"cd /p", u"pwd", u"QUIT", u"close"}));
}

TEST_F(CFileUploadTest, FtpSessionThatDoesNotOpen) {
  ASSERT_TRUE(Logon(u"u"));
  for (bool* working : {&fake.internet.opens, &fake.internet.connects}) {
    *working = false;
    EXPECT_FALSE(client.OpenSession());
    EXPECT_FALSE(fake.apartment.ftp.connected);
    *working = true;
  }
  EXPECT_EQ(Requests(), "ValidationRequest");
  fake.internet.calls.clear();
  {
    // The object that goes takes the apartment's connection along.
    CFileUpload other(fake.apartment);
    EXPECT_TRUE(other.OpenSession());
  }
  EXPECT_EQ(fake.internet.calls,
            (Calls{u"open FileUploadClient", u"connect h|21|u|pw", u"cd ", u"QUIT", u"close"}));
}

// FTP would send the password in clear.
TEST_F(CFileUploadTest, SecureSessionFetchesFilesWithoutFtp) {
  ASSERT_TRUE(Logon(u"u"));
  ASSERT_TRUE(OpenSession());
  fake.internet.calls.clear();
  client.SetHTTPServer(u"https://h");
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"") << "over the connection that is open still";
  EXPECT_EQ(fake.internet.calls, Calls());
  Answer(kRefused);
  EXPECT_FALSE(client.OpenSession());
  EXPECT_EQ(client.DownloadFile(u"a", u"b"), u"");
  Answer(kLoggedOn);
  Answer("PathFromRoot=%5Cusers%5Ca b");
  EXPECT_TRUE(client.OpenSession());
  EXPECT_EQ(Requests(), "ValidationRequest PathFromRoot ValidationRequest ValidationRequest PathFromRoot");
  EXPECT_EQ(fake.http.sent[3].body, fake.http.sent[0].body) << "the user and the product of the session";

  const struct {
    const char16_t* name;
    HttpAnswer answer;    // status 0: cut
    const char* fetched;  // nothing when it is empty
    std::size_t room = SIZE_MAX;
  } rows[] = {
      {u"a.jpg", {200, "new"}, "a.jpg"},
      {u"my \u00e9&#%.jpg", {200, "new"}, "my%20%C3%A9%26%23%25.jpg"},
      {u"a.jpg", {404, "none"}, "a.jpg"},
      {u"a.jpg", {0, "ne"}, "a.jpg"},
      {u"a.jpg", {200, "new"}, "a.jpg", 2},
      {u"", {200, "new"}, ""},
      {u"..", {200, "new"}, ""},
      {u"x/a.jpg", {200, "new"}, ""},
      {u"x\\a.jpg", {200, "new"}, ""},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(Utf8FromText(row.name) + " " + std::to_string(row.answer.status));
    fake.files.files = {{u"C:\\b", {3, 0, "old"}}};
    fake.files.mostWritten = row.room;
    fake.http.sent.clear();
    fake.http.answers = {row.answer};
    const bool whole = *row.fetched != '\0' && row.answer.status == 200 && row.room > 2;
    EXPECT_EQ(client.DownloadFile(row.name, u"C:\\b"), whole ? u"C:\\b" : u"");
    EXPECT_EQ(fake.files.At(u"C:\\b").bytes, whole ? "new" : "old");
    EXPECT_EQ(fake.files.writers, 0);
    ASSERT_EQ(fake.http.sent.size(), *row.fetched != '\0' ? 1U : 0U);
    for (const FakeHttp::Sent& sent : fake.http.sent) {
      EXPECT_EQ(sent.target, std::string("/users/a%20b/") + row.fetched);
      EXPECT_TRUE(sent.host == u"h" && sent.port == 443);
    }
  }
  client.DisconnectFromServer();
  fake.http.sent.clear();
  EXPECT_EQ(client.DownloadFile(u"a.jpg", u"C:\\b"), u"");
  EXPECT_TRUE(fake.http.sent.empty());
  // The one that was open before has been closed, and there was no other.
  EXPECT_EQ(fake.internet.calls, (Calls{u"QUIT", u"close"}));
  // Nor does FTP get what belongs to a session over TLS.
  fake.http.answers.clear();
  Answer(kLoggedOn);
  ASSERT_TRUE(client.LogonAs(u"7", u"u", u"p", u""));
  client.SetHTTPServer(u"h");
  EXPECT_TRUE(fake.apartment.session.password.IsEmpty()) << "it would go in clear text";
  OpenSession();
  EXPECT_EQ(fake.internet.calls.at(3), u"connect |21||");
}

TEST_F(CFileUploadTest, FtpProxy) {
  const auto connectedTo = [&] {
    fake.internet.calls.clear();
    EXPECT_TRUE(OpenSession());
    client.DisconnectFromServer();
    return Utf8FromText(fake.internet.calls.at(1)).substr(8);
  };
  FakeRegistry::Values& settings = fake.registry.InternetSettings();
  settings[u"ProxyServer"] = FakeRegistry::String("http=H1:80;FTP=Proxy:2121");
  for (const FakeRegistry::Value& enabled : {FakeRegistry::String("1"), FakeRegistry::Number(1),
                                             FakeRegistry::Value{3, std::string("\1\0\0\0", 4)}}) {
    settings[u"ProxyEnable"] = enabled;
    fake.apartment.ftp.proxyStyle = ProxyStyle::kUserAtHostColonPort;
    ASSERT_TRUE(Logon(u"u"));
    EXPECT_EQ(connectedTo(), "proxy|0|u@h:21|pw");
    // Rewritten once per log-on, not once per connection.
    EXPECT_EQ(connectedTo(), "proxy|0|u@h:21|pw");
    EXPECT_EQ(fake.apartment.ftp.proxyPort, u"2121");
    fake.apartment.ftp.proxyStyle = ProxyStyle::kUserAtHostBlankPort;
    ASSERT_TRUE(Logon(u"v"));
    EXPECT_EQ(connectedTo(), "proxy|0|v@h 21|pw");
  }
  settings[u"ProxyServer"] = FakeRegistry::String("Plain:3128");
  ASSERT_TRUE(Logon(u"u"));
  EXPECT_EQ(connectedTo(), "plain|0|u@h 21|pw");

  // An entry without an address; then the same setting, not in use.
  settings[u"ProxyServer"] = FakeRegistry::String("ftp;http=h1:80");
  for (const FakeRegistry::Value& enabled : {FakeRegistry::Number(1), FakeRegistry::Number(0)}) {
    settings[u"ProxyEnable"] = enabled;
    ASSERT_TRUE(Logon(u"u"));
    EXPECT_EQ(connectedTo(), "h|21|u|pw");
    settings[u"ProxyServer"] = FakeRegistry::String("Plain:3128");
  }
}

}  // namespace
}  // namespace tarnwick
