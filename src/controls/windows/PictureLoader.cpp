#include "controls/windows/PictureLoader.h"

#include <wincodec.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <utility>
#include <vector>

#include "platform/windows/ComPtr.h"

namespace tarnwick {
namespace {

// Lines are decoded in strips of about this size, which the cache of a processor core holds.
constexpr std::size_t kStripBytes = 256 * 1024;
// A decoder of TIFF, WebP or HEIF may unpack a whole tile, or the whole picture, for any of its lines. Twelve
// megapixels come in one strip, 64 in four.
constexpr std::size_t kLargeStripBytes = 64 * 1024 * 1024;

// Larger than any screen; keeps a line of the target small beside the picture.
constexpr int kLongestTargetSide = 16'384;

// How the pixels of a source line lie in memory.
enum class Layout { kGray, kBgr, kBgrx, kBgra };

constexpr std::uint32_t BytesPerPixel(Layout layout) {
  return layout == Layout::kGray ? 1 : layout == Layout::kBgr ? 3 : 4;
}

// Sums of blue, green, red and opacity.
using Sums = std::array<std::uint64_t, 4>;

// Averages the lines of a picture, which come from the top, over the pixels of the target. All is exact:
// along each side the unit is one part of (source pixels x target pixels), in which both kinds of pixels have
// whole borders. A target pixel then weighs (source width x source height) in all, so that a sum of 64
// megapixels, with colours times opacity, is far below 64 bits.
//
// Measured for 4,000 x 3,000 pixels to 160 x 120 under Wine 8: 68 ms, and 465 ms for the same result by the
// box filter of stb_image_resize. Wine's own scalers (StretchBlt with HALFTONE, 99 ms; the imaging component,
// 41 to 116 ms by mode) take one source pixel for each of the target and drop the others.
class Averager {
 public:
  // `pixels` has room for the target.
  Averager(std::uint32_t sourceWidth, std::uint32_t sourceHeight, std::uint32_t width, std::uint32_t height,
           Layout layout, COLORREF background, std::uint32_t* pixels)
      : sourceHeight_(sourceHeight),
        height_(height),
        layout_(layout),
        background_{GetBValue(background), GetGValue(background), GetRValue(background)},
        pixels_(pixels),
        full_(std::uint64_t{sourceWidth} * sourceHeight * (layout == Layout::kBgra ? 255U : 1U)),
        spans_(width),
        line_(width),
        sums_(width) {
    const std::uint64_t unit = width;
    for (std::uint32_t i = 0; i < width; ++i) {
      const std::uint64_t begin = std::uint64_t{i} * sourceWidth;
      const std::uint64_t end = begin + sourceWidth;
      Span& span = spans_[i];
      span.first = static_cast<std::size_t>(begin / unit);
      span.firstWeight = static_cast<std::uint32_t>(std::min(end, (span.first + 1) * unit) - begin);
      span.last = static_cast<std::size_t>(end / unit);
      span.lastWeight = span.last > span.first ? static_cast<std::uint32_t>(end % unit) : 0;
    }
  }

  void Add(const std::uint8_t* line) {
    switch (layout_) {
      case Layout::kGray:
        SumPixels<Layout::kGray>(line);
        break;
      case Layout::kBgr:
        SumPixels<Layout::kBgr>(line);
        break;
      case Layout::kBgrx:
        SumPixels<Layout::kBgrx>(line);
        break;
      case Layout::kBgra:
        SumPixels<Layout::kBgra>(line);
        break;
    }
    const std::uint64_t end = std::uint64_t{++lines_} * height_;
    for (std::uint64_t at = end - height_; at < end;) {
      const std::uint64_t rowEnd = (std::uint64_t{row_} + 1) * sourceHeight_;
      const std::uint64_t weight = std::min(end, rowEnd) - at;
      for (std::size_t i = 0; i < sums_.size(); ++i)
        for (std::size_t channel = 0; channel < 4; ++channel) sums_[i][channel] += weight * line_[i][channel];
      at += weight;
      if (at == rowEnd) FinishRow();
    }
  }

