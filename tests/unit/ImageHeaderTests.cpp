#include <gtest/gtest.h>

#include <ostream>

#include "fakes/FakePlatform.h"
#include "support/CImageHeight.h"

namespace tarnwick {
namespace {

// What a reader tells, or the error that it raised together with what it told then.
struct Told {
  std::int32_t type = 0;
  std::int32_t width = 0;
  std::int32_t height = 0;
  std::int32_t depth = 0;
  std::int32_t error = 0;
  bool operator==(const Told&) const = default;
};

std::ostream& operator<<(std::ostream& out, const Told& told) {
  return out << "type " << told.type << ", " << told.width << " x " << told.height << " x " << told.depth
             << ", error " << told.error;
}

template <typename Source>
Told Read(CImageHeight& reader, Source source) {
  const std::int32_t error = ErrorOf([&] { reader.ReadImageInfo(source); });
  return {reader.ImageType(), reader.Width(), reader.Height(), reader.Depth(), error};
}

// From memory that ends where the bytes end, so that the sanitizer sees a byte too many.
Told Read(const std::string& bytes) {
  FakeFiles files;
  CImageHeight reader(files);
  // Nothing of it may be left.
  reader.ReadImageInfo(std::string_view("GIF89a\1\1\1\1\1"));
  const std::vector<char> exact(bytes.begin(), bytes.end());
  return Read(reader, std::string_view(exact.data(), exact.size()));
}

template <typename... Numbers>
std::string Bytes(Numbers... numbers) {
  return {static_cast<char>(numbers)...};
}

std::string BigEndian16(std::size_t number) {
  return Bytes(number >> 8, number);
}

std::string Png(std::uint32_t width, std::uint32_t height, int bits, int colourType) {
  std::string png("\x89PNG\r\n\x1A\n\0\0\0\rIHDR", 16);
  for (const std::uint32_t side : {width, height}) png += BigEndian16(side >> 16) + BigEndian16(side);
  return png + Bytes(bits, colourType, 0, 0, 0);
}

std::string Bmp(std::int32_t width, std::int32_t height, int bits) {
  std::string bmp = "BM" + std::string(12, '\x7F') + Bytes(40, 0, 0, 0);
  for (const std::int32_t side : {width, height}) bmp += Bytes(side, side >> 8, side >> 16, side >> 24);
  return bmp + Bytes(1, 0, bits, 0);
}

const std::string kStart = "\xFF\xD8";

// A segment with `length`, which counts its own two bytes, and zeros as data.
std::string Segment(int code, std::size_t length = 16) {
  return Bytes(0xFF, code) + BigEndian16(length) + std::string(length - 2, '\0');
}

// The frame of a picture of 772 x 515 (0x304 x 0x203).
std::string Frame(int code, int components = 3) {
  return Bytes(0xFF, code, 0, 17, 8, 2, 3, 3, 4, components) + std::string(9, '\1');
}

Told Jpeg(int components = 3) {
  return {kImageJpeg, 772, 515, components * 8};
}

const Told kNothing;

// The beginnings of pictures as programs write them; in the JPEG the tables are blank.
const std::string kRealPng(
    "\x89PNG\r\n\x1A\n\0\0\0\rIHDR\0\0\x01\x90\0\0\x01\x48\x08\x04\0\0\0\xD4\xDB\x60\x05\0\0\x21\x28"
    "IDATx\xDA\xED",
    44);
const std::string kRealGif("GIF89a\xC8\0\x18\x01\xF5\0\0\x2E\x7D\x32\x33\x7B\x35\x6A\x4C", 21);
const std::string kRealBmp(
    "BM\x8A\x04\0\0\0\0\0\0\x8A\0\0\0\x7C\0\0\0\x10\0\0\0\x10\0\0\0\x01\0\x20\0\x03\0\0\0\0\x04\0\0", 38);
const std::string kRealJpeg = kStart + std::string("\xFF\xE0\0\x10JFIF\0\1\1\1\0\x48\0\x48\0\0", 18) +
                              Segment(0xDB, 67) + Segment(0xDB, 67) +
                              std::string("\xFF\xC0\0\x11\x08\0\x2E\0\x46\x03\1\x22\0\2\x11\1\3\x11\1", 19) +
                              Segment(0xC4, 31);

TEST(ImageHeader, TellsEachFormat) {
  const struct {
    std::string bytes;
    Told told;
  } cases[] = {
      {kRealPng, {kImagePng, 400, 328, 16}},
      {kRealGif, {kImageGif, 200, 280, 6}},
      {kRealBmp, {kImageBmp, 16, 16, 32}},
      {kRealJpeg, {kImageJpeg, 70, 46, 24}},
      // All colour types, and what no palette has.
      {Png(1, 2, 255, 0), {kImagePng, 1, 2, 255}},
      {Png(1, 2, 85, 2), {kImagePng, 1, 2, 255}},
      {Png(1, 2, 86, 2), {kImagePng, 0, 0, 0, error::kOverflow}},
      {Png(1, 2, 1, 3), {kImagePng, 1, 2, 8}},
      {Png(1, 2, 127, 4), {kImagePng, 1, 2, 254}},
      {Png(1, 2, 64, 6), {kImagePng, 0, 0, 0, error::kOverflow}},
      {Png(1, 2, 8, 1), kNothing},
      {Png(1, 2, 8, 5) + kStart + Frame(0xC0), Jpeg()},
      // Only 16 bits of each side are told.
      {Png(0x12345678, 258, 8, 0), {kImagePng, 0x5678, 258, 8}},
      {Bmp(0x12345678, -5, 24), {kImageBmp, 0x5678, 65531, 24}},
      {"GIF87a" + Bytes(1, 2, 3, 4, 0xF7), {kImageGif, 513, 1027, 8}},
      {"GIF" + std::string(7, '\xFF') + Bytes(0xF8), {kImageGif, 65535, 65535, 1}},
      // Signatures alone, and what only begins like one.
      {"GIF", {kImageGif, 0, 0, 1}},
      {"BM", {kImageBmp, 0, 0, 0}},
      {"\x89PN", {kImagePng, 0, 0, 0}},
      {"", kNothing},
      {" GIF89a", kNothing},
  };
  for (const auto& item : cases) EXPECT_EQ(Read(item.bytes), item.told) << testing::PrintToString(item.bytes);
}

TEST(ImageHeader, FindsTheFrameOfAJpeg) {
  // Each code as a frame and, where it is none, as a segment to be skipped. A 255 is no code.
  for (int code = 0; code < 255; ++code) {
    const bool frame = code >= 0xC0 && code <= 0xCF && code != 0xC4 && code != 0xC8 && code != 0xCC;
    const std::string bytes = kStart + Frame(code, 1) + Frame(0xC1, 4);
    EXPECT_EQ(Read(bytes), frame ? Jpeg(1) : Jpeg(4)) << code;
  }
  const std::string frame = Frame(0xC2);
  const struct {
    std::string bytes;
    Told told;
  } cases[] = {
      {"garbage \xFF \xFF\xD8 " + kStart + frame, Jpeg()},
      {kStart + Bytes(0xFF, 0xFF, 0xFF) + frame, Jpeg()},
      {kStart + Segment(0xE1, 65535) + "between segments" + frame, Jpeg()},
      {kStart + Bytes(0xFF, 0xE0, 0, 0) + frame, Jpeg()},
      {kStart + Bytes(0xFF, 0xE0, 0, 1) + frame, Jpeg()},
      // A frame within a segment is data of it: a preview, for one.
      {kStart + Bytes(0xFF, 0xE1, 0, 21) + Frame(0xC0, 1) + frame, Jpeg()},
      {kStart + Bytes(0xFF, 0xE1, 0xFF, 0xFF) + frame, kNothing},
      // The search goes on with the last byte of a segment.
      {kStart + Bytes(0xFF, 0xE1, 0, 3, 0xFF) + frame.substr(1), Jpeg()},
      {kStart + Segment(0xDB), kNothing},
      {Bytes(0xFF, 0xD8, 0xFE) + frame, kNothing},
      {kStart + Frame(0xC0, 32), {kImageJpeg, 772, 515, 0, error::kOverflow}},
      // Cut off behind the code of the frame.
      {kStart + frame.substr(0, 2), {kImageJpeg, 0, 0, 0}},
      {kStart + frame.substr(0, 6), {kImageJpeg, 0, 512, 0}},
  };
  for (const auto& item : cases) EXPECT_EQ(Read(item.bytes), item.told) << testing::PrintToString(item.bytes);
}

// The search ends 11 bytes before the end of what is read, and tests each position before it is used.
TEST(ImageHeader, SearchesAsFarAsItShould) {
  constexpr std::size_t kEnd = 266130;
  for (std::size_t at = kEnd - 8; at < kEnd + 12; ++at) {
    EXPECT_EQ(Read(std::string(at, ' ') + kStart + Frame(0xC0)), at + 2 < kEnd ? Jpeg() : kNothing) << at;
    // The same for a frame far behind the start: after segments, and after bytes between them.
    std::string bytes = kStart;
    while (bytes.size() + 2 + 60000 < at - 4) bytes += Segment(0xE2, 60000);
    const std::size_t rest = at - bytes.size();
    EXPECT_EQ(Read(bytes + Segment(0xE2, rest - 2) + Frame(0xC0)), at < kEnd ? Jpeg() : kNothing) << at;
    EXPECT_EQ(Read(bytes + std::string(rest, ' ') + Frame(0xC0)), at < kEnd ? Jpeg() : kNothing) << at;
  }
  EXPECT_EQ(Read(kStart + std::string(300000, '\xFF') + Frame(0xC0)), kNothing);
}

TEST(ImageHeader, ReadsFiles) {
  FakeFiles files;
  files.files[u"jpeg"].bytes = kRealJpeg;
  files.files[u"far"].bytes = std::string(CImageHeight::kHeadBytes - 14, ' ') + kStart + Frame(0xC0);
  files.files[u"long"].bytes = kRealGif + std::string(300000, '\xFF');
  files.files[u"deep"].bytes = Png(1, 2, 86, 2);
  files.readErrors = {{u"locked", error::kPathAccess}};
  CImageHeight reader(files);
  EXPECT_EQ((Told{reader.ImageType(), reader.Width(), reader.Height(), reader.Depth()}), kNothing);
  // In this order: nothing is left of the file before.
  const std::pair<TextView, Told> cases[] = {
      {u"jpeg", {kImageJpeg, 70, 46, 24}},
      {u"missing", kNothing},
      {u"far", Jpeg()},
      {u"locked", {0, 0, 0, 0, error::kPathAccess}},
      {u"long", {kImageGif, 200, 280, 6}},
      {u"deep", {kImagePng, 0, 0, 0, error::kOverflow}},
  };
  for (const auto& [path, told] : cases) EXPECT_EQ(Read(reader, path), told) << Utf8FromText(path);
  EXPECT_TRUE(files.files.contains(u"missing")) << "is made";
}

}  // namespace
}  // namespace tarnwick
