// What is left of a picture file before a decoder gets it, and which files it does not get.
#include "support/PictureBytes.h"

#include <gtest/gtest.h>

#include <string>

namespace tarnwick {
namespace {

// What ReducePicture leaves of a file; "refused" when it does.
std::string Reduced(std::string file) {
  const auto facts = ReducePicture({reinterpret_cast<std::uint8_t*>(file.data()), file.size()});
  return facts ? file.substr(0, facts->length) : "refused";
}

std::string Big(std::uint32_t value, int bytes) {
  std::string text;
  while (bytes-- > 0) text += static_cast<char>(value >> (8 * bytes));
  return text;
}

std::string Chunk(const std::string& name, const std::string& data) {
  return Big(static_cast<std::uint32_t>(data.size()), 4) + name + data + "SUM.";
}

std::string Png(std::uint32_t width, std::uint32_t height, int depth, int colorType, bool interlaced,
                const std::string& chunks) {
  std::string header = Big(width, 4) + Big(height, 4);
  for (const int byte : {depth, colorType, 0, 0, interlaced ? 1 : 0}) header += static_cast<char>(byte);
  return "\x89PNG\r\n\x1A\n" + Chunk("IHDR", header) + chunks;
}

std::string Segment(int marker, const std::string& data) {
  return "\xFF" + Big(static_cast<std::uint32_t>(marker), 1) +
         Big(static_cast<std::uint32_t>(data.size()) + 2, 2) + data;
}

std::string Frame(int marker, std::uint32_t width, std::uint32_t height) {
  return Segment(marker, "\x08" + Big(height, 2) + Big(width, 2) + "\x03");
}

std::string Times(int count, const std::string& text) {
  std::string all;
  while (count-- > 0) all += text;
  return all;
}

const std::string kSoi = "\xFF\xD8";
const std::string kEoi = "\xFF\xD9";
constexpr int kBaseline = 0xC0;
constexpr int kProgressive = 0xC2;

TEST(PictureBytes, PngKeepsWhatMakesThePixels) {
  const std::string palette = Chunk("PLTE", "RGB");
  const std::string clear = Chunk("tRNS", "A");
  const std::string data = Chunk("IDAT", "packed");
  const std::string end = Chunk("IEND", "");
  EXPECT_EQ(Png(2, 2, 8, 3, false, palette + clear + data + data + end),
            Reduced(Png(2, 2, 8, 3, false,
                        Chunk("iCCP", std::string(5000, 'p')) + palette + Chunk("tEXt", "a") + clear + data +
                            Chunk("IDAT", "") + data + end + "behind the end")));

  EXPECT_EQ("refused", Reduced(Png(2, 2, 8, 3, false, Big(1000, 4) + "IDATshort")));
  // Blocks that unpack to nothing.
  EXPECT_EQ("refused", Reduced(Png(2, 2, 8, 3, false, Chunk("IDAT", std::string(5000, '\0')) + end)));
  // 64 megapixels, and what a decoder would need for them.
  const auto shown = [&](std::uint32_t width, std::uint32_t height, int depth, int colorType,
                         bool interlaced) {
    return Reduced(Png(width, height, depth, colorType, interlaced, data + end)) != "refused";
  };
  EXPECT_TRUE(shown(8000, 8000, 8, 6, false));
  EXPECT_FALSE(shown(8001, 8000, 8, 6, false));
  EXPECT_FALSE(shown(8000, 8000, 16, 6, false));
  EXPECT_TRUE(shown(5600, 5600, 8, 6, true));
  EXPECT_FALSE(shown(8000, 8000, 8, 6, true));
  EXPECT_FALSE(shown(0, 8, 8, 6, false));
  EXPECT_FALSE(shown(0xFFFFFFFF, 0xFFFFFFFF, 8, 6, false));
}

TEST(PictureBytes, JpegKeepsWhatMakesThePixels) {
  const std::string jfif = Segment(0xE0, "JFIF");
  const std::string adobe = Segment(0xEE, "Adobe");
  const std::string tables = Segment(0xDB, std::string(65, 'q')) + Segment(0xC4, std::string(20, 'h'));
  const std::string all = Segment(0xDA, "\x03......");
  const std::string one = Segment(0xDA, "\x01..");
  const std::string codes = "codes\xFF" + std::string(1, '\0') + "\xFF\xD0more";
  // A camera's small picture of its own stands within its data.
  const std::string exif = Segment(0xE1, "Exif" + kSoi + Frame(kBaseline, 9, 9) + kEoi);
  EXPECT_EQ(kSoi + jfif + adobe + tables + Frame(kBaseline, 8, 8) + all + codes + kEoi,
            Reduced(kSoi + jfif + exif + adobe + Segment(0xFE, "comment") + tables + "\xFF\xFF" +
                    Frame(kBaseline, 8, 8) + all + codes + kEoi));
  // Left out by three bytes only: what is kept moves over itself. One scan has all, so nothing tells its end.
  EXPECT_EQ(kSoi + jfif + Frame(kBaseline, 8, 8) + all + "no end",
            Reduced(kSoi + jfif + "ooo" + Frame(kBaseline, 8, 8) + all + "no end"));
  EXPECT_EQ(kSoi + Frame(kProgressive, 8, 8) + one + codes + tables + one + codes + kEoi,
            Reduced(kSoi + exif + Frame(kProgressive, 8, 8) + one + codes + exif + tables + one + codes +
                    kEoi + "behind the end"));

  const auto shown = [&](int kind, std::uint32_t width, std::uint32_t height, int scans) {
    return Reduced(kSoi + Frame(kind, width, height) + Times(scans, one + codes) + kEoi) != "refused";
  };
  EXPECT_TRUE(shown(kBaseline, 8000, 8000, 1));
  EXPECT_FALSE(shown(kBaseline, 8001, 8000, 1));
  EXPECT_TRUE(shown(kProgressive, 4000, 3000, 40));
  EXPECT_FALSE(shown(kProgressive, 4000, 3000, 41));
  EXPECT_FALSE(shown(kProgressive, 8000, 8000, 10));
  EXPECT_FALSE(shown(kProgressive, 8, 8, 0));
  EXPECT_EQ("refused", Reduced(kSoi + Frame(kBaseline, 8, 8) + Frame(kBaseline, 9, 9) + all + codes + kEoi));
  EXPECT_EQ("refused", Reduced(kSoi + Frame(kBaseline, 8, 8)));
  EXPECT_EQ("refused", Reduced(kSoi + Frame(kBaseline, 8, 8) +
                               Times(16, Segment(0xDB, std::string(65'000, 'q'))) + all + kEoi));
}

// What a camera tells, with the orientation behind another entry. `type` is 3 for two bytes and 4 for four.
std::string Directory(bool little, int type, std::uint32_t orientation) {
  const auto number = [&](std::uint32_t value, int bytes) {
    const std::string big = Big(value, bytes);
    return little ? std::string(big.rbegin(), big.rend()) : big;
  };
  return (little ? "II" : "MM") + number(42, 2) + number(10, 4) + ".." + number(2, 2) + number(0x0100, 2) +
         number(3, 2) + number(1, 4) + "...." + number(0x0112, 2) +
         number(static_cast<std::uint32_t>(type), 2) + number(1, 4) +
         (number(orientation, type == 3 ? 2 : 4) + "..").substr(0, 4);
}

TEST(PictureBytes, CamerasTellHowAPictureIsSeen) {
  const auto orientation = [](std::string file) {
    const auto facts = ReducePicture({reinterpret_cast<std::uint8_t*>(file.data()), file.size()});
    return facts ? facts->orientation : 0;
  };
  const auto jpeg = [&](const std::string& segments) {
    return orientation(kSoi + segments + Frame(kBaseline, 8, 8) + Segment(0xDA, "\x03......") + kEoi);
  };
  const auto exif = [](const std::string& directory) {
    return Segment(0xE1, std::string("Exif\0\0", 6) + directory);
  };
  for (std::uint32_t told = 1; told <= 8; ++told) {
    EXPECT_EQ(told, jpeg(exif(Directory(true, 3, told))));
    EXPECT_EQ(told,
              jpeg(Segment(0xE1, "http://") + exif(Directory(false, 4, told)) + exif(Directory(true, 3, 3))));
  }
  EXPECT_EQ(6U, orientation(
                    Png(2, 2, 8, 6, false, Chunk("eXIf", Directory(false, 3, 6)) + Chunk("IDAT", "packed"))));
  for (const std::uint32_t wrong : {0U, 9U, 0x60006U}) EXPECT_EQ(1U, jpeg(exif(Directory(true, 4, wrong))));
  // Cut off anywhere before its last byte, it tells nothing.
  const std::string whole = Directory(true, 4, 6);
  for (std::size_t length = 0; length < whole.size(); ++length)
    EXPECT_EQ(1U, jpeg(exif(whole.substr(0, length)))) << length;
}

TEST(PictureBytes, GifKeepsItsFirstPicture) {
  const auto gif = [](const std::string& blocks) {
    const std::string screen("\x04\0\x04\0\x80\0\0", 7);
    return "GIF89a" + screen + "RGBRGB" + blocks;
  };
  const std::string comment("\x21\xFE\x02hi\0", 6);
  const std::string control("\x21\xF9\x04\x01..\x01\0", 8);
  const std::string picture("\x2C\x01\0\x01\0\x02\0\x02\0\0\x02\x03\x44\0\x05\0", 16);
  EXPECT_EQ(gif(control + picture + ";"),
            Reduced(gif(comment + control + comment + picture + control + picture + ";")));
  EXPECT_EQ("refused", Reduced(gif(comment + ";")));
  EXPECT_EQ("refused", Reduced(gif(control + picture.substr(0, 14))));

  // Nothing but clear codes, of three bits each: a decoder empties its table for each.
  const std::string clears = "\xFF" + Times(85, "\x24\x49\x92");
  const std::string begin("\x2C\0\0\0\0\x02\0\x02\0\0\x02", 11);
  const auto shown = [&](int blocks) {
    return Reduced(gif(begin + Times(blocks, clears) + std::string(1, '\0') + ";")) != "refused";
  };
  EXPECT_TRUE(shown(700));
  EXPECT_FALSE(shown(800));
}

TEST(PictureBytes, BmpFillsItsPicture) {
  const auto shown = [](std::uint32_t width, std::uint32_t height, char bits, char compression,
                        const std::string& pixels) {
    const auto little = [](std::uint32_t value) {
      const std::string big = Big(value, 4);
      return std::string(big.rbegin(), big.rend());
    };
    const std::string format{1, 0, bits, 0, compression};
    return Reduced("BM" + std::string(8, '\0') + little(54) + little(40) + little(width) + little(height) +
                   format + std::string(23, '\0') + pixels) != "refused";
  };
  // Lines of 24 bits take 12 bytes for three pixels; a negative height counts from the top.
  for (const std::uint32_t height : {2U, 0U - 2U}) {
    EXPECT_TRUE(shown(3, height, 24, 0, std::string(24, 'p')));
    EXPECT_FALSE(shown(3, height, 24, 0, std::string(23, 'p')));
  }
  const struct {
    std::uint32_t width;
    char compression;
    std::string code;
    bool shown;
  } rows[] = {
      {3, 1, {"\3p\0\0\3p\0\0", 8}, true},
      {3, 1, {"\0\3abc\0\0\0\1p\2p\0\1", 14}, true},  // pixels as they are, of 8 bits
      {5, 2, {"\0\5abc\0\0\0\5p\0\1", 12}, true},     // of 4 bits
      {3, 1, {"\3p\0\0\0\3ab", 8}, false},            // cut off
      {3, 1, {"\3p\0\0\2p\0\1", 8}, false},           // a line that is too short
      {3, 1, {"\4p\0\0\3p\0\1", 8}, false},           // too long
      {3, 1, {"\3p\0\0\3p\0\0\3p\0\1", 12}, false},   // one too many
      {3, 1, {"\0\2\3\1\3p\0\1", 8}, false},          // skipped pixels
  };
  for (const auto& row : rows)
    EXPECT_EQ(shown(row.width, 2, 8, row.compression, row.code), row.shown) << &row - rows;
}

}  // namespace
}  // namespace tarnwick
