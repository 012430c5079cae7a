#include <gtest/gtest.h>

#include "service/CFileUpload.h"
#include "service/modEnctyption.h"

namespace tarnwick {
namespace {

constexpr TextView kAlphabet = u"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz1234567890#@$*.-_";

// Worked out apart from the code.
TEST(Cipher, KnownVectors) {
  const std::pair<TextView, TextView> vectors[] = {
      {u"/ \\:&\u00e9\u4e2d", u""},
      {u"s 3+t#", u"$k2k"},
      {u"UserValidate", u"l_-7S$0$LM@A"},
      {kAlphabet, u"mmc3nXagNUTdaaQqbLOUBIHROOEeP_CI7*$FCC0SD58*u21#88xG9sv2ipoyvvl@wgjpW"},
  };
  for (const auto& [plain, cipher] : vectors) {
    EXPECT_EQ(EncryptParameter(plain), cipher);
    Text overwritten(plain);
    ApplyCipher(overwritten);
    EXPECT_EQ(overwritten, cipher);
  }
}

TEST(Cipher, IsItsOwnInverseOnTheStrippedText) {
  Text text;
  for (char16_t unit = 1; unit < 300; ++unit) {
    text.push_back(unit);
    const Text stripped = StripToAlphabet(text);
    const Text once = EncryptParameter(text);
    EXPECT_EQ(once.size(), stripped.size());
    EXPECT_EQ(once.find_first_not_of(kAlphabet), Text::npos);
    EXPECT_EQ(EncryptParameter(once), stripped);
  }
  EXPECT_EQ(StripToAlphabet(text).size(), kAlphabet.size());
}

// What the service does to read a form value.
Text Unescaped(TextView text) {
  return ReplaceAll(ReplaceAll(ReplaceAll(ReplaceAll(text, u"%26", u"&"), u"%23", u"#"), u"%2B", u"+"),
                    u"%25", u"%");
}

TEST(EnCodeString, EscapesFourCharactersAndCanBeUndone) {
  const std::pair<TextView, TextView> vectors[] = {{u"100%+#&", u"100%25%2B%23%26"},
                                                   {u"%2B", u"%252B"},
                                                   {u"%%", u"%25%25"},
                                                   {u"a =?/\u00e9", u"a =?/\u00e9"}};
  for (const auto& [plain, escaped] : vectors) EXPECT_EQ(CFileUpload::EnCodeString(plain), escaped);
  // Every text of up to five of the characters that could be mixed up.
  constexpr TextView kUnits = u"%+#&25";
  for (unsigned number = 0; number < 6 * 6 * 6 * 6 * 6; ++number) {
    Text text;
    for (unsigned rest = number; rest > 0; rest /= 6) text.push_back(kUnits[rest % 6]);
    const Text escaped = CFileUpload::EnCodeString(text);
    ASSERT_EQ(escaped.find_first_of(u"+#&"), Text::npos);
    ASSERT_EQ(Unescaped(escaped), text);
  }
}

}  // namespace
}  // namespace tarnwick