 private:
  // What a target pixel covers of a line: a part of the first pixel, all pixels up to the last, a part of
  // that.
  struct Span {
    std::size_t first = 0;
    std::size_t last = 0;
    std::uint32_t firstWeight = 0;
    std::uint32_t lastWeight = 0;
  };

  // Adds up to 65,536 pixels, so that 32 bits hold a colour times opacity.
  template <Layout layout>
  static Sums Sum(const std::uint8_t* pixel, const std::uint8_t* end) {
    std::uint32_t blue = 0;
    std::uint32_t green = 0;
    std::uint32_t red = 0;
    std::uint32_t alpha = 0;
    for (; pixel != end; pixel += BytesPerPixel(layout)) {
      if constexpr (layout == Layout::kGray) {
        blue += pixel[0];
      } else if constexpr (layout == Layout::kBgra) {
        const std::uint32_t opacity = pixel[3];
        blue += pixel[0] * opacity;
        green += pixel[1] * opacity;
        red += pixel[2] * opacity;
        alpha += opacity;
      } else {
        blue += pixel[0];
        green += pixel[1];
        red += pixel[2];
      }
    }
    if constexpr (layout == Layout::kGray) return {blue, blue, blue, 0};
    return {blue, green, red, alpha};
  }

  template <Layout layout>
  void SumPixels(const std::uint8_t* line) {
    constexpr std::size_t kBytes = BytesPerPixel(layout);
    constexpr std::size_t kMostAtOnce = 65'536;
    const std::uint64_t unit = spans_.size();
    const auto addTo = [](Sums& total, const Sums& sums, std::uint64_t weight) {
      for (std::size_t channel = 0; channel < 4; ++channel) total[channel] += sums[channel] * weight;
    };
    for (std::size_t i = 0; i < spans_.size(); ++i) {
      const Span& span = spans_[i];
      const std::uint8_t* pixel = line + span.first * kBytes;
      Sums& total = line_[i] = {};
      addTo(total, Sum<layout>(pixel, pixel + kBytes), span.firstWeight);
      for (std::size_t x = span.first + 1; x < span.last;) {
        const std::size_t count = std::min(span.last - x, kMostAtOnce);
        addTo(total, Sum<layout>(line + x * kBytes, line + (x + count) * kBytes), unit);
        x += count;
      }
      if (span.lastWeight == 0) continue;
      pixel = line + span.last * kBytes;
      addTo(total, Sum<layout>(pixel, pixel + kBytes), span.lastWeight);
    }
  }

  void FinishRow() {
    for (Sums& sums : sums_) {
      if (layout_ != Layout::kBgra) sums[3] = full_;
      std::uint32_t color = 0xFF000000;
      for (std::uint32_t channel = 0; channel < 3; ++channel) {
        const std::uint64_t sum = sums[channel] + background_[channel] * (full_ - sums[3]);
        color |= static_cast<std::uint32_t>((sum + full_ / 2) / full_) << (8 * channel);
      }
      *pixels_++ = color;
      sums = {};
    }
    ++row_;
  }

  std::uint32_t sourceHeight_;
  std::uint32_t height_;
  Layout layout_;
  std::array<std::uint64_t, 3> background_;
  std::uint32_t* pixels_;
  // What a pixel weighs that is opaque all over.
  std::uint64_t full_;
  std::vector<Span> spans_;
  // The current line by columns of the target, and what the current row of the target has so far.
  std::vector<Sums> line_;
  std::vector<Sums> sums_;
  std::uint32_t lines_ = 0;
  std::uint32_t row_ = 0;
};

// Writes a picture of `size`, seen as `orientation` says, from its pixels as they lie in the file.
void Turn(const std::vector<std::uint32_t>& stored, unsigned orientation, SIZE size, std::uint32_t* seen) {
  const bool turned = orientation >= 5;
  const LONG width = turned ? size.cy : size.cx;
  const LONG height = turned ? size.cx : size.cy;
  const bool fromRight = orientation == 2 || orientation == 3 || orientation == 7 || orientation == 8;
  const bool fromBottom = orientation == 3 || orientation == 4 || orientation == 6 || orientation == 7;
  for (LONG y = 0; y < size.cy; ++y)
    for (LONG x = 0; x < size.cx; ++x) {
      const LONG column = turned ? y : x;
      const LONG line = turned ? x : y;
      const LONG at =
          (fromBottom ? height - 1 - line : line) * width + (fromRight ? width - 1 - column : column);
      *seen++ = stored[static_cast<std::size_t>(at)];
    }
}

const GUID& Container(PictureFormat format) {
  switch (format) {
    case PictureFormat::kPng:
      return GUID_ContainerFormatPng;
    case PictureFormat::kGif:
      return GUID_ContainerFormatGif;
    case PictureFormat::kJpeg:
      return GUID_ContainerFormatJpeg;
    case PictureFormat::kTiff:
      return GUID_ContainerFormatTiff;
    case PictureFormat::kWebp:
      return GUID_ContainerFormatWebp;
    case PictureFormat::kHeif:
      return GUID_ContainerFormatHeif;
    case PictureFormat::kBmp:
      break;
  }
  return GUID_ContainerFormatBmp;
}

// The bytes of a file for a decoder. Reading fails once the picture is not wanted any more, which ends the
// decoding: some decoders do all of it in one call. Lives on the stack, longer than the decoder.
class FileStream final : public IStream {
 public:
  FileStream(std::span<const std::uint8_t> bytes, const std::function<bool()>& isWanted)
      : bytes_(bytes), isWanted_(isWanted) {}

