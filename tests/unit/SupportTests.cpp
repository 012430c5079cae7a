#include <gtest/gtest.h>

#include "fakes/FakePlatform.h"
#include "service/CFileUpload.h"
#include "session/ProxySettings.h"
#include "session/ResourceStrings.h"
#include "session/UserFolder.h"
#include "support/CRegistry.h"
#include "support/HttpAddress.h"
#include "support/PathHelpers.h"
#include "transfer/Reply.h"

namespace tarnwick {
namespace {

TEST(Reply, ReadsArraysAndRefusesBrokenForms) {
  EXPECT_EQ(Utf8FromText(u"\xD83D\xDE00\xD83Dx\xDE00"), "\xF0\x9F\x98\x80\uFFFDx\uFFFD");
  const Reply reply = Reply::FromBody("A=1&&Bare&E=&A=b+c&U=%C3%A9&V=%f0%9F%98%80\r\n");
  EXPECT_EQ(reply.ErrorOccured(), 0);
  const auto& values = *reply.GetValueByVariableName(u"A");
  ASSERT_EQ(values.size(), 2U);
  EXPECT_EQ(values[0], "1");
  EXPECT_EQ(values[1], "b c");
  EXPECT_TRUE(reply.GetValueByVariableName(u"Bare")->empty());
  EXPECT_EQ(reply.First(u"E"), u"");
  EXPECT_EQ(reply.First(u"U"), u"\u00e9");
  EXPECT_EQ(reply.First(u"V"), u"\U0001F600");
  EXPECT_EQ(reply.GetValueByVariableName(u"a"), nullptr);
  for (const char* broken : {"A=%4", "A=%zz", "A=%C0%80", "A=%ED%A0%80", "ErrorOccured=1"})
    EXPECT_EQ(Reply::FromBody(broken).ErrorOccured(), 1) << broken;
  std::string names;
  for (int i = 0; i <= 1000; ++i) names += "N" + std::to_string(i) + "&";
  EXPECT_EQ(Reply::FromBody(names).ErrorOccured(), 1);
  EXPECT_EQ(Reply::FromBody(names.substr(3)).ErrorOccured(), 0);
}

// The values of an array are read alike, whatever of an earlier one they begin with.
TEST(Reply, UnescapesWhatValuesHaveInCommon) {
  const std::pair<const char*, const char*> kValues[] = {{"h%C3%A9%2Fa%26%2F%20b.jpg", "h\u00e9/a&/ b.jpg"},
                                                         {"h%C3%A9%2Fa%26%2F%C3%A9%26", "h\u00e9/a&/\u00e9&"},
                                                         {"h%C3%A9%2Fa%26%2F", "h\u00e9/a&/"},
                                                         {"h%C3%A9%2Fa%26%2", nullptr},
                                                         {"h%C3%A9%2Fa%26%2F\x80", nullptr},
                                                         {"h%C3%A9%2Fb%2F+", "h\u00e9/b/ "},
                                                         {"", ""},
                                                         {"%%2F", nullptr},
                                                         {"%25%2F%2F", "%//"}};
  for (const auto& [first, meantFirst] : kValues) {
    for (const auto& [second, meant] : kValues) {
      SCOPED_TRACE(std::string(first) + " " + second);
      const Reply reply = Reply::FromBody(
          std::string("A=&A=").append(first).append("&A=").append(second).append("&B=").append(second));
      ASSERT_EQ(reply.ErrorOccured(), meantFirst && meant ? 0 : 1);
      if (reply.ErrorOccured() != 0) continue;
      const Reply::Values& values = *reply.GetValueByVariableName(u"A");
      ASSERT_EQ(values.size(), 3U);
      EXPECT_EQ(values[1], meantFirst);
      EXPECT_EQ(values[2], meant);
      EXPECT_EQ(reply.First(u"B"), TextFromUtf8(meant));
    }
  }
}

// Wherever what has a meaning stands among bytes that have none.
TEST(Reply, UnescapesAtEveryPlace) {
  const std::string plain = "klmnopqrst,-./:";
  for (const auto& [written, meant] : {std::pair{"%C3%A9", "\xC3\xA9"}, {"+", " "}, {"%26", "&"}}) {
    for (std::size_t first = 0; first <= plain.size(); ++first) {
      for (std::size_t second = 0; second <= plain.size(); ++second) {
        const std::string one = plain.substr(0, first);
        const std::string other = plain.substr(0, second);
        std::string value = one;
        std::string result = one;
        for (int i = 0; i < 5; ++i) {
          value.append(written).append(other);
          result.append(meant).append(other);
        }
        const Reply reply = Reply::FromBody(std::string("A=").append(value).append("&B=").append(one));
        ASSERT_EQ(reply.GetValueByVariableName(u"A")->front(), result) << first << ' ' << second;
        ASSERT_EQ(reply.GetValueByVariableName(u"B")->front(), one);
        const Reply broken = Reply::FromBody(std::string("A=").append(one).append("\x80").append(value));
        ASSERT_EQ(broken.ErrorOccured(), 1) << first << ' ' << second;
      }
    }
  }
}

TEST(HttpAddress, SplitsAndRefuses) {
  const auto address = SplitHttpAddress(u"host:8080/a/b");
  ASSERT_TRUE(address);
  EXPECT_EQ(address->host, u"host");
  EXPECT_EQ(address->port, 8080);
  EXPECT_EQ(address->path, u"/a/b");
  EXPECT_EQ(SplitHttpAddress(u"[::1]:81")->port, 81);
  EXPECT_EQ(SplitHttpAddress(u"[::1]")->port, 80);
  for (const TextView bad : {u"", u"/a", u":80", u"h:", u"h:0", u"h:65536", u"h:9x", u"h\r\n/a", u"h\u007f/a",
                             u"a b/c", u"u@h", u"[::1", u"[h]", u"[::1]x", u"::1"})
    EXPECT_FALSE(SplitHttpAddress(bad)) << Utf8FromText(bad);
  EXPECT_TRUE(SplitHttpAddress(u"h/users/a@b/c.jpg")) << "a user's folder is no user of the server";

  const auto secure = SplitUrl(u"https://[::1]/a");
  ASSERT_TRUE(secure && secure->secure);
  EXPECT_EQ(secure->host, u"[::1]");
  EXPECT_EQ(secure->port, 443);
  const auto plain = SplitUrl(u"http://h/a");
  EXPECT_TRUE(plain && !plain->secure && plain->host == u"h");

  for (const auto& [name, url] : {std::pair{u"h:1", u"http://h:1"},
                                  {u"HTTPS://h:1", u"https://h:1"},
                                  {u"https://[::1]", u"https://[::1]"},
                                  {u"", u"http://"}})
    EXPECT_EQ(ServerUrl(name), url);
  for (const TextView bad :
       {u"http://h", u"ftp://h", u"https://", u"https://u@h", u"https://h/p", u"https:///h",
        u"https://h:65536", u"https://[::1", u"https://http://h", u"u:p@h"})
    EXPECT_EQ(ServerUrl(bad), u"") << Utf8FromText(bad);
}

TEST(Numbers, FromText) {
  EXPECT_EQ(NumberFromText(u" -2147220891 "), -2147220891);
  EXPECT_EQ(LeadingNumber(u"12.5 Bytes"), 12.5);
  EXPECT_EQ(LeadingNumber(u"+12"), 12);
  EXPECT_EQ(LeadingNumber(u"nan"), 0);
  EXPECT_TRUE(BooleanFromText(u"tRuE") && BooleanFromText(u"-1") && !BooleanFromText(u"0"));
  for (const TextView bad : {u"", u"1x", u"+-1", u"2147483648"})
    EXPECT_THROW(NumberFromText(bad), RuntimeError);
  EXPECT_THROW(BooleanFromText(u"yes"), RuntimeError);
}

TEST(PathHelpers, Names) {
  EXPECT_EQ(FileNameFromUrl(u"dir/a\\b.jpg"), u"a\\b.jpg");
  EXPECT_EQ(FileNameFromUrl(u"b.jpg"), u"b.jpg");
  EXPECT_EQ(FileNameFromPath(u"C:\\x\\a/b.jpg"), u"a/b.jpg");
  EXPECT_EQ(FileNameFromPath(u"b.jpg"), u"b.jpg");
  const std::pair<TextView, TextView> users[] = {{u"a.b@c.d.e", u"a.b@c-d-e"}, {u"a.b", u"a-b"},
                                                 {u"a.b@c", u"a.b@c"},         {u"a@b.c@d.e", u"a@b-c@d-e"},
                                                 {u"@a.b", u"@a-b"},           {u"", u""}};
  for (const auto& [user, folder] : users) EXPECT_EQ(UserFolderName(user), folder);
}

TEST(PathHelpers, Files) {
  FakeFiles files;
  files.files[u"a"] = {0x7FFFFFFF, 0};
  files.files[u"big"] = {0x80000000, 0};
  files.folders = {u"d"};
  // A 32-bit length wraps.
  EXPECT_EQ(GetLocalFileSize(files, u"big"), -2147483648.0);
  EXPECT_EQ(GetLocalFileDate(files, u"a"), u"1/2/2026 3:04:05 AM");
  EXPECT_TRUE(FileExists(files, u"a") && FolderExists(files, u"a") && FolderExists(files, u"d"));
  EXPECT_FALSE(FileExists(files, u"d") || FolderExists(files, u"x"));
  EXPECT_FALSE(CreateFolder(files, u"new"));
  CopyLocalFile(files, u"a", u"copy");
  CopyLocalFile(files, u"missing", u"copy");
  EXPECT_EQ(files.files[u"copy"].length, 0x7FFFFFFFU);
  EXPECT_THROW(GetLocalFileDate(files, u"missing"), RuntimeError);
}

TEST(CRegistry, OddRules) {
  FakeRegistry registry;
  registry.keys[u"A"] = {{u"s", FakeRegistry::String("base")}};
  registry.keys[u"A\\C"] = {{u"s", FakeRegistry::String(std::string(255, 'x'))},
                            {u"long", FakeRegistry::String(std::string(256, 'x'))},
                            {u"expand", {2, std::string("%P%") + '\0'}},
                            {u"n", FakeRegistry::Number(42)},
                            {u"binary", {3, "abcd"}},
                            {u"empty", {1, ""}}};
  const Text longest(255, u'x');
  CRegistry reader(registry);
  std::uint32_t type = 0;
  EXPECT_EQ(reader.getRegSetting(u"s", u"C", type), u"");
  reader.setBaseRegKey(kHiveCurrentUser, u"A");
  EXPECT_EQ(reader.getRegSetting(u"s", u"", type), u"base");

  // In this order: what was read before shows through where a value is of another type than asked for.
  struct Query {
    TextView name;
    std::uint32_t type;
    TextView result;
    std::uint32_t typeAfter;
  };
  const Query queries[] = {
      {u"s", 4, u"0", 1},    {u"s", 0, longest, 0},  {u"s", 2, longest, 1},   {u"n", 1, longest, 1},
      {u"n", 2, longest, 4}, {u"n", 4, u"42", 4},    {u"s", 4, u"42", 1},     {u"expand", 2, u"%P%", 2},
      {u"long", 1, u"", 1},  {u"binary", 2, u"", 3}, {u"missing", 4, u"", 4},
  };
  for (const Query& query : queries) {
    type = query.type;
    EXPECT_EQ(reader.getRegSetting(query.name, u"C", type), query.result)
        << Utf8FromText(query.name) << " as " << query.type;
    EXPECT_EQ(type, query.typeAfter) << Utf8FromText(query.name) << " as " << query.type;
  }
  const int opened = registry.opened;
  for (std::uint32_t other : {3U, 5U, 0xFFFFFFFFU}) EXPECT_EQ(reader.getRegSetting(u"s", u"C", other), u"");
  EXPECT_EQ(registry.opened, opened);
}

TEST(ProxySettings, OfTheBrowser) {
  struct Setting {
    FakeRegistry::Value enable;
    const char* server;
    TextView host;
    TextView port;
    TextView raw;
  };
  const std::string one("\1\0\0\0", 4);
  const Setting settings[] = {
      {FakeRegistry::Number(1), "H:80", u"H", u"80", u"H:80"},
      {{3, one}, "ftp=h1:21;x=h2:80", u"ftp=h1", u"21;x=h2", u"ftp=h1:21;x=h2:80"},
      {{3, "1"}, "h:80", u"h", u"80", u"h:80"},
      // Not enabled: host empty, all else as it was.
      {FakeRegistry::Number(2), "h:80", u"", u"old", u"old"},
      {FakeRegistry::String("1"), "h:80", u"", u"old", u"old"},
      {{3, ""}, "h:80", u"", u"old", u"old"},
  };
  FakePlatform fake;
  FakeRegistry::Values& values = fake.registry.InternetSettings();
  for (const Setting& setting : settings) {
    fake.apartment.proxy = {u"old", u"old", u"old"};
    values[u"ProxyEnable"] = setting.enable;
    values[u"ProxyServer"] = FakeRegistry::String(setting.server);
    EXPECT_EQ(GetProxySettings(fake.apartment), setting.host);
    EXPECT_EQ(fake.apartment.proxy.ProxyHost, setting.host);
    EXPECT_EQ(fake.apartment.proxy.ProxyPort, setting.port);
    EXPECT_EQ(fake.apartment.proxy.ProxyServerSetting, setting.raw);
  }
  // A setting without a port raises 9, a missing one 5.
  values[u"ProxyEnable"] = FakeRegistry::Number(1);
  values[u"ProxyServer"] = FakeRegistry::String("h");
  for (const std::int32_t number : {error::kSubscriptOutOfRange, error::kInvalidCall}) {
    EXPECT_EQ(ErrorOf([&] { GetProxySettings(fake.apartment); }), number);
    values.erase(u"ProxyServer");
  }
  EXPECT_EQ(fake.apartment.proxy.ProxyPort, u"old");
}

TEST(UserFolder, Branches) {
  const Text service = u"C:\\Temp\\bv";
  const Text user = service + u"\\a@b-c";
  using Folders = std::vector<Text>;
  struct Case {
    const char* name;
    Folders taken;
    std::map<Text, std::int32_t> makeErrors;
    bool proxyReadable;
    Folders made;
    bool prepared;
  };
  const Case cases[] = {
      {"fresh", {}, {}, true, {service, user}, true},
      {"both taken meanwhile", {service, user}, {}, true, {}, true},
      {"no access to the second", {}, {{user, error::kPathNotFound}}, true, {service}, false},
      {"no proxy settings", {}, {}, false, {service, user}, false},
  };
  for (const Case& test : cases) {
    for (const TextView temp : {u"C:\\Temp", u""}) {
      const bool prepared = test.prepared && !temp.empty();
      FakePlatform fake;
      fake.apartment.session.userName = u"a@b.c";
      fake.apartment.UserFolderPath = u"old";
      fake.files.temp = temp;
      fake.files.hiddenFolders = test.taken;
      fake.files.makeErrors = test.makeErrors;
      if (test.proxyReadable) {
        fake.registry.InternetSettings() = {{u"ProxyEnable", FakeRegistry::Number(1)},
                                            {u"ProxyServer", FakeRegistry::String("h:80")}};
      }
      PrepareUserFolder(fake.apartment);
      EXPECT_EQ(fake.files.made, temp.empty() ? Folders() : test.made) << test.name;
      if (prepared) {
        EXPECT_EQ(fake.files.cleaned, user) << test.name;
      }
      EXPECT_EQ(fake.apartment.UserFolderPath, prepared ? user : u"old") << test.name;
      EXPECT_EQ(fake.apartment.proxy.ProxyHost, prepared ? u"h" : u"") << test.name;
    }
  }
}

TEST(ResourceStrings, HostProductFirst) {
  FakePlatform fake;
  fake.strings.own = {{1, u"own 1"}, {2, u"own 2"}};
  fake.strings.libraries[u"C:\\Orv\\ORVRES.dll"] = {{1, u"host 1"}};
  EXPECT_EQ(GetResourceString(fake.apartment, 1), u"own 1");
  fake.registry.keys[u"Software\\Drennick Software\\Orvanta 2.0\\Paths"][u"Install Path"] =
      FakeRegistry::String("C:\\Orv");
  // Tried once per apartment, with the first service client.
  CFileUpload first(fake.apartment);
  CFileUpload second(fake.apartment);
  EXPECT_EQ(fake.strings.loads, std::vector<Text>{u"C:\\Orv\\ORVRES.dll"});
  EXPECT_EQ(GetResourceString(fake.apartment, 1), u"host 1");
  EXPECT_EQ(GetResourceString(fake.apartment, 2), u"own 2");
  EXPECT_THROW(GetResourceString(fake.apartment, 3), RuntimeError);

  // Without an install path nothing is loaded, and certainly not from the root folder.
  FakePlatform bare;
  CFileUpload client(bare.apartment);
  EXPECT_TRUE(bare.strings.loads.empty());
}

}  // namespace
}  // namespace tarnwick
