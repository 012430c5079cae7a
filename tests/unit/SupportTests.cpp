#include <gtest/gtest.h>

#include "fakes/FakePlatform.h"
#include "service/Reply.h"
#include "service/modEnctyption.h"
#include "support/CRegistry.h"
#include "support/PathHelpers.h"
#include "support/ProxySettings.h"
#include "support/UserFolder.h"
#include "transfer/HttpAddress.h"

namespace tarnwick {
namespace {

TEST(Cipher, IsItsOwnInverseOnTheStrippedText) {
  Text text;
  for (char16_t unit = 1; unit < 300; ++unit) {
    text.push_back(unit);
    Text once = text;
    ApplyCipher(once);
    EXPECT_EQ(once.size(), StripToAlphabet(text).size());
    EXPECT_EQ(EncryptParameter(once), StripToAlphabet(text));
  }
}

TEST(Cipher, KnownVector) {
  // One letter uses the key's second character: "a" is 26, so A becomes the one at 69 - 26 = 43.
  EXPECT_EQ(EncryptParameter(u"A"), u"r");
  EXPECT_EQ(EncryptParameter(u"/ \\"), u"");
}

TEST(Reply, ReadsArraysAndRefusesBrokenForms) {
  const Reply reply = Reply::FromBody("A=1&A=b+c&&Bare&E=&U=%C3%A9\r\n");
  EXPECT_EQ(reply.ErrorOccured(), 0);
  EXPECT_EQ(*reply.GetValueByVariableName(u"A"), (std::vector<Text>{u"1", u"b c"}));
  EXPECT_TRUE(reply.GetValueByVariableName(u"Bare")->empty());
  EXPECT_EQ(reply.First(u"E"), u"");
  EXPECT_EQ(reply.First(u"U"), u"\u00e9");
  EXPECT_EQ(reply.GetValueByVariableName(u"a"), nullptr);
  for (const char* broken : {"A=%", "A=%4", "A=%zz", "A=%FF", "A=%C0%80", "A=%ED%A0%80", "ErrorOccured=1"})
    EXPECT_EQ(Reply::FromBody(broken).ErrorOccured(), 1) << broken;
}

TEST(HttpAddress, SplitsAndRefuses) {
  const auto address = SplitHttpAddress(u"host:8080/a/b");
  ASSERT_TRUE(address);
  EXPECT_EQ(address->host, u"host");
  EXPECT_EQ(address->port, 8080);
  EXPECT_EQ(address->path, u"/a/b");
  EXPECT_EQ(SplitHttpAddress(u"[::1]:81")->port, 81);
  EXPECT_EQ(SplitHttpAddress(u"[::1]")->port, 80);
  for (const TextView bad : {u"", u"/a", u":80", u"h:", u"h:0", u"h:65536", u"h:9x", u"h\r\n/a", u"a b/c"})
    EXPECT_FALSE(SplitHttpAddress(bad)) << Utf8FromText(bad);
}

TEST(Numbers, FromText) {
  EXPECT_EQ(NumberFromText(u" -2147220891 "), -2147220891);
  EXPECT_EQ(LeadingNumber(u"12.5 Bytes"), 12.5);
  EXPECT_EQ(LeadingNumber(u"nan"), 0);
  EXPECT_TRUE(BooleanFromText(u"tRuE") && BooleanFromText(u"-1") && !BooleanFromText(u"0"));
  for (const TextView bad : {u"", u"1x", u"+-1", u"2147483648"}) EXPECT_THROW(NumberFromText(bad), RuntimeError);
  EXPECT_THROW(BooleanFromText(u"yes"), RuntimeError);
}

TEST(PathHelpers, Names) {
  EXPECT_EQ(FileNameFromUrl(u"dir/a/b.jpg"), u"b.jpg");
  EXPECT_EQ(FileNameFromUrl(u"a\\b"), u"a\\b");
  EXPECT_EQ(FileNameFromPath(u"C:\\x\\"), u"");
  EXPECT_EQ(UserFolderName(u"a.b@c.d.e"), u"a.b@c-d-e");
  EXPECT_EQ(UserFolderName(u"a.b"), u"a-b");
}

TEST(CRegistry, OddRules) {
  FakeRegistry registry;
  registry.keys[u"A\\C"] = {{u"s", {1, std::string(255, 'x') + '\0'}},
                            {u"long", {1, std::string(256, 'x') + '\0'}},
                            {u"n", {4, std::string("\x2A\0\0\0", 4)}},
                            {u"empty", {1, ""}}};
  CRegistry reader(registry);
  std::uint32_t type = 0;
  EXPECT_EQ(reader.getRegSetting(u"s", u"C", type), u"");
  reader.setBaseRegKey(kHiveCurrentUser, u"A");
  EXPECT_EQ(reader.getRegSetting(u"s", u"C", type), Text(255, u'x'));
  EXPECT_EQ(reader.getRegSetting(u"long", u"C", type), u"");
  EXPECT_EQ(reader.getRegSetting(u"empty", u"C", type), u"");
  // A number found where a text was asked for yields the text that was read last.
  EXPECT_EQ(reader.getRegSetting(u"n", u"C", type), Text(255, u'x'));
  type = 2;
  reader.getRegSetting(u"n", u"C", type);
  EXPECT_EQ(type, 4U);
  EXPECT_EQ(reader.getRegSetting(u"n", u"C", type), u"42");
  type = 3;
  EXPECT_EQ(reader.getRegSetting(u"s", u"C", type), u"");
}

TEST(ProxySettings, BothReadings) {
  FakePlatform fake;
  EXPECT_THROW(GetProxySettings(fake.apartment), RuntimeError);
  PrepareUserFolder(fake.apartment);
  EXPECT_EQ(fake.apartment.UserFolderPath, u"");
  auto& settings = fake.registry.keys[u"Software\\Microsoft\\Windows\\CurrentVersion\\Internet Settings"];
  settings[u"ProxyEnable"] = {3, std::string("\1", 1)};
  settings[u"ProxyServer"] = {1, std::string("ftp=h1:21;x=h2:80") + '\0'};
  EXPECT_EQ(GetProxySettings(fake.apartment), u"ftp=h1");
  EXPECT_EQ(fake.apartment.proxy.ProxyPort, u"21;x=h2");
  EXPECT_EQ(ReadFtpProxy(fake.registry)->host, u"h1");
  settings[u"ProxyEnable"] = {4, std::string(4, '\0')};
  EXPECT_EQ(GetProxySettings(fake.apartment), u"");
  EXPECT_EQ(fake.apartment.proxy.ProxyPort, u"21;x=h2");
  EXPECT_FALSE(ReadFtpProxy(fake.registry));
  fake.apartment.session.userName = u"a@b.c";
  PrepareUserFolder(fake.apartment);
  EXPECT_EQ(fake.apartment.UserFolderPath, u"C:\\Temp\\bv\\a@b-c");
}

}  // namespace
}  // namespace tarnwick
