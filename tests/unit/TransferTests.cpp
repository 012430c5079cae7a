#include <gtest/gtest.h>

#include <sstream>

#include "fakes/FakePlatform.h"
#include "transfer/AcceptorPages.h"
#include "transfer/FileNameGuard.h"
#include "transfer/UploadObject.h"

namespace tarnwick {
namespace {

TEST(FileNameGuard, AcceptsAndRefuses) {
  for (const TextView good : {u"a", u"a b.jpg", u".x", u"a..b", u"\u00e9.gif", u"con1", u"comx.jpg", u"com",
                              u"nully", u"\u05E9\u05DC\u05D5\u05DD 1.jpg", u"\u0645\u06CC\u200C\u062E.png",
                              u"\u00A0.gif", u"desktop.ini.jpg", u"lnk", u"a.lnk.jpg", u"$MFT"})
    EXPECT_TRUE(IsSafeFileName(good)) << Utf8FromText(good);
  using Names = std::vector<TextView>;
  for (const Names& names :
       {Names{u"", u".", u"..", u"a.", u"a ", u"a/b", u"a\\b", u"a:b", u"*", u"a?", u"\"", u"<", u">", u"|"},
        Names{u"a\nb", u"a\u007f", u"a\u0080", u"\u009Fa", u"\u061C", u"a\u200Eb", u"a\u200Fb"},
        Names{u"a\u202Agpj.exe", u"a\u202Egpj.exe", u"\u2066a", u"a\u2069"},
        Names{u"NUL", u"con", u"CoN.jpg", u"aux .x", u"com1", u"COM0", u"LPT9.gif", u"com\u00b9", u"CONOUT$"},
        Names{u"a::$DATA", u"Desktop.INI", u"autorun.inf", u".lnk", u"a.LNK", u"a.jpg.url", u"a.library-ms"}})
    for (const TextView bad : names) EXPECT_FALSE(IsSafeFileName(bad)) << Utf8FromText(bad);
  EXPECT_EQ(ShownName(u"\u05E9\u202Egpj\u0085.e\nxe"), u"\u05E9\uFFFDgpj\uFFFD.e\uFFFDxe");
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
  if (path != u"C:\\none") fake.files.files.try_emplace(Text(path), FakeFiles::File{3, 0, "abc"});
  return ErrorOf([&] {
    UploadObject(fake.apartment.platform)
        .UploadFile(path, base, u"/httpupload/UploadAcceptor.asp", 0, u"u", u"p", kProductGuid, events);
  });
}

TEST(UploadObject, SendsTheFileAndTellsItsProgress) {
  FakePlatform fake;
  fake.files.files[u"C:\\a b.jpg"] = {20, 0, "12345678901234567890"};
  const auto upload = [&](const char* answer) {
    Uploads events;
    fake.http.answers.push_back(HttpAnswer{200, answer});
    const std::int32_t error = Upload(fake, u"C:\\a b.jpg", u"http://h:81/users/", events);
    return std::to_string(error) + " " + events.log;
  };
  EXPECT_EQ(upload("ErrorNumber=0"),
            "0 initializing;connecting;started;0 0;100 20;server;upload complete;complete;");
  const std::string same = upload("ErrorNumber=-2147220891");
  EXPECT_TRUE(same.starts_with("-2147220891 ") && same.ends_with("server;upload complete;complete;")) << same;
  EXPECT_EQ(upload("ErrorNumber=-2147220881").find("upload complete"), std::string::npos);

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

TEST(UploadObject, TellsRisingPercentsInPiecesOfAnySize) {
  for (const std::size_t length : {0U, 7U, 12345U}) {
    for (const std::size_t piece : {1U, 1000U, 1U << 20}) {
      SCOPED_TRACE(std::to_string(length) + " in " + std::to_string(piece));
      FakePlatform fake;
      fake.http.piece = piece;
      fake.http.answers.push_back(HttpAnswer{200, "ErrorNumber=0"});
      std::string bytes(length, 'x');
      fake.files.files[u"C:\\\u00e9.jpg"] = {length, 0, bytes};
      Uploads events;
      EXPECT_EQ(Upload(fake, u"C:\\\u00e9.jpg", u"http://h/users/", events), 0);

      std::istringstream log(events.log.substr(events.log.find("0 0;") + 4));
      int last = 0;
      for (int percent = 0, sent = 0; log >> percent >> sent; last = percent, log.ignore())
        EXPECT_LT(last, percent);
      EXPECT_EQ(last, 100) << events.log;
      const std::string& body = fake.http.sent[0].body;
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
