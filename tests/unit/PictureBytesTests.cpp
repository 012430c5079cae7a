// What is left of a picture file before a decoder gets it, and which files it does not get.
#include "support/PictureBytes.h"

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <vector>

namespace tarnwick {
namespace {

PictureFacts FactsOf(std::string& file) {
  return ReducePicture({reinterpret_cast<std::uint8_t*>(file.data()), file.size()});
}

// What ReducePicture leaves of a file; why it leaves nothing.
std::string Reduced(std::string file) {
  const PictureFacts facts = FactsOf(file);
  return facts.fault == PictureFault::kNone       ? file.substr(0, facts.length)
         : facts.fault == PictureFault::kDamaged  ? "damaged"
         : facts.fault == PictureFault::kTooLarge ? "too large"
                                                  : "other kind";
}

bool IsShown(const std::string& file) {
  const std::string left = Reduced(file);
  return left != "damaged" && left != "too large" && left != "other kind";
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

  EXPECT_EQ("damaged", Reduced(Png(2, 2, 8, 3, false, Big(1000, 4) + "IDATshort")));
  // Blocks that unpack to nothing.
  EXPECT_EQ("too large", Reduced(Png(2, 2, 8, 3, false, Chunk("IDAT", std::string(5000, '\0')) + end)));
  // 64 megapixels, and what a decoder would need for them.
  const auto shown = [&](std::uint32_t width, std::uint32_t height, int depth, int colorType,
                         bool interlaced) {
    return IsShown(Png(width, height, depth, colorType, interlaced, data + end));
  };
  EXPECT_TRUE(shown(8000, 8000, 8, 6, false));
  EXPECT_EQ("too large", Reduced(Png(8001, 8000, 8, 6, false, data + end)));
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
    return IsShown(kSoi + Frame(kind, width, height) + Times(scans, one + codes) + kEoi);
  };
  EXPECT_TRUE(shown(kBaseline, 8000, 8000, 1));
  EXPECT_EQ("too large", Reduced(kSoi + Frame(kBaseline, 8001, 8000) + all + codes + kEoi));
  EXPECT_TRUE(shown(kProgressive, 4000, 3000, 40));
  EXPECT_FALSE(shown(kProgressive, 4000, 3000, 41));
  EXPECT_FALSE(shown(kProgressive, 8000, 8000, 10));
  EXPECT_FALSE(shown(kProgressive, 8, 8, 0));
  EXPECT_EQ("damaged", Reduced(kSoi + Frame(kBaseline, 8, 8) + Frame(kBaseline, 9, 9) + all + codes + kEoi));
  EXPECT_EQ("damaged", Reduced(kSoi + Frame(kBaseline, 8, 8)));
  EXPECT_EQ("too large", Reduced(kSoi + Frame(kBaseline, 8, 8) +
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
  const auto orientation = [](std::string file) { return FactsOf(file).orientation; };
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
  EXPECT_EQ("damaged", Reduced(gif(comment + ";")));
  EXPECT_EQ("too large", Reduced({"GIF89a\x41\x1F\x40\x1F\0\0\0,\0\0\0\0\x41\x1F\x40\x1F\0\2", 24}));
  EXPECT_EQ("damaged", Reduced(gif(control + picture.substr(0, 14))));

  // Nothing but clear codes, of three bits each: a decoder empties its table for each.
  const std::string clears = "\xFF" + Times(85, "\x24\x49\x92");
  const std::string begin("\x2C\0\0\0\0\x02\0\x02\0\0\x02", 11);
  const auto shown = [&](int blocks) {
    return IsShown(gif(begin + Times(blocks, clears) + std::string(1, '\0') + ";"));
  };
  EXPECT_TRUE(shown(700));
  EXPECT_FALSE(shown(800));
}

TEST(PictureBytes, BmpFillsItsPicture) {
  const auto bmp = [](std::uint32_t width, std::uint32_t height, char bits, char compression,
                      const std::string& pixels) {
    const auto little = [](std::uint32_t value) {
      const std::string big = Big(value, 4);
      return std::string(big.rbegin(), big.rend());
    };
    const std::string format{1, 0, bits, 0, compression};
    return "BM" + std::string(8, '\0') + little(54) + little(40) + little(width) + little(height) + format +
           std::string(23, '\0') + pixels;
  };
  // Lines of 24 bits take 12 bytes for three pixels; a negative height counts from the top.
  for (const std::uint32_t height : {2U, 0U - 2U}) {
    EXPECT_TRUE(IsShown(bmp(3, height, 24, 0, std::string(24, 'p'))));
    EXPECT_FALSE(IsShown(bmp(3, height, 24, 0, std::string(23, 'p'))));
  }
  EXPECT_EQ("too large", Reduced(bmp(8001, 8000, 24, 0, "")));
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
    EXPECT_EQ(IsShown(bmp(row.width, 2, 8, row.compression, row.code)), row.shown) << &row - rows;
}

// A file whose directory stands behind `pictures`, with numbers of four bytes each.
using Entries = std::map<std::uint32_t, std::vector<std::uint32_t>>;
std::string Tiff(const std::string& pictures, const Entries& entries) {
  std::string directory = Big(static_cast<std::uint32_t>(entries.size()), 2);
  std::string lists;
  const std::size_t begin = 8 + pictures.size();
  for (const auto& [tag, numbers] : entries) {
    directory += Big(tag, 2) + Big(4, 2) + Big(static_cast<std::uint32_t>(numbers.size()), 4);
    std::string list;
    for (const std::uint32_t number : numbers) list += Big(number, 4);
    if (list.size() > 4) {
      directory += Big(static_cast<std::uint32_t>(begin + 2 + 12 * entries.size() + lists.size()), 4);
      lists += list;
    } else {
      directory += list;
    }
  }
  return std::string("MM\0*", 4) + Big(static_cast<std::uint32_t>(begin), 4) + pictures + directory + lists;
}

TEST(PictureBytes, TiffIsWithinTheLimits) {
  constexpr std::uint32_t kWidth = 0x0100, kHeight = 0x0101, kBits = 0x0102, kPacking = 0x0103,
                          kOffsets = 0x0111, kLines = 0x0116, kSizes = 0x0117, kTileWidth = 0x0142,
                          kTileHeight = 0x0143, kTileOffsets = 0x0144, kTileSizes = 0x0145, kTables = 0x015B;
  const std::string scans = Times(4, "\xFF\xDA");
  const Entries strips = {
      {kWidth, {4}}, {kHeight, {4}}, {kLines, {2}}, {kOffsets, {8, 12}}, {kSizes, {4, 4}}};
  const Entries tiles = {{kWidth, {4}},       {kHeight, {4}},      {kTileWidth, {16}},
                         {kTileHeight, {16}}, {kTileOffsets, {8}}, {kTileSizes, {8}}};
  const struct {
    const char* what;
    Entries base;
    Entries with;
    std::string outcome;
  } rows[] = {
      {"strips", strips, {}, "shown"},
      {"tiles", tiles, {}, "shown"},
      {"64 megapixels", strips, {{kWidth, {8000}}, {kHeight, {8000}}, {kBits, {32}}}, "shown"},
      {"more", strips, {{kWidth, {8001}}, {kHeight, {8000}}}, "too large"},
      {"more for each pixel", strips, {{kWidth, {8000}}, {kHeight, {8000}}, {kBits, {64}}}, "too large"},
      {"a line without end", strips, {{kWidth, {2'000'000}}}, "too large"},
      {"no size", strips, {{kWidth, {0}}}, "damaged"},
      {"a tile for nothing", tiles, {{kTileWidth, {100'000}}, {kTileHeight, {100'000}}}, "too large"},
      {"tiles for nothing", tiles, {{kHeight, {64'000}}, {kTileWidth, {100'000}}}, "too large"},
      {"a tile of nothing", tiles, {{kTileHeight, {0}}}, "damaged"},
      {"cut off", strips, {{kSizes, {4, 400}}}, "damaged"},
      {"no strips", strips, {{kOffsets, {}}}, "damaged"},
      {"one without a size", strips, {{kSizes, {4}}}, "damaged"},
      {"over each other",
       strips,
       {{kOffsets, std::vector<std::uint32_t>(999, 8)}, {kSizes, std::vector<std::uint32_t>(999, 100)}},
       "too large"},
      {"old JPEG", strips, {{kPacking, {6}}}, "other kind"},
      {"JPEG", tiles, {{kPacking, {7}}}, "shown"},
      {"too many scans", tiles, {{kPacking, {7}}, {kTileSizes, {12}}}, "too large"},
      {"tables", tiles, {{kPacking, {7}}, {kTables, std::vector<std::uint32_t>(70'000, 0)}}, "too large"},
  };
  for (const auto& row : rows) {
    Entries entries = row.with;
    entries.insert(row.base.begin(), row.base.end());
    std::string file = Tiff(scans + "\xFF\xDA..", entries);
    EXPECT_EQ(row.outcome, IsShown(file) ? "shown" : Reduced(file)) << row.what;
  }
}

TEST(PictureBytes, OnlyPicturesAreRead) {
  const struct {
    std::string head;
    std::optional<PictureFormat> format;
  } rows[] = {
      {{"II*\0", 4}, PictureFormat::kTiff},
      {"RIFF....WEBP", PictureFormat::kWebp},
      {"RIFF....WAVE", {}},
      {"....ftypheic", PictureFormat::kHeif},
      {"....ftypavif", PictureFormat::kHeif},
      {"....ftypisom", {}},
      {"....ftyphei", {}},
      {"\x89PNG", {}},
      {"", {}},
  };
  for (const auto& row : rows) {
    const auto* head = reinterpret_cast<const std::uint8_t*>(row.head.data());
    EXPECT_EQ(row.format, FormatOf({head, row.head.size()})) << row.head;
  }
}

}  // namespace
}  // namespace tarnwick
