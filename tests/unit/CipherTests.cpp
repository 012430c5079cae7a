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

TEST(EnCodeString, EscapesFourCharacters) {
  EXPECT_EQ(CFileUpload::EnCodeString(u"100%+#&"), u"100%25%2B%23%26");
  EXPECT_EQ(CFileUpload::EnCodeString(u"%2B a =?/\u00e9"), u"%252B a =?/\u00e9");
}

}  // namespace
}  // namespace tarnwick