  STDMETHODIMP QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == IID_ISequentialStream || id == IID_IStream;
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return 1; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }

  STDMETHODIMP Read(void* room, ULONG most, ULONG* count) override {
    if (!isWanted_()) return E_ABORT;
    const std::size_t size = std::min<std::size_t>(most, bytes_.size() - at_);
    std::copy_n(bytes_.data() + at_, size, static_cast<std::uint8_t*>(room));
    at_ += size;
    if (count) *count = static_cast<ULONG>(size);
    return S_OK;
  }
  STDMETHODIMP Seek(LARGE_INTEGER distance, DWORD origin, ULARGE_INTEGER* position) override {
    const std::size_t from = origin == STREAM_SEEK_CUR ? at_ : origin == STREAM_SEEK_END ? bytes_.size() : 0;
    const std::int64_t to = static_cast<std::int64_t>(from) + distance.QuadPart;
    if (to < 0 || to > static_cast<std::int64_t>(bytes_.size())) return STG_E_INVALIDFUNCTION;
    at_ = static_cast<std::size_t>(to);
    if (position) position->QuadPart = at_;
    return S_OK;
  }
  STDMETHODIMP Stat(STATSTG* facts, DWORD) override {
    *facts = {};
    facts->type = STGTY_STREAM;
    facts->cbSize.QuadPart = bytes_.size();
    return S_OK;
  }

  // Nothing that reads a picture needs these.
  STDMETHODIMP Write(const void*, ULONG, ULONG*) override { return E_NOTIMPL; }
  STDMETHODIMP SetSize(ULARGE_INTEGER) override { return E_NOTIMPL; }
  STDMETHODIMP CopyTo(IStream*, ULARGE_INTEGER, ULARGE_INTEGER*, ULARGE_INTEGER*) override {
    return E_NOTIMPL;
  }
  STDMETHODIMP Commit(DWORD) override { return E_NOTIMPL; }
  STDMETHODIMP Revert() override { return E_NOTIMPL; }
  STDMETHODIMP LockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override { return E_NOTIMPL; }
  STDMETHODIMP UnlockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override { return E_NOTIMPL; }
  STDMETHODIMP Clone(IStream**) override { return E_NOTIMPL; }

