// Every operation that is one exchange with the service page: what it sends, byte for byte, and what it makes
// of each kind of reply. The enciphered texts are literal vectors, worked out apart from the code under test.
#include <gtest/gtest.h>

#include <sstream>

#include "fakes/FakePlatform.h"
#include "service/CFileUpload.h"

namespace tarnwick {
namespace {

std::string Show(TextView text) {
  return Utf8FromText(text);
}
std::string Show(bool value) {
  return value ? "TRUE" : "FALSE";
}
std::string Show(std::int32_t number) {
  return std::to_string(number);
}
std::string Show(double number) {
  std::ostringstream text;
  text << number;
  return text.str();
}
std::string Show(const std::optional<double>& number) {
  return number ? Show(*number) : "Empty";
}

// What the result column says of a wrong type when the result is a text, which takes anything.
constexpr const char* kAnyText = nullptr;

struct Operation {
  const char* name;
  std::string (*call)(CFileUpload&);
  // Request name and send flag.
  const char* query;
  const char* body;
  // A complete reply with its result.
  const char* reply;
  const char* result;
  // Results after a failed exchange; with any variable of the reply missing or without elements; and with the
  // text "x" in the place of the first value.
  const char* failed;
  const char* missing;
  const char* wrongType;
  // Further replies with their results.
  std::vector<std::pair<const char*, const char*>> more = {};
};

void PrintTo(const Operation& operation, std::ostream* out) {
  *out << operation.name;
}

std::string ListFiles(CFileUpload& client) {
  std::string files;
  const bool listed = client.ListFilesForUser([&](const std::shared_ptr<CUpload>& file) {
    files += Show(Text(file->FileName)) + "|" + Show(Text(file->FilePath)) + "|" + Show(file->FileSize) +
             "|" + Show(Text(file->FileDate)) + "|" + Show(Text(file->FilePath)) + "\n";
  });
  return files + Show(listed);
}

std::string AccountDetails(CFileUpload& client) {
  std::string details;
  const auto status = client.GetAccountDetailsForMGUID(u"{N&1}", u"u+1", u"P+3", [&](const auto& account) {
    details = Show(account->EmailAddress) + "|" + Show(account->ExpiryPeriod) + "|" +
              Show(account->StartDate) + "|" + Show(account->CurrentDate) + "|" + Show(account->UsedQuota) +
              "|" + Show(account->Quota) + "|" + Show(account->ServiceLevelName) + " ";
  });
  return details + Show(status);
}

// A row reads better filled than a value a line.
// clang-format off
const Operation kOperations[] = {
    {"ConnectToServer", [](CFileUpload& c) { return Show(c.ConnectToServer(u"h:8080")); },
     "EstablishConnection&Flag=0", "ClientAction=Z*%23NDUJ2_ly88KK@*RE", "EstablishConnection=TRUE", "TRUE",
     "FALSE", "FALSE", "FALSE",
     {{"EstablishConnection=fAlSe", "FALSE"}, {"EstablishConnection=-1", "TRUE"},
      {"EstablishConnection=0", "FALSE"}}},
    {"LogonAs", [](CFileUpload& c) { return Show(c.LogonAs(u"09", u"a+b@c.d", u"n#w", u"{N}")); },
     "ValidationRequest&Flag=0",
     "ClientAction=l_-7S$0$LM@A&UserName=DCuKqB&Password=%23uq&ProductID=09&MGUID={N}",
     "UserAuthenticationStatus=tRUe", "TRUE", "FALSE", "FALSE", "FALSE",
     {{"UserAuthenticationStatus=yes", "FALSE"}, {"UserAuthenticationStatus=", "FALSE"},
      {"UserAuthenticationStatus=1", "FALSE"}}},
    {"GetFileUploadPath", [](CFileUpload& c) { return Show(c.GetFileUploadPath()); }, "PathFromRoot&Flag=0",
     "ClientAction=qR1_iv79X-_3&ProductID=7&Username=a%2Bb%26c@d.e", "PathFromRoot=%5Cusers%5Ca/b",
     "\\users\\a/b", "", "", kAnyText},
    {"GetUserBasePath", [](CFileUpload& c) { return Show(c.GetUserBasePath()); }, "PathFromRoot&Flag=0",
     "ClientAction=qR1_iv79X-_3&ProductID=7&Username=a%2Bb%26c@d.e", "PathFromRoot=%5Cusers%5Ca/b",
     "http://h:8080/users/a/b", "http://h:8080", "http://h:8080", kAnyText},
    {"RenameFile",
     [](CFileUpload& c) { return Show(c.RenameFile(u"P+3", u"u+1", u"a %.jpg", u"\u00fc&.jpg")); },
     "RenameFileRequest&Flag=1",
     "ClientAction=WASR8Ci50_&Username=u+1&ProductID=P+3&OldFileName=a%20%25.jpg&NewFileName=%C3%BC%26.jpg",
     "lRenameFileStatus=1001", "1001", "1033", "1033", "1033",
     {{"lRenameFileStatus=1002", "1033"}, {"lRenameFileStatus=1004", "1033"}}},
    {"UploadFile", [](CFileUpload& c) { return Show(c.UploadFile(u"C:\\x/a+b.jpg")); },
     "FileUploadRequest&Flag=1",
     "ClientAction=i*UNI9CyDA&FileName=a%2Bb.jpg&FileSize=12&Username=a%2Bb%26c@d.e&ProductID=7",
     "FileURL=http%3A%2F%2Fh%2Fa+b", "http://h/a b", "", "", kAnyText},
    {"SaveUploadFile", [](CFileUpload& c) { return Show(c.SaveUploadFile(u"C:\\x/a+b.jpg")); },
     "FileUploadRequest&Flag=1",
     "ClientAction=i*UNI9CyDA&FileName=x/a%2Bb.jpg&FileSize=12&Username=a%2Bb%26c@d.e&ProductID=7",
     "FileURL=http%3A%2F%2Fh%2Fa", "http://h/a", "", "", kAnyText},
    {"GetMaxQuota", [](CFileUpload& c) { return Show(c.GetMaxQuota(u"P+3", u"u+1")); }, "GetMaxQuota&Flag=0",
     "ClientAction=aJtRD9S$AObz0@$&ProductID=P+3&UserName=u%2B1", "MaxUserQuota=12.5+MB", "12.5", "0", "0",
     "0", {{"MaxUserQuota=1e999", "0"}}},
    {"GetTotalUsedQuota", [](CFileUpload& c) { return Show(c.GetTotalUsedQuota(u"P+3", u"u+1")); },
     "GetTotalUsedQuota&Flag=0", "ClientAction=P_2V-@EUX2CKF17$M&ProductID=P+3&UserName=u%2B1",
     "UsedQuota=1234", "1234", "Empty", "Empty", "0"},
    {"CanUploadFile", [](CFileUpload& c) { return Show(c.CanUploadFile()); }, "CanUploadFile&Flag=0",
     "ClientAction=pC%23Tx07OJi*UN&UserName=a%2Bb%26c@d.e&ProductID=7", "CanUploadFile=1002", "1002", "1004",
     "0", "0"},
    {"DeleteFileForUser", [](CFileUpload& c) { return Show(c.DeleteFileForUser(u"a#b")); },
     "DeleteFileRequest&Flag=1",
     "ClientAction=kAUN1Ci50_&Username=a%2Bb%26c@d.e&ProductID=7&FileToBeDeleted=a%23b", "DeleteStatus=True",
     "1001", "1004", "0", "0", {{"DeleteStatus=FALSE", "0"}, {"DeleteStatus=1", "1001"}}},
    {"ListFilesForUser", ListFiles, "ListFilesRequest&Flag=1",
     "ClientAction=bF4Mm@$Ju&Username=a%2Bb%26c@d.e&ProductID=7",
     "FileName=a+b&FileURL=u1&FileSize=12.5+KB&FileDate=d1", "a b|u1|12.5|d1|u1\nTRUE", "FALSE", "FALSE",
     kAnyText,
     {{"FileName=a&FileName=b&FileURL=u1&FileURL=u2&FileSize=1&FileSize=x&FileDate=d1&FileDate=",
       "a|u1|1|d1|u1\nb|u2|0||u2\nTRUE"},
      {"FileName=a&FileName=b&FileURL=u1&FileURL=u2&FileSize=1&FileDate=d1&FileDate=d2",
       "a|u1|1|d1|u1\nFALSE"},
      {"FileName&FileURL&FileSize&FileDate", "TRUE"}}},
    {"GetKeyForUser", [](CFileUpload& c) { return Show(c.GetKeyForUser(u"P+3", u"u+1")); },
     "UserKeyRequest&Flag=1", "ClientAction=iI@Sbh-z&UserName=u%2B1&ProductID=P+3", "GetKey=k%26y", "k&y",
     "1004", "", kAnyText},
    {"IsValidUserID", [](CFileUpload& c) { return Show(c.IsValidUserID(u"u+1", u"P+3")); },
     "ValidUserID&Flag=0", "ClientAction=JfG@DTu_4gj&UserName=u%2B1&ProductID=P+3", "ValidUser=TRUE", "TRUE",
     "FALSE", "FALSE", "FALSE"},
    {"EmailKeyToUser", [](CFileUpload& c) { return Show(c.EmailKeyToUser(u"P+3", u"u+1", -1)); },
     "EmailKeyRequest&Flag=1", "ClientAction=VASOQCb$$0&UserName=u%2B1&ProductID=P+3&NewUser=-1",
     "SendMail=1001", "1001", "1004", "0", "0"},
    {"GetHardLimit", [](CFileUpload& c) { return Show(c.GetHardLimit(u"P+3")); }, "HardLimitRequest&Flag=1",
     "ClientAction=fN5cg@@Ft&ProductID=P+3", "HardLimit=100", "100", "0", "0", "0",
     {{"HardLimit=2147483648", "0"}}},
    {"GetSoftLimit", [](CFileUpload& c) { return Show(c.GetSoftLimit(u"P+3")); }, "SoftLimitRequest&Flag=1",
     "ClientAction=U__Mg@@Ft&ProductID=P+3", "SoftLimit=90", "90", "0", "0", "0"},
    {"GetMGUIDForUser", [](CFileUpload& c) { return Show(c.GetMGUIDForUser(u"P+3", u"u+1")); },
     "MGUIDRequest&Flag=1", "ClientAction=aJtRXUekZRAI6Jv&ProductID=P+3&UserName=u%2B1", "MGUID=%7Bm%7D",
     "{m}", "1004", "", kAnyText},
    {"GetCreationDateForMGUID",
     [](CFileUpload& c) { return Show(c.GetCreationDateForMGUID(u"P+3", u"u+1")); },
     "CreationDateRequest&Flag=1", "ClientAction=Yb-a7J$2$A_kEMNX0*JXJgj&ProductID=P+3&UserName=u%2B1",
     "CreationDate=1/2/2026+3:04:05+AM", "1/2/2026 3:04:05 AM", "1004", "", kAnyText},
    {"GetCurrentDateTimeFromServer", [](CFileUpload& c) { return Show(c.GetCurrentDateTimeFromServer()); },
     "CurrentDateRequest&Flag=1", "ClientAction=h92b@$*AS-ZG@9K$CIi5RFKC*r_4", "CurrentDate=now", "now",
     "1004", "", kAnyText},
    {"ManagePassword",
     [](CFileUpload& c) { return Show(c.ManagePassword(u"P+3", u"u+1", u"n#w", u"a+b@c.d")); },
     "UpdatePasswordObject&Flag=1",
     "ClientAction=QGA$._ZM$4JD3D&Username=u%2B1&ProductID=P+3&Password=%23uq&NewPassword=DCuKqB",
     "UpdatePassword=1001", "1001", "1004", "1004", "1004", {{"UpdatePassword=1002", "1004"}}},
    {"ActivateAccount", [](CFileUpload& c) { return Show(c.ActivateAccount(u"P+3", u"u+1", u"p&w")); },
     "ActivateAccount&Flag=1", "ClientAction=WAoN*-$t_4&ProductID=P+3&Username=u%2B1&Password=p%26w",
     "MGUID=m", "m", "1004", "", kAnyText, {{"MGUID=", "1002"}}},
    {"GetAccountDetailsForMGUID", AccountDetails, "AccountDetails&Flag=1",
     "ClientAction=mAdBM-%239Mo-5N503&ProductID=P+3&MGUID={N%261}&Username=u%2B1",
     "ExpiryPeriod=30&EmailAddress=e&StartDate=s&CurrentDate=c&UsedQuota=1&Quota=2&ServiceLevelName=l",
     "e|30|s|c|1|2|l 1001", "1004", "0", "0"},
    {"HasUserAccountExpired", [](CFileUpload& c) { return Show(c.HasUserAccountExpired(u"u+1")); },
     "HasUserExpired&Flag=1", "ClientAction=VG$B3_.i87XA-D&UserName=u+1", "HasUserExpired=1002", "1002",
     "1004", "0", "0"},
    {"GetPremiumBaseAccountSize", [](CFileUpload& c) { return Show(c.GetPremiumBaseAccountSize(u"u+1")); },
     "PremiumAccountSize&Flag=1", "ClientAction=O4KAF2TrAE_s82WE6A&UserName=u+1",
     "PremiumAccountSize=5242880", "5242880", "1004", "0", "0"},
};
// clang-format on

class OperationTest : public testing::TestWithParam<Operation> {
 protected:
  // The result of the operation in a fresh session, given that answer.
  static std::string ResultOf(const std::optional<HttpAnswer>& answer, FakePlatform& fake) {
    fake.apartment.session = {u"h:8080", u"a+b&c@d.e", Text(u"pw"), 7, u"{M}", false};
    fake.files.files[u"C:\\x/a+b.jpg"] = {12, 0};
    fake.http.answers = {answer};
    CFileUpload client(fake.apartment);
    return GetParam().call(client);
  }
  static std::string ResultOf(const std::string& body) {
    FakePlatform fake;
    return ResultOf(HttpAnswer{200, body}, fake);
  }
};

TEST_P(OperationTest, SendsTheseBytes) {
  FakePlatform fake;
  EXPECT_EQ(ResultOf(HttpAnswer{200, GetParam().reply}, fake), GetParam().result);
  ASSERT_EQ(fake.http.sent.size(), 1U);
  const FakeHttp::Sent& sent = fake.http.sent[0];
  EXPECT_EQ(sent.host, u"h");
  EXPECT_EQ(sent.port, 8080);
  EXPECT_EQ(sent.target, std::string("/bv/bin/BVServicePage.asp?Request=") + GetParam().query);
  EXPECT_EQ(sent.contentType, "application/x-www-form-urlencoded; charset=utf-8");
  EXPECT_EQ(sent.body, GetParam().body);
  EXPECT_EQ(sent.maxBodyBytes, 67'108'864U);
}

TEST_P(OperationTest, ReadsTheReply) {
  for (const auto& [body, result] : GetParam().more) EXPECT_EQ(ResultOf(body), result) << body;

  const std::string reply = GetParam().reply;
  const std::optional<HttpAnswer> failures[] = {std::nullopt,
                                                HttpAnswer{500, reply},
                                                HttpAnswer{302, reply},
                                                HttpAnswer{201, reply},
                                                HttpAnswer{200, "ErrorOccured=1&" + reply},
                                                HttpAnswer{200, reply + "&Broken=%4"},
                                                HttpAnswer{200, reply + "&Latin1=%FC"}};
  for (const auto& failure : failures) {
    FakePlatform fake;
    EXPECT_EQ(ResultOf(failure, fake), GetParam().failed) << (failure ? failure->body : "no connection");
  }

  const bool isList = GetParam().call == ListFiles;
  for (std::size_t from = 0, end; from < reply.size(); from = end + 1) {
    end = std::min(reply.find('&', from), reply.size());
    const std::size_t value = reply.find('=', from);
    EXPECT_EQ(ResultOf(std::string(reply).replace(from, 1, "X")), GetParam().missing) << reply.substr(from);
    // A list without names is an empty one.
    if (!isList || from > 0) {
      EXPECT_EQ(ResultOf(std::string(reply).erase(value, end - value)), GetParam().missing)
          << reply.substr(from);
    }
    if (from == 0 && GetParam().wrongType) {
      EXPECT_EQ(ResultOf(std::string(reply).replace(value + 1, end - value - 1, "x")), GetParam().wrongType);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(All, OperationTest, testing::ValuesIn(kOperations),
                         [](const auto& row) { return std::string(row.param.name); });

}  // namespace
}  // namespace tarnwick
