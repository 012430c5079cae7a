#include <regex>

#include "HostingFixture.h"

namespace tarnwick::hosting {
namespace {

constexpr const char* kDate = R"(\d{1,2}/\d{1,2}/\d{4} (1[0-2]|[1-9]):\d\d:\d\d [AP]M)";
constexpr const char* kError = "(error)";

class ServicePageTest : public HostingTest {};

TEST_F(ServicePageTest, EveryActionAnswersKnownAndUnknownUsers) {
  ASSERT_EQ(Client().Upload("a.jpg", "12345"), kStored);
  struct Row {
    const char* action;
    Fields parameters;  // "*" stands for the user
    const char* variable;
    const char* known;  // regular expressions
    const char* unknown;
  };
  // One spelling or the other, as the library sends them.
  const Fields userName = {{"ProductID", "1"}, {"UserName", "*"}};
  const Fields username = {{"ProductID", "1"}, {"Username", "*"}};
  const auto with = [](Fields fields, std::initializer_list<Fields::value_type> more) {
    fields.insert(fields.end(), more);
    return fields;
  };
  const Row rows[] = {
      {"PathFromRoot", username, "PathFromRoot", "/users/.*@mail-example-com", kError},
      {"FileUpload", with(username, {{"FileName", "new one.jpg"}, {"FileSize", "5"}}), "FileURL",
       "http://127\\.0\\.0\\.1:\\d+/users/pat\\.lee\\+x@mail-example-com/new one\\.jpg", kError},
      {"GetMaxUserQuota", userName, "MaxUserQuota", "104857600", kError},
      {"GetTotalUsedQuota", userName, "UsedQuota", "5", kError},
      {"CanUploadFile", userName, "CanUploadFile", "1001", kError},
      {"ListFiles", username, "FileDate", kDate, kError},
      {"GetMeKey", userName, "GetKey", kPassword, kError},
      {"ValidUserID", userName, "ValidUser", "TRUE", "FALSE"},
      {"SendMeMail", with(userName, {{"NewUser", "0"}}), "SendMail", "1001", "1002"},
      {"GetMGUIDForUser", userName, "MGUID", "[0-9A-F-]{36}", kError},
      {"GetCreationDateForMGUID", userName, "CreationDate", kDate, kError},
      {"HasUserExpired", {{"UserName", "*"}}, "HasUserExpired", "1001", kError},
      {"PremiumAccountSize", {{"UserName", "*"}}, "PremiumAccountSize", "104857600", kError},
      {"ReRegister", with(username, {{"Password", kPassword}}), "MGUID", "[0-9A-F-]{36}", ""},
      {"EstablishConnection", {}, "EstablishConnection", "TRUE", nullptr},
      {"HardLimit", {{"ProductID", "1"}}, "HardLimit", "1000", nullptr},
      {"SoftLimit", {{"ProductID", "1"}}, "SoftLimit", "900", nullptr},
      {"GetCurrentDateTimeFromServer", {}, "CurrentDate", kDate, nullptr},
      {"DeleteUser", with(userName, {{"Password", "wrong"}}), "DeleteUser", "1002", "1002"},
  };
  for (const Row& row : rows) {
    const auto answerFor = [&](const char* user) {
      Fields parameters = row.parameters;
      for (auto& [name, value] : parameters)
        if (value == "*") value = user;
      return Client().AskFor(row.variable, row.action, parameters);
    };
    const std::string known = answerFor(kUser);
    EXPECT_TRUE(std::regex_match(known, std::regex(row.known))) << row.action << ": " << known;
    if (row.unknown) {
      EXPECT_EQ(answerFor("nobody@x.y"), row.unknown) << row.action;
    }
    // Without one of its parameters each request is a malformed one.
    for (const auto& missing : row.parameters) {
      Fields fewer = row.parameters;
      std::erase(fewer, missing);
      for (auto& [name, value] : fewer)
        if (value == "*") value = kUser;
      EXPECT_EQ(Client().AskFor(row.variable, row.action, fewer), kError) << row.action << missing.first;
    }
  }
}

TEST_F(ServicePageTest, DetailsAreFoundByMguidAndUserTogether) {
  const std::string mguid =
      Client().AskFor("MGUID", "GetMGUIDForUser", {{"ProductID", "1"}, {"UserName", kUser}});
  const Reply details =
      Client().Ask("BVAccountDetails", {{"ProductID", "1"}, {"MGUID", mguid}, {"Username", kUser}});
  EXPECT_EQ(details.First(u"EmailAddress"), TextFromUtf8(kUser).value());
  EXPECT_EQ(details.First(u"ExpiryPeriod"), u"365");
  EXPECT_EQ(details.First(u"Quota"), u"104857600");
  for (const TextView other : {u"StartDate", u"CurrentDate", u"UsedQuota", u"ServiceLevelName"})
    EXPECT_FALSE(details.First(other).empty());
  for (const Fields& wrong : {Fields{{"ProductID", "1"}, {"MGUID", mguid}, {"Username", "x@y.z"}},
                              {{"ProductID", "1"}, {"MGUID", "?"}, {"Username", kUser}}})
    EXPECT_EQ(Client().Ask("BVAccountDetails", wrong).ErrorOccured(), 1);
}

TEST_F(ServicePageTest, LogOnAndPasswordChangeCompareWithoutTheCharactersThatTheCipherDrops) {
  Begin([](Options& options) {
    options.data /= "other";
    options.seedProduct = 7;
  });
  const auto validate = [&](const char* user, const char* password, const char* product = "7") {
    return Client().AskFor(
        "UserAuthenticationStatus", "UserValidate",
        {{"UserName", Enciphered(user)}, {"Password", Enciphered(password)}, {"ProductID", product}});
  };
  EXPECT_EQ(validate(kUser, kPassword, "8"), "FALSE");
  EXPECT_EQ(validate(kUser, kPassword, "1e300"), kError);
  EXPECT_EQ(validate(kUser, "pa55wrd"), "TRUE");
  EXPECT_EQ(validate("pat.lee x@mail.example.com", kPassword), "TRUE");
  EXPECT_EQ(validate(kUser, "pa55wOrd"), "FALSE");
  EXPECT_EQ(validate("pat.lee@mail.example.com", kPassword), "FALSE");
  EXPECT_EQ(Client().Upload("a.jpg", "1", kUser, "pa55wrd"), kRefused);

  const auto change = [&](const char* user, const char* password, const char* newPassword) {
    return Client().AskFor("UpdatePassword", "ManagePassword",
                           {{"Username", user},
                            {"ProductID", "1"},
                            {"Password", Enciphered(password)},
                            {"NewPassword", Enciphered(newPassword)}});
  };
  EXPECT_EQ(change(kUser, "wrong", "new"), "1002");
  EXPECT_EQ(change(kUser, kPassword, "!?"), "1002");
  EXPECT_EQ(change(kUser, kPassword, "ne w!pass"), "1001");
  EXPECT_EQ(validate(kUser, kPassword), "FALSE");
  EXPECT_EQ(validate(kUser, "newpass"), "TRUE");
  EXPECT_EQ(Client().Upload("a.jpg", "1", kUser, "newpass"), kStored);
}

TEST_F(ServicePageTest, AccountsAreAddedUpToTheLimitAndRemovedWithTheirFiles) {
  Begin([](Options& options) { options.hardLimit = 3; });
  const auto add = [&](const char* user) {
    return Client().Ask("AddUser", {{"UserName", user}, {"ProductID", "1"}, {"MGUID", "{0}"}});
  };
  const auto addCode = [&](const char* user) { return Utf8FromText(add(user).First(u"AddUser")); };
  const char* user = "New_1.$-@b.c";  // of every kind of character that hosts are told to take
  const char* folder = "New_1.$-@b-c";
  const Reply added = add(user);
  ASSERT_EQ(added.First(u"AddUser"), u"1001");
  EXPECT_EQ(Utf8FromText(added.First(u"UserFolder")), folder);
  EXPECT_FALSE(added.First(u"BasePath").empty());
  const std::string password = Utf8FromText(added.First(u"Password"));
  EXPECT_TRUE(std::regex_match(password, std::regex("[A-Za-z0-9]{8,}")));
  for (const char* taken : {user, folder, "New_1.$-!@b.c"}) EXPECT_EQ(addCode(taken), "1003") << taken;
  for (const char* refused :
       {"", "..", "a b", "a/b", "a\\b", "a\tb", "\xC3\xA4\xC3\xB6", "a#b", "a%b", "a\"b"})
    EXPECT_EQ(addCode(refused), "1004") << refused;
  EXPECT_EQ(addCode("third@b.c"), "1001");
  EXPECT_EQ(addCode("fourth@b.c"), "1011");

  // Without a folder: an empty listing, and file pages that say so.
  EXPECT_TRUE(Client().CheckedListing(user).empty());
  EXPECT_EQ(Client().Upload("a.jpg", "1", user, password), kFolderState);
  const auto folderPage = [&](const char* page, const char* name, const char* action,
                              const std::string& key) {
    return Client().Form(page, {{"Folder", name}, {"Action", action}}, user, key);
  };
  EXPECT_EQ(folderPage("DeleteFolderAcceptor.asp", folder, "6", password), kFolderState);
  EXPECT_EQ(folderPage("CreateFolderAcceptor.asp", kFolder, "5", password), kRefused);
  EXPECT_EQ(folderPage("CreateFolderAcceptor.asp", folder, "5", "wrong"), kRefused);
  EXPECT_EQ(folderPage("CreateFolderAcceptor.asp", folder, "5", password), kStored);
  EXPECT_EQ(folderPage("CreateFolderAcceptor.asp", folder, "5", password), kFolderState);
  EXPECT_EQ(Client().Upload("a.jpg", "1", user, password), kStored);
  EXPECT_EQ(Client().CheckedListing(user), (std::map<std::string, std::string>{{"a.jpg", "1"}}));
  EXPECT_EQ(folderPage("DeleteFolderAcceptor.asp", folder, "6", password), kStored);
  EXPECT_FALSE(std::filesystem::exists(Data() / "users" / folder));

  EXPECT_EQ(folderPage("CreateFolderAcceptor.asp", folder, "5", password), kStored);
  EXPECT_EQ(Client().Upload("b.jpg", "1", user, password), kStored);
  EXPECT_EQ(Client().AskFor("DeleteUser", "DeleteUser",
                            {{"UserName", user}, {"ProductID", "1"}, {"Password", password}}),
            "1001");
  EXPECT_FALSE(std::filesystem::exists(Data() / "users" / folder));
  EXPECT_EQ(addCode(user), "1001");
}

TEST_F(ServicePageTest, KeyMailsArriveInTheOutboxAndNoKeyIsPrinted) {
  for (const char* isNew : {"1", "0"})
    EXPECT_EQ(Client().AskFor("SendMail", "SendMeMail",
                              {{"UserName", kUser}, {"ProductID", "1"}, {"NewUser", isNew}}),
              "1001");
  Client().AskFor("GetKey", "GetMeKey", {{"UserName", kUser}, {"ProductID", "1"}});
  Client().AskFor("MGUID", "ReRegister", {{"ProductID", "1"}, {"Username", kUser}, {"Password", kPassword}});
  int mails = 0;
  for (const auto& entry : std::filesystem::directory_iterator(Data() / "outbox")) {
    const std::string mail = ReadFile(entry.path());
    EXPECT_NE(mail.find(std::string("To: ") + kUser), std::string::npos);
    EXPECT_NE(mail.find(kPassword), std::string::npos);
    ++mails;
  }
  EXPECT_EQ(mails, 2);
  End();
  EXPECT_EQ(LogText().find("pa55"), std::string::npos);
  EXPECT_NE(LogText().find(std::string("SendMeMail user=") + kUser + " status=200 result=1001"),
            std::string::npos)
      << LogText();
}

TEST_F(ServicePageTest, QuotaAndExpiryAreTold) {
  const auto canUpload = [&] {
    return Client().AskFor("CanUploadFile", "CanUploadFile", {{"UserName", kUser}, {"ProductID", "1"}});
  };
  Begin([](Options& options) { options.quota = 10; });
  EXPECT_EQ(Client().Upload("a.jpg", "12345678901"), kName);
  EXPECT_EQ(Client().Upload("a.jpg", "123456"), kStored);
  EXPECT_EQ(Client().Upload("b.jpg", "12345"), kName);
  EXPECT_EQ(canUpload(), "1001");
  EXPECT_EQ(Client().Upload("a.jpg", "1234567890"), kStored);  // a replaced file gives its room back
  EXPECT_EQ(canUpload(), "1002");
  EXPECT_EQ(Client().CheckedListing().size(), 1U);
  EXPECT_TRUE(std::filesystem::is_empty(Data() / "work"));
  Begin([](Options& options) { options.expireDays = 0; });
  EXPECT_EQ(canUpload(), "1004");
  EXPECT_EQ(Client().AskFor("HasUserExpired", "HasUserExpired", {{"UserName", kUser}}), "1002");
}

TEST_F(ServicePageTest, FileRequestsFinishOrRepeatWhatAnAcceptorPageBegan) {
  const auto rename = [&](const char* from, const char* to) {
    return Client().AskFor(
        "lRenameFileStatus", "RenameFile",
        {{"Username", kUser}, {"ProductID", "1"}, {"OldFileName", from}, {"NewFileName", to}});
  };
  const auto remove = [&](const char* name) {
    return Client().AskFor("DeleteStatus", "DeleteFile",
                           {{"Username", kUser}, {"ProductID", "1"}, {"FileToBeDeleted", name}});
  };
  ASSERT_EQ(Client().Upload("a.jpg", "1"), kStored);
  ASSERT_EQ(Client().Upload("x.jpg", "2"), kStored);
  ASSERT_EQ(Client().Rename("a.jpg", "b.jpg"), kStored);
  EXPECT_EQ(rename("a.jpg", "b.jpg"), "1001");    // done by the page
  EXPECT_EQ(rename("b.jpg", "c d.jpg"), "1001");  // moved by the request
  EXPECT_NE(rename("gone.jpg", "new.jpg"), "1001");
  EXPECT_NE(rename("c d.jpg", "x.jpg"), "1001");
  EXPECT_EQ(Client().CheckedListing(),
            (std::map<std::string, std::string>{{"c d.jpg", "1"}, {"x.jpg", "2"}}));

  ASSERT_EQ(Client().Delete("x.jpg"), kStored);
  EXPECT_EQ(remove("x.jpg"), "TRUE");
  EXPECT_EQ(remove("c d.jpg"), "TRUE");
  EXPECT_EQ(remove("c d.jpg"), "FALSE");
}

}  // namespace
}  // namespace tarnwick::hosting