 private:
  const std::span<const std::uint8_t> bytes_;
  const std::function<bool()>& isWanted_;
  std::size_t at_ = 0;
};

struct Source {
  ComPtr<IWICBitmapSource> pixels;
  Layout layout = Layout::kBgra;
};

// The first picture, in a layout that the averager knows: the decoder's own where that is one of them. Tells
// its size where the file's bytes did not, and what is wrong with it.
std::optional<Source> OpenSource(IWICImagingFactory& factory, IStream& stream, PictureFacts& facts) {
  ComPtr<IWICBitmapDecoder> decoder;
  ComPtr<IWICBitmapFrameDecode> frame;
  UINT width = 0;
  UINT height = 0;
  WICPixelFormatGUID format = {};
  if (FAILED(factory.CreateDecoder(Container(facts.format), nullptr, decoder.Receive()))) {
    facts.fault = PictureFault::kOtherKind;
    return {};
  }
  facts.fault = PictureFault::kDamaged;
  if (FAILED(decoder->Initialize(&stream, WICDecodeMetadataCacheOnDemand)) ||
      FAILED(decoder->GetFrame(0, frame.Receive())) || FAILED(frame->GetSize(&width, &height)) ||
      FAILED(frame->GetPixelFormat(&format)))
    return {};
  if (facts.width == 0) {
    facts.fault = std::max(width, height) > kLongestSide ? PictureFault::kTooLarge : SizeFault(width, height);
    if (facts.fault != PictureFault::kNone) return {};
    facts.width = facts.frameWidth = width;
    facts.height = facts.frameHeight = height;
  }
  if (width != facts.frameWidth || height != facts.frameHeight) return {};

  const ComPtr<IWICBitmapSource> plain(frame.Get());
  // A line of a picture that covers only a part is transparent beside it.
  const bool whole = width == facts.width && height == facts.height;
  if (whole && format == GUID_WICPixelFormat24bppBGR) return Source{plain, Layout::kBgr};
  if (whole && format == GUID_WICPixelFormat32bppBGR) return Source{plain, Layout::kBgrx};
  if (whole && format == GUID_WICPixelFormat8bppGray) return Source{plain, Layout::kGray};
  if (format == GUID_WICPixelFormat32bppBGRA) return Source{plain, Layout::kBgra};
  const bool opaque = whole && facts.format == PictureFormat::kJpeg;
  ComPtr<IWICFormatConverter> converter;
  if (FAILED(factory.CreateFormatConverter(converter.Receive())) ||
      FAILED(converter->Initialize(plain.Get(),
                                   opaque ? GUID_WICPixelFormat24bppBGR : GUID_WICPixelFormat32bppBGRA,
                                   WICBitmapDitherTypeNone, nullptr, 0, WICBitmapPaletteTypeCustom)))
    return {};
  return Source{ComPtr<IWICBitmapSource>(converter.Get()), opaque ? Layout::kBgr : Layout::kBgra};
}

// Gives all lines of the picture to `averager`; false when one cannot be decoded.
bool AddLines(const Source& source, const PictureFacts& facts, Averager& averager) {
  const std::size_t stride = std::size_t{facts.width} * BytesPerPixel(source.layout);
  const std::size_t stripBytes = IsMeasured(facts) ? kStripBytes : kLargeStripBytes;
  const auto stripLines = static_cast<std::uint32_t>(
      std::clamp<std::size_t>(stripBytes / stride, 1, std::size_t{facts.frameHeight}));
  // Zero is transparent: what stands beside a picture that covers only a part.
  std::vector<std::uint8_t> strip(stride * stripLines);
  const std::size_t indent = std::size_t{facts.left} * BytesPerPixel(source.layout);
  const std::vector<std::uint8_t> blank(facts.frameHeight < facts.height ? stride : 0);
  const std::uint32_t bottom = facts.top + facts.frameHeight;
  for (std::uint32_t y = 0; y < facts.top; ++y) averager.Add(blank.data());
  for (std::uint32_t y = 0; y < facts.frameHeight; y += stripLines) {
    const std::uint32_t lines = std::min(stripLines, facts.frameHeight - y);
    const WICRect part = {0, static_cast<INT>(y), static_cast<INT>(facts.frameWidth),
                          static_cast<INT>(lines)};
    if (FAILED(source.pixels->CopyPixels(&part, static_cast<UINT>(stride),
                                         static_cast<UINT>(lines * stride - indent), strip.data() + indent)))
      return false;
    for (std::uint32_t line = 0; line < lines; ++line) averager.Add(strip.data() + line * stride);
  }
  for (std::uint32_t y = bottom; y < facts.height; ++y) averager.Add(blank.data());
  return true;
}

PictureFile Read(const std::wstring& path) {
  // A NUL would name another file.
  if (path.find(L'\0') != std::wstring::npos) return {};
  const FileOwner file(CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_DELETE, nullptr,
                                   OPEN_EXISTING, FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
  LARGE_INTEGER size = {};
  PictureFile picture;
  if (!file || GetFileType(file.Get()) != FILE_TYPE_DISK || !GetFileSizeEx(file.Get(), &size)) return {};
  std::array<std::uint8_t, kFormatBytes> head = {};
  DWORD headCount = 0;
  if (!ReadFile(file.Get(), head.data(), static_cast<DWORD>(head.size()), &headCount, nullptr) ||
      headCount == 0)
    return {};
  // The account may hold files of any kind and size, which are not read.
  if (!FormatOf(std::span(head).first(headCount))) {
    picture.fault = PictureFault::kOtherKind;
    return picture;
  }
  if (static_cast<std::uint64_t>(size.QuadPart) > kMostPictureBytes) {
    picture.fault = PictureFault::kTooLarge;
    return picture;
  }
  const std::size_t most = std::max(static_cast<std::size_t>(size.QuadPart), std::size_t{headCount});
  picture.bytes = std::make_unique_for_overwrite<std::uint8_t[]>(most);
  std::copy_n(head.data(), headCount, picture.bytes.get());
  DWORD count = 0;
  if (!ReadFile(file.Get(), picture.bytes.get() + headCount, static_cast<DWORD>(most - headCount), &count,
                nullptr))
    return {};
  // Shorter when somebody cuts it at this moment.
  picture.size = headCount + count;
  picture.fault = PictureFault::kNone;
  return picture;
}

DecodedPicture Decode(const PictureFile& file, const TargetSize& targetSize, COLORREF background,
                      const std::function<bool()>& isWanted) {
  if (!file) return {{}, file.fault};
  if (!isWanted()) return {};
  const std::span bytes(file.bytes.get(), file.size);
  PictureFacts facts = ReducePicture(bytes);
  if (facts.fault != PictureFault::kNone) return {{}, facts.fault};

  ComPtr<IWICImagingFactory> factory;
  if (FAILED(CoCreateInstance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER,
                              __uuidof(IWICImagingFactory), factory.ReceiveVoid())))
    return {};
  FileStream stream(bytes.first(facts.length), isWanted);
  const std::optional<Source> source = OpenSource(*factory, stream, facts);
  if (!source) return {{}, facts.fault};

  const SIZE size = targetSize(facts);
  if (size.cx <= 0 || size.cy <= 0 || size.cx > kLongestTargetSide || size.cy > kLongestTargetSide) return {};
  BITMAPINFO info = {};
  info.bmiHeader.biSize = sizeof info.bmiHeader;
  info.bmiHeader.biWidth = size.cx;
  info.bmiHeader.biHeight = -size.cy;
  info.bmiHeader.biPlanes = 1;
  info.bmiHeader.biBitCount = 32;
  void* pixels = nullptr;
  BitmapOwner bitmap(CreateDIBSection(nullptr, &info, DIB_RGB_COLORS, &pixels, nullptr, 0));
  if (!bitmap || !pixels) return {};
  const auto width = static_cast<std::uint32_t>(IsTurned(facts) ? size.cy : size.cx);
  const auto height = static_cast<std::uint32_t>(IsTurned(facts) ? size.cx : size.cy);
  // Turned when it is small.
  std::vector<std::uint32_t> stored;
  if (facts.orientation != 1) stored.resize(std::size_t{width} * height);
  auto* seen = static_cast<std::uint32_t*>(pixels);
  Averager averager(facts.width, facts.height, width, height, source->layout, background,
                    stored.empty() ? seen : stored.data());
  if (!AddLines(*source, facts, averager)) return {};
  if (!stored.empty()) Turn(stored, facts.orientation, size, seen);
  return {std::move(bitmap), PictureFault::kNone};
}

}  // namespace

PictureFile ReadPictureFile(const std::wstring& path) {
  try {
    return Read(path);
  } catch (...) {
    return {};
  }
}

DecodedPicture DecodePicture(PictureFile file, const TargetSize& targetSize, COLORREF background,
                             const std::function<bool()>& isWanted) {
  try {
    return Decode(file, targetSize, background, isWanted);
  } catch (...) {
    return {};
  }
}

}  // namespace tarnwick
