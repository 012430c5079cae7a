// Pictures for small views: what a file's pixels become, and which files become nothing.
#include "controls/windows/PictureLoader.h"

#include <gtest/gtest.h>
#include <objbase.h>
#include <wincodec.h>

#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

#include "platform/windows/ComPtr.h"
#include "platform/windows/Owner.h"

namespace tarnwick {
namespace {

using Bytes = std::vector<std::uint8_t>;
using Pixels = std::vector<std::uint32_t>;  // 0xAARRGGBB, from the top

constexpr COLORREF kBackground = RGB(0x40, 0x80, 0xC0);
constexpr std::uint32_t kShownBackground = 0xFF4080C0;

struct Picture {
  int width = 0;
  int height = 0;
  Pixels pixels;

  std::uint32_t At(int x, int y) const {
    return pixels[static_cast<std::size_t>(y) * static_cast<std::size_t>(width) +
                  static_cast<std::size_t>(x)];
  }
};

// Every pixel of another colour, all opaque.
Picture Colours(int width, int height) {
  Picture picture = {width, height, {}};
  std::uint32_t random = 12345;
  for (int i = 0; i < width * height; ++i) {
    random = random * 1664525 + 1013904223;
    picture.pixels.push_back(0xFF000000 | random >> 8);
  }
  return picture;
}

void Append(Bytes& bytes, std::uint32_t value, int count) {
  for (int i = 0; i < count; ++i) bytes.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
}

// 24 bits a pixel, from the bottom.
Bytes Bmp(const Picture& picture) {
  const auto stride = static_cast<std::uint32_t>((picture.width * 3 + 3) / 4 * 4);
  Bytes bytes = {'B', 'M'};
  Append(bytes, 54 + stride * static_cast<std::uint32_t>(picture.height), 4);
  Append(bytes, 0, 4);
  Append(bytes, 54, 4);
  Append(bytes, 40, 4);
  Append(bytes, static_cast<std::uint32_t>(picture.width), 4);
  Append(bytes, static_cast<std::uint32_t>(picture.height), 4);
  Append(bytes, 1, 2);
  Append(bytes, 24, 2);
  bytes.resize(54);
  for (int y = picture.height; y-- > 0;) {
    const std::size_t end = bytes.size() + stride;
    for (int x = 0; x < picture.width; ++x) Append(bytes, picture.At(x, y), 3);
    bytes.resize(end);
  }
  return bytes;
}

// By the system's encoder.
Bytes Encoded(const GUID& container, const Picture& picture) {
  ComPtr<IWICImagingFactory> factory;
  ComPtr<IStream> stream;
  ComPtr<IWICBitmapEncoder> encoder;
  ComPtr<IWICBitmapFrameEncode> frame;
  ComPtr<IPropertyBag2> options;
  WICPixelFormatGUID format = GUID_WICPixelFormat24bppBGR;
  Bytes lines;
  for (const std::uint32_t pixel : picture.pixels) Append(lines, pixel, 3);
  EXPECT_HRESULT_SUCCEEDED(CoCreateInstance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER,
                                            __uuidof(IWICImagingFactory), factory.ReceiveVoid()));
  EXPECT_HRESULT_SUCCEEDED(CreateStreamOnHGlobal(nullptr, TRUE, stream.Receive()));
  EXPECT_HRESULT_SUCCEEDED(factory->CreateEncoder(container, nullptr, encoder.Receive()));
  EXPECT_HRESULT_SUCCEEDED(encoder->Initialize(stream.Get(), WICBitmapEncoderNoCache));
  EXPECT_HRESULT_SUCCEEDED(encoder->CreateNewFrame(frame.Receive(), options.Receive()));
  EXPECT_HRESULT_SUCCEEDED(frame->Initialize(options.Get()));
  EXPECT_HRESULT_SUCCEEDED(
      frame->SetSize(static_cast<UINT>(picture.width), static_cast<UINT>(picture.height)));
  EXPECT_HRESULT_SUCCEEDED(frame->SetPixelFormat(&format));
  EXPECT_HRESULT_SUCCEEDED(frame->WritePixels(static_cast<UINT>(picture.height),
                                              static_cast<UINT>(picture.width * 3),
                                              static_cast<UINT>(lines.size()), lines.data()));
  EXPECT_HRESULT_SUCCEEDED(frame->Commit());
  EXPECT_HRESULT_SUCCEEDED(encoder->Commit());
  STATSTG facts = {};
  EXPECT_HRESULT_SUCCEEDED(stream->Stat(&facts, STATFLAG_NONAME));
  EXPECT_HRESULT_SUCCEEDED(stream->Seek({}, STREAM_SEEK_SET, nullptr));
  Bytes file(static_cast<std::size_t>(facts.cbSize.QuadPart));
  EXPECT_HRESULT_SUCCEEDED(stream->Read(file.data(), static_cast<ULONG>(file.size()), nullptr));
  return file;
}

// Of the demo pictures.
Bytes FileOf(const std::string& name) {
  std::ifstream file("demo/pictures/" + name, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

class PictureLoaderTest : public testing::Test {
 protected:
  PictureLoaderTest() {
    CoInitialize(nullptr);
    wchar_t folder[MAX_PATH] = {};
    GetTempPathW(MAX_PATH, folder);
    path_ = std::wstring(folder) + L"loader-test.picture";
  }
  ~PictureLoaderTest() override {
    // Also shows that the loader has closed it.
    EXPECT_TRUE(DeleteFileW(path_.c_str()) || GetLastError() == ERROR_FILE_NOT_FOUND);
    CoUninitialize();
  }

  void Write(const Bytes& bytes) {
    const FileOwner file(CreateFileW(path_.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr));
    DWORD written = 0;
    EXPECT_TRUE(WriteFile(file.Get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr));
  }
  // The pixels that the file with these bytes is shown with; none when it is not.
  Pixels Shown(const Bytes& bytes, int width, int height) {
    Write(bytes);
    return ShownFile(width, height);
  }
  Pixels ShownFile(int width, int height) {
    const DecodedPicture picture = LoadPicture(path_, width, height, kBackground);
    fault_ = picture.fault;
    if (!picture) return {};
    const BitmapOwner& bitmap = picture.bitmap;
    DIBSECTION section = {};
    EXPECT_EQ(sizeof section, static_cast<std::size_t>(GetObjectW(bitmap.Get(), sizeof section, &section)));
    EXPECT_EQ(width, section.dsBm.bmWidth);
    EXPECT_EQ(height, section.dsBm.bmHeight);
    const auto* first = static_cast<const std::uint32_t*>(section.dsBm.bmBits);
    return {first, first + width * height};
  }

  std::wstring path_;
  // Why the file that was shown last was not.
  PictureFault fault_ = PictureFault::kNone;
};

// The exact average of what each pixel of the target covers, by the definition: both grids are put on one
// whose lines hold all borders.
Pixels Averages(const Picture& source, int width, int height) {
  Pixels result;
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) {
      std::uint32_t color = 0xFF;
      for (const int shift : {16, 8, 0}) {
        int sum = 0;
        for (int v = y * source.height; v < (y + 1) * source.height; ++v)
          for (int u = x * source.width; u < (x + 1) * source.width; ++u)
            sum += static_cast<int>(source.At(u / width, v / height) >> shift & 0xFF);
        const int cells = source.width * source.height;
        color = color << 8 | static_cast<std::uint32_t>((sum + cells / 2) / cells);
      }
      result.push_back(color);
    }
  return result;
}

TEST_F(PictureLoaderTest, EachPixelIsTheAverageOfWhatItCovers) {
  struct Row {
    int width, height, shownWidth, shownHeight;
  };
  for (const Row row :
       {Row{8, 6, 4, 2}, Row{7, 5, 3, 2}, Row{61, 1, 1, 1}, Row{2, 2, 5, 3}, Row{100, 90, 13, 89}}) {
    const Picture picture = Colours(row.width, row.height);
    EXPECT_EQ(Averages(picture, row.shownWidth, row.shownHeight),
              Shown(Bmp(picture), row.shownWidth, row.shownHeight))
        << row.width << " x " << row.height << " at " << row.shownWidth << " x " << row.shownHeight;
  }
}

TEST_F(PictureLoaderTest, EachFormatIsToldByItsBytes) {
  const Picture picture = Colours(4, 2);
  EXPECT_EQ(picture.pixels, Shown(Bmp(picture), 4, 2));
  EXPECT_EQ(picture.pixels, Shown(Encoded(GUID_ContainerFormatTiff, picture), 4, 2));
  // The average of all pixels, as another program tells it.
  for (const auto& [name, average] :
       {std::pair{"deep-field.png", 0x121312}, {"wizard.gif", 0xD6D6DF}, {"coffee.jpg", 0x9E5533}}) {
    const Pixels shown = Shown(FileOf(name), 1, 1);
    ASSERT_EQ(1U, shown.size()) << name;
    for (const int shift : {0, 8, 16})
      EXPECT_NEAR(average >> shift & 0xFF, static_cast<int>(shown[0] >> shift & 0xFF), 2) << name;
  }
}

// A JPEG whose quarters are red, black, blue and white by lines, with what a camera writes about its
// orientation.
Bytes TurnedJpeg(std::uint8_t orientation) {
  Picture quarters = {64, 32, {}};
  for (int y = 0; y < 32; ++y)
    for (int x = 0; x < 64; ++x)
      quarters.pixels.push_back(y < 16   ? (x < 32 ? 0xFFFF0000 : 0xFF000000)
                                : x < 32 ? 0xFF0000FF
                                         : 0xFFFFFFFF);
  Bytes jpeg = Encoded(GUID_ContainerFormatJpeg, quarters);
  const Bytes exif = {0xFF, 0xE1, 0,    34, 'E', 'x', 'i', 'f', 0, 0, 'I',         'I', 42, 0, 8, 0, 0, 0,
                      1,    0,    0x12, 1,  3,   0,   1,   0,   0, 0, orientation, 0,   0,  0, 0, 0, 0, 0};
  jpeg.insert(jpeg.begin() + 2, exif.begin(), exif.end());
  return jpeg;
}

TEST_F(PictureLoaderTest, APictureIsTurnedAsItsCameraTells) {
  // Of the quarters as they are seen, by lines.
  const char* const seen[] = {"rkbw", "krwb", "wbkr", "bwrk", "rbkw", "brwk", "wkbr", "kwrb"};
  for (std::uint8_t orientation = 1; orientation <= 8; ++orientation) {
    std::string quarters;
    for (const std::uint32_t pixel : Shown(TurnedJpeg(orientation), 2, 2)) {
      const bool red = (pixel >> 16 & 0xFF) > 128;
      const bool blue = (pixel & 0xFF) > 128;
      quarters += red ? (blue ? 'w' : 'r') : blue ? 'b' : 'k';
    }
    EXPECT_EQ(seen[orientation - 1], quarters) << int{orientation};
  }
  // The size that is told is the file's own.
  Write(TurnedJpeg(6));
  PictureFacts told;
  EXPECT_TRUE(DecodePicture(
      ReadPictureFile(path_),
      [&](const PictureFacts& facts) {
        told = facts;
        return SIZE{2, 3};
      },
      kBackground, [] { return true; }));
  EXPECT_EQ(64U, told.width);
  EXPECT_TRUE(IsTurned(told));
}

TEST_F(PictureLoaderTest, TheBackgroundShowsThrough) {
  // What is not seen, seen half and seen; then all in one, without the hidden one's colour, which is white.
  const Bytes png = {0x89, 0x50, 0x4E, 0x47, 0x0D, 0x0A, 0x1A, 0x0A, 0,    0,    0,    0x0D, 0x49,
                     0x48, 0x44, 0x52, 0,    0,    0,    3,    0,    0,    0,    1,    8,    6,
                     0,    0,    0,    0x1B, 0xE0, 0x14, 0xB4, 0,    0,    0,    0x14, 0x49, 0x44,
                     0x41, 0x54, 0x78, 0xDA, 0x63, 0xF8, 0xFF, 0xFF, 0x3F, 3,    0x10, 0x34, 8,
                     0x28, 0x18, 0xFC, 7,    0,    0x25, 0x6B, 4,    0xDD, 0xCC, 0x11, 0xA8, 0x62,
                     0,    0,    0,    0,    0x49, 0x45, 0x4E, 0x44, 0xAE, 0x42, 0x60, 0x82};
  EXPECT_EQ((Pixels{kShownBackground, 0xFF204060, 0xFF102030}), Shown(png, 3, 1));
  EXPECT_EQ((Pixels{0xFF254B70}), Shown(png, 1, 1));

  // A GIF of 4 x 4 whose first picture is the 2 x 2 at (1, 1): red, the transparent colour, and twice red. A
  // further picture is not shown.
  const Bytes first = {'G', 'I',  'F',  '8', '9',  'a',  4, 0,    4, 0,    0x80, 0,    0,    0xFF, 0,
                       0,   0xFF, 0xFF, 0,   0x21, 0xF9, 4, 0x01, 0, 0,    1,    0,    0x2C, 1,    0,
                       1,   0,    2,    0,   2,    0,    0, 2,    3, 0x44, 0x00, 0x05, 0};
  const Bytes further = {0x2C, 0, 0, 0, 0, 4, 0, 4, 0, 0, 2, 1, 0x2C, 0, 0x3B};
  Bytes gif = first;
  gif.insert(gif.end(), further.begin(), further.end());
  Pixels expected(16, kShownBackground);
  expected[5] = expected[9] = expected[10] = 0xFFFF0000;
  EXPECT_EQ(expected, Shown(gif, 4, 4));
}

TEST_F(PictureLoaderTest, ABrokenFileIsNotShown) {
  const std::pair<const char*, Bytes> files[] = {
      {"PNG", FileOf("horse.png")},
      {"GIF", FileOf("wizard.gif")},
      {"JPEG", FileOf("rose.jpg")},
      {"BMP", Bmp(Colours(64, 64))},
      {"TIFF", Encoded(GUID_ContainerFormatTiff, Colours(64, 64))}};
  for (const auto& [name, bytes] : files) {
    EXPECT_FALSE(Shown(bytes, 2, 2).empty()) << name;
    Bytes cut = bytes;
    for (const std::size_t length : {bytes.size() * 9 / 10, bytes.size() / 2, std::size_t{3}}) {
      cut.resize(length);
      EXPECT_TRUE(Shown(cut, 2, 2).empty()) << name << " cut after " << length << " of " << bytes.size();
      EXPECT_EQ(FormatOf(cut) ? PictureFault::kDamaged : PictureFault::kOtherKind, fault_) << name;
    }
    Bytes noise = bytes;
    for (std::size_t i = 12; i < noise.size(); ++i) noise[i] = static_cast<std::uint8_t>(i * 77);
    EXPECT_TRUE(Shown(noise, 2, 2).empty()) << name << " with noise";
  }
  EXPECT_TRUE(Shown({}, 2, 2).empty());
  EXPECT_EQ(PictureFault::kDamaged, fault_);
  EXPECT_TRUE(Shown(Bytes(200, 'x'), 2, 2).empty());
  EXPECT_EQ(PictureFault::kOtherKind, fault_);

  Write(files[0].second);
  for (const int width : {0, -1, 20'000}) EXPECT_TRUE(ShownFile(width, 1).empty());
  const std::wstring file = std::exchange(path_, path_ + std::wstring(1, L'\0'));
  EXPECT_TRUE(ShownFile(2, 2).empty()) << "a name with NUL";
  path_ = L"C:\\windows";
  EXPECT_TRUE(ShownFile(2, 2).empty()) << "a folder";
  path_ = file;
  int asked = 0;
  EXPECT_FALSE(DecodePicture(
      ReadPictureFile(path_),
      [](const PictureFacts&) {
        return SIZE{2, 2};
      },
      kBackground, [&] { return ++asked < 2; }))
      << "given up on the way";
}

}  // namespace
}  // namespace tarnwick
