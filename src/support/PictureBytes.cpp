#include "support/PictureBytes.h"

#include <algorithm>
#include <cstring>
#include <string_view>

namespace tarnwick {
namespace {

using Bytes = std::span<const std::uint8_t>;

bool StartsWith(Bytes bytes, std::string_view text) {
  return bytes.size() >= text.size() && std::memcmp(bytes.data(), text.data(), text.size()) == 0;
}

std::uint32_t BigEndian(Bytes bytes) {
  std::uint32_t value = 0;
  for (const std::uint8_t byte : bytes) value = (value << 8) | byte;
  return value;
}

std::uint32_t LittleEndian(Bytes bytes) {
  std::uint32_t value = 0;
  for (std::size_t i = bytes.size(); i-- > 0;) value = (value << 8) | bytes[i];
  return value;
}

bool Shown(std::uint64_t width, std::uint64_t height) {
  return SizeFault(width, height) == PictureFault::kNone;
}

PictureFacts Refused(PictureFault fault) {
  PictureFacts facts;
  facts.fault = fault;
  return facts;
}

PictureFacts TooLarge() {
  return Refused(PictureFault::kTooLarge);
}

PictureFacts Whole(PictureFormat format, std::uint32_t width, std::uint32_t height) {
  PictureFacts facts;
  facts.fault = PictureFault::kNone;
  facts.format = format;
  facts.width = facts.frameWidth = width;
  facts.height = facts.frameHeight = height;
  return facts;
}

// Parts of a file, moved to its front one after the other.
class Kept {
 public:
  explicit Kept(std::span<std::uint8_t> file) : file_(file) {}

  // Parts are kept in their order, and do not overlap.
  void Keep(std::size_t begin, std::size_t end) {
    if (begin != length_) std::memmove(file_.data() + length_, file_.data() + begin, end - begin);
    length_ += end - begin;
  }
  // There is room: something was left out, or the file was longer.
  void Append(std::uint8_t byte) { file_[length_++] = byte; }
  std::size_t Length() const { return length_; }

 private:
  std::span<std::uint8_t> file_;
  std::size_t length_ = 0;
};

// --- What cameras tell ---

// The first directory of a TIFF file. What cameras tell of a picture is such a file, too.
class TiffDirectory {
 public:
  explicit TiffDirectory(Bytes file) : file_(file) {
    little_ = StartsWith(file, {"II*\0", 4});
    if (!little_ && !StartsWith(file, {"MM\0*", 4})) return;
    const Bytes count = Part(Value(Part(4, 4)), 2);
    if (count.empty()) return;
    const auto begin = static_cast<std::size_t>(count.data() - file.data()) + 2;
    entries_ =
        file.subspan(begin, std::min((file.size() - begin) / kEntry, std::size_t{Value(count)}) * kEntry);
  }

  // The numbers of an entry.
  struct Numbers {
    Bytes bytes;
    std::size_t size = 1;  // of each, in bytes
    std::size_t Count() const { return bytes.size() / size; }
  };
  // Without any when there is no such entry, or not all of it.
  Numbers Find(std::uint32_t tag) const {
    for (std::size_t at = 0; at < entries_.size(); at += kEntry) {
      if (Value(entries_.subspan(at, 2)) != tag) continue;
      // Bytes and what is not told, numbers of two bytes, of four.
      const std::uint32_t type = Value(entries_.subspan(at + 2, 2));
      const std::size_t size = type == 1 || type == 7 ? 1 : type == 3 ? 2 : type == 4 ? 4 : 0;
      const std::uint64_t bytes = std::uint64_t{Value(entries_.subspan(at + 4, 4))} * size;
      if (bytes == 0 || bytes > file_.size()) return {};
      const auto count = static_cast<std::size_t>(bytes);
      // Up to four bytes stand in the entry itself.
      return {count <= 4 ? entries_.subspan(at + 8, count) : Part(Value(entries_.subspan(at + 8, 4)), count),
              size};
    }
    return {};
  }
  std::uint32_t At(const Numbers& numbers, std::size_t index) const {
    return Value(numbers.bytes.subspan(index * numbers.size, numbers.size));
  }
  // The first number of an entry; `otherwise` when there is none.
  std::uint32_t First(std::uint32_t tag, std::uint32_t otherwise) const {
    const Numbers numbers = Find(tag);
    return numbers.Count() > 0 ? At(numbers, 0) : otherwise;
  }

  // Empty when the file has not that many bytes there.
  Bytes Part(std::size_t at, std::size_t size) const {
    return at <= file_.size() && size <= file_.size() - at ? file_.subspan(at, size) : Bytes();
  }

 private:
  static constexpr std::size_t kEntry = 12;

  std::uint32_t Value(Bytes bytes) const { return little_ ? LittleEndian(bytes) : BigEndian(bytes); }

  Bytes file_;
  bool little_ = false;
  Bytes entries_;
};

unsigned Orientation(const TiffDirectory& directory) {
  const std::uint32_t told = directory.First(0x0112, 1);
  return told >= 1 && told <= 8 ? told : 1;
}

// --- PNG ---

// The smallest pieces that programs write are of about 8 KiB, or of a line; this is more than either needs.
constexpr int kMostPngChunks = 200'000;

PictureFacts ReducePng(std::span<std::uint8_t> file) {
  constexpr std::size_t kSignature = 8;
  constexpr std::size_t kAround = 12;  // length and name before the data, the check sum behind it
  constexpr std::size_t kHeaderEnd = kSignature + kAround + 13;
  if (file.size() < kHeaderEnd || BigEndian(file.subspan(kSignature, 4)) != 13 ||
      !StartsWith(file.subspan(kSignature + 4), "IHDR"))
    return {};
  const std::uint32_t width = BigEndian(file.subspan(16, 4));
  const std::uint32_t height = BigEndian(file.subspan(20, 4));
  if (!Shown(width, height)) return Refused(SizeFault(width, height));
  const unsigned depth = file[24];
  const unsigned colorType = file[25];
  const unsigned channels = (colorType & 1) != 0 ? 1 : ((colorType & 2) != 0 ? 3 : 1) + (colorType >> 2 & 1);
  // A line begins with its filter. What unpacks to four bytes a pixel is within the decoder's bound; putting
  // interlaced lines together takes as long again.
  const std::uint64_t unpacked = (std::uint64_t{width} * channels * depth / 8 + 2) * height;
  const std::uint64_t bytes = std::uint64_t{width} * height * channels * depth / 8;
  if ((file[28] != 0 ? 2 * bytes : bytes) > 4 * kMostPixels) return TooLarge();

  Kept kept(file);
  kept.Keep(0, kSignature);
  std::uint64_t packed = 0;
  int chunks = 0;
  unsigned orientation = 1;
  for (std::size_t at = kSignature; file.size() - at >= kAround;) {
    const std::uint32_t length = BigEndian(file.subspan(at, 4));
    const Bytes name = file.subspan(at + 4, 4);
    const bool data = StartsWith(name, "IDAT");
    const bool last = StartsWith(name, "IEND");
    if (length > file.size() - at - kAround) return {};
    const std::size_t end = at + kAround + length;
    if (StartsWith(name, "eXIf")) orientation = Orientation(TiffDirectory(file.subspan(at + 8, length)));
    if ((data && length > 0) || last || StartsWith(name, "IHDR") || StartsWith(name, "PLTE") ||
        StartsWith(name, "tRNS")) {
      kept.Keep(at, end);
      ++chunks;
    }
    if (data) packed += length;
    at = end;
    if (last) break;
  }
  // Packing adds next to nothing to what cannot be made smaller. More is blocks that unpack to nothing.
  if (chunks > kMostPngChunks || packed > unpacked + unpacked / 16 + 4096) return TooLarge();
  PictureFacts facts = Whole(PictureFormat::kPng, width, height);
  facts.orientation = orientation;
  facts.length = kept.Length();
  return facts;
}

// --- GIF ---

// A decoder empties its table of 4,096 entries with each clear code.
constexpr std::uint64_t kMostClearCodes = 500'000;

// Reads the codes of a picture as a decoder does, without what they stand for.
class GifCodes {
 public:
  explicit GifCodes(unsigned codeSize) : codeSize_(codeSize) { Clear(); }

  // False when there are too many clear codes.
  bool Read(Bytes block) {
    for (const std::uint8_t byte : block) {
      if (ended_) break;
      bits_ |= std::uint32_t{byte} << count_;
      count_ += 8;
      while (count_ >= width_ && !ended_) {
        const std::uint32_t code = bits_ & ((1U << width_) - 1);
        bits_ >>= width_;
        count_ -= width_;
        if (code == 1U << codeSize_) {
          Clear();
          ++clears_;
          if (HasTooMany()) return false;
        } else if (code == (1U << codeSize_) + 1) {
          ended_ = true;
        } else if (next_ <= 4096 && ++next_ > 1U << width_ && width_ < 12) {
          ++width_;
        }
      }
    }
    return true;
  }

  bool HasTooMany() const { return clears_ > kMostClearCodes; }

 private:
  void Clear() {
    width_ = codeSize_ + 1;
    next_ = (1U << codeSize_) + 2;
  }

  unsigned codeSize_;
  unsigned width_ = 0;
  std::uint32_t next_ = 0;
  std::uint32_t bits_ = 0;
  unsigned count_ = 0;
  std::uint64_t clears_ = 0;
  bool ended_ = false;
};

PictureFacts ReduceGif(std::span<std::uint8_t> file) {
  constexpr std::size_t kHeader = 13;
  if (file.size() < kHeader) return {};
  const auto tableBytes = [](unsigned flags) {
    return (flags & 0x80) != 0 ? std::size_t{3} << ((flags & 7) + 1) : std::size_t{0};
  };
  Kept kept(file);
  std::size_t at = kHeader + tableBytes(file[10]);
  if (at > file.size()) return {};
  kept.Keep(0, at);

  // Blocks of up to 255 bytes, each with its length before it; the end of the empty one that ends them.
  const auto blocksEnd = [&](std::size_t begin, GifCodes* codes) -> std::size_t {
    while (begin < file.size()) {
      const std::size_t length = file[begin];
      const std::size_t end = begin + 1 + length;
      if (end > file.size()) return 0;
      if (length == 0) return end;
      if (codes && !codes->Read(file.subspan(begin + 1, length))) return 0;
      begin = end;
    }
    return 0;
  };

  // The last control block before the picture says which colour is transparent.
  std::size_t control = 0;
  std::size_t controlEnd = 0;
  while (at + 2 <= file.size() && file[at] == 0x21) {
    const std::size_t end = blocksEnd(at + 2, nullptr);
    if (end == 0) return {};
    if (file[at + 1] == 0xF9) {
      control = at;
      controlEnd = end;
    }
    at = end;
  }
  constexpr std::size_t kDescriptor = 10;
  if (file.size() - at < kDescriptor || file[at] != 0x2C) return {};
  PictureFacts facts = Whole(PictureFormat::kGif, 0, 0);
  facts.left = LittleEndian(file.subspan(at + 1, 2));
  facts.top = LittleEndian(file.subspan(at + 3, 2));
  facts.frameWidth = LittleEndian(file.subspan(at + 5, 2));
  facts.frameHeight = LittleEndian(file.subspan(at + 7, 2));
  // A first picture that is larger than the whole makes the whole larger.
  facts.width = std::max(LittleEndian(file.subspan(6, 2)), facts.left + facts.frameWidth);
  facts.height = std::max(LittleEndian(file.subspan(8, 2)), facts.top + facts.frameHeight);
  if (!Shown(facts.frameWidth, facts.frameHeight))
    return Refused(SizeFault(facts.frameWidth, facts.frameHeight));
  if (!Shown(facts.width, facts.height)) return TooLarge();

  const std::size_t codeSizeAt = at + kDescriptor + tableBytes(file[at + 9]);
  if (codeSizeAt >= file.size() || file[codeSizeAt] < 1 || file[codeSizeAt] > 8) return {};
  GifCodes codes(file[codeSizeAt]);
  const std::size_t end = blocksEnd(codeSizeAt + 1, &codes);
  if (codes.HasTooMany()) return TooLarge();
  if (end == 0 || end == file.size()) return {};
  kept.Keep(control, controlEnd);
  kept.Keep(at, end);
  kept.Append(0x3B);
  facts.length = kept.Length();
  return facts;
}

// --- JPEG ---

// Tables of all scans together. A scan of a camera's or an image program's picture has about 1 KiB.
constexpr std::size_t kMostJpegTables = 1'000'000;

// A decoder goes over the whole picture with each scan, which takes about a twelfth of what the rest of the
// work does. Programs write 10 for colour, some up to 20: so many can be in a picture of 24 megapixels.
constexpr int kMostJpegScans = 40;
constexpr std::uint64_t kScanOfWork = 12;

PictureFacts ReduceJpeg(std::span<std::uint8_t> file) {
  Kept kept(file);
  kept.Keep(0, 2);
  std::optional<PictureFacts> facts;
  std::size_t tables = 0;
  int scans = 0;
  bool progressive = false;
  unsigned components = 0;
  std::optional<unsigned> orientation;
  for (std::size_t at = 2;;) {
    // Up to the next marker: 0xFF, repeated at will, and its number.
    const auto* mark =
        static_cast<const std::uint8_t*>(std::memchr(file.data() + at, 0xFF, file.size() - at));
    if (!mark) return {};
    at = static_cast<std::size_t>(mark - file.data());
    while (at < file.size() && file[at] == 0xFF) ++at;
    if (at == file.size()) return {};
    const std::uint8_t marker = file[at++];
    if (marker == 0xD9) {
      at -= 2;
      kept.Keep(at, at + 2);
      break;
    }
    if (marker <= 0x01 || (marker >= 0xD0 && marker <= 0xD8)) continue;
    if (file.size() - at < 2) return {};
    const std::size_t length = BigEndian(file.subspan(at, 2));
    if (length < 2 || length > file.size() - at) return {};
    const std::size_t begin = at - 2;
    const Bytes data = file.subspan(at + 2, length - 2);
    at += length;
    constexpr std::string_view kExif{"Exif\0\0", 6};
    if (marker == 0xE1 && !orientation && StartsWith(data, kExif))
      orientation = Orientation(TiffDirectory(data.subspan(kExif.size())));
    // All but the application's data and comments. Of those two tell how colours are meant.
    const bool jfif = marker == 0xE0;
    const bool adobe = marker == 0xEE;
    if (((marker & 0xF0) == 0xE0 && !jfif && !adobe) || marker == 0xFE) continue;
    tables += length;
    if (tables > kMostJpegTables) return TooLarge();
    if (marker >= 0xC0 && marker <= 0xCF && marker != 0xC4 && marker != 0xC8 && marker != 0xCC) {
      if (facts || data.size() < 6) return {};
      facts = Whole(PictureFormat::kJpeg, BigEndian(data.subspan(3, 2)), BigEndian(data.subspan(1, 2)));
      if (!Shown(facts->width, facts->height)) return Refused(SizeFault(facts->width, facts->height));
      components = data[5];
      progressive = marker == 0xC2;
    }
    // Told before the segment moves: what is kept may lie over where it was.
    const bool hasAll = !progressive && !data.empty() && data[0] == components;
    kept.Keep(begin, at);
    if (marker != 0xDA) continue;

    if (!facts || data.empty()) return {};
    if (++scans > kMostJpegScans) return TooLarge();
    if (hasAll) {
      // One scan has it all; the decoder stops at its end.
      kept.Keep(at, file.size());
      break;
    }
    // The coded data: up to a marker that is neither a stuffed 0xFF nor a restart.
    const std::size_t codes = at;
    for (;;) {
      mark = static_cast<const std::uint8_t*>(std::memchr(file.data() + at, 0xFF, file.size() - at));
      if (!mark || mark + 1 == file.data() + file.size()) return {};
      at = static_cast<std::size_t>(mark - file.data());
      const std::uint8_t next = file[at + 1];
      if (next != 0xFF && next != 0 && (next < 0xD0 || next > 0xD7)) break;
      at += next == 0xFF ? 1 : 2;
    }
    kept.Keep(codes, at);
  }
  if (!facts || scans == 0) return {};
  const std::uint64_t work = static_cast<std::uint64_t>(scans - 1) + kScanOfWork;
  if (std::uint64_t{facts->width} * facts->height * work > kMostPixels * kScanOfWork) return TooLarge();
  facts->orientation = orientation.value_or(1);
  facts->length = kept.Length();
  return *facts;
}

// --- BMP ---

// True when the run-length code fills every line of the picture. A decoder may leave what is skipped as it
// found the memory.
bool FillsAll(Bytes code, std::uint32_t width, std::uint32_t height, unsigned bits) {
  std::uint32_t x = 0;
  std::uint32_t y = 0;
  for (std::size_t at = 0; code.size() - at >= 2;) {
    const std::uint32_t count = code[at];
    const std::uint32_t value = code[at + 1];
    at += 2;
    if (count > 0) {
      x += count;
    } else if (value == 0 && x == width) {
      x = 0;
      ++y;
    } else if (value == 1) {
      return y == height || (y + 1 == height && x == width);
    } else if (value >= 3) {
      x += value;
      // Pixels as they are, filled up to 16 bits.
      const std::size_t length = (std::size_t{value} * bits + 15) / 16 * 2;
      if (length > code.size() - at) return false;
      at += length;
    } else {
      return false;
    }
    if (x > width || y > height || (y == height && x > 0)) return false;
  }
  return y == height || (y + 1 == height && x == width);
}

PictureFacts ReduceBmp(std::span<std::uint8_t> file) {
  constexpr std::size_t kFileHeader = 14;
  if (file.size() < kFileHeader + 12) return {};
  const std::uint32_t offset = LittleEndian(file.subspan(10, 4));
  const std::uint32_t headerSize = LittleEndian(file.subspan(14, 4));
  std::uint32_t width = 0;
  std::uint32_t height = 0;
  std::uint32_t bits = 0;
  std::uint32_t compression = 0;
  if (headerSize == 12) {
    width = LittleEndian(file.subspan(18, 2));
    height = LittleEndian(file.subspan(20, 2));
    bits = LittleEndian(file.subspan(24, 2));
  } else {
    if (headerSize < 40 || file.size() < kFileHeader + 40) return {};
    width = LittleEndian(file.subspan(18, 4));
    height = LittleEndian(file.subspan(22, 4));
    // Negative when the lines come from the top.
    if ((height & 0x80000000U) != 0) height = 0U - height;
    bits = LittleEndian(file.subspan(28, 2));
    compression = LittleEndian(file.subspan(30, 4));
  }
  if (!Shown(width, height)) return Refused(SizeFault(width, height));
  if (bits > 32 || offset > file.size()) return {};
  if (compression == 1 || compression == 2) {
    if (!FillsAll(file.subspan(offset), width, height, compression == 1 ? 8 : 4)) return {};
  } else {
    const std::uint64_t stride = (std::uint64_t{width} * bits + 31) / 32 * 4;
    if (stride * height > file.size() - offset) return {};
  }
  PictureFacts facts = Whole(PictureFormat::kBmp, width, height);
  facts.length = file.size();
  return facts;
}

// --- TIFF ---

// Of tables that all parts of a JPEG-packed picture share.
constexpr std::size_t kMostTiffTables = 65'536;
// A part has one for all colours, or one for each.
constexpr int kMostTiffScans = 4;

int ScansIn(Bytes jpeg) {
  const auto isScan = [](std::uint8_t one, std::uint8_t next) { return one == 0xFF && next == 0xDA; };
  int scans = 0;
  for (auto at = jpeg.begin(); (at = std::adjacent_find(at, jpeg.end(), isScan)) != jpeg.end(); ++at) ++scans;
  return scans;
}

PictureFacts ReduceTiff(std::span<std::uint8_t> file) {
  const TiffDirectory directory(file);
  const std::uint32_t width = directory.First(0x0100, 0);
  const std::uint32_t height = directory.First(0x0101, 0);
  if (!Shown(width, height)) return Refused(SizeFault(width, height));
  // Tiles, or strips of whole lines, which may be larger than the picture.
  const bool tiled = directory.Find(0x0142).Count() > 0;
  const std::uint64_t partWidth = tiled ? directory.First(0x0142, 0) : width;
  const std::uint64_t partHeight =
      tiled ? directory.First(0x0143, 0) : std::min(directory.First(0x0116, height), height);
  if (partWidth == 0 || partHeight == 0) return {};
  if (std::max({width, height}) > kLongestSide || partWidth > kLongestSide || partHeight > kLongestSide)
    return TooLarge();
  const std::uint64_t pixels =
      (width + partWidth - 1) / partWidth * partWidth * ((height + partHeight - 1) / partHeight * partHeight);
  const std::uint64_t bits = std::uint64_t{directory.First(0x0102, 1)} * directory.First(0x0115, 1);
  // Four bytes for each pixel of the picture, and a quarter for what tiles have beside it.
  if (pixels > 2 * kMostPixels || pixels * bits > 40 * kMostPixels) return TooLarge();

  const auto offsets = directory.Find(tiled ? 0x0144 : 0x0111);
  const auto sizes = directory.Find(tiled ? 0x0145 : 0x0117);
  if (offsets.Count() == 0 || offsets.Count() != sizes.Count()) return {};
  const std::uint32_t packing = directory.First(0x0103, 1);
  constexpr std::uint32_t kOldJpeg = 6;
  constexpr std::uint32_t kJpeg = 7;
  if (packing == kOldJpeg) return Refused(PictureFault::kOtherKind);
  if (directory.Find(0x015B).Count() > kMostTiffTables) return TooLarge();
  std::uint64_t packed = 0;
  for (std::size_t i = 0; i < sizes.Count(); ++i) {
    const Bytes part = directory.Part(directory.At(offsets, i), directory.At(sizes, i));
    if (part.empty()) return {};
    // Parts that lie over each other would be unpacked again and again.
    packed += part.size();
    if (packed > file.size()) return TooLarge();
    if (packing == kJpeg && ScansIn(part) > kMostTiffScans) return TooLarge();
  }
  PictureFacts facts = Whole(PictureFormat::kTiff, width, height);
  facts.orientation = Orientation(directory);
  facts.length = file.size();
  return facts;
}

// What only a decoder knows more about, which reads no pixels before it is asked for some.
PictureFacts Unmeasured(PictureFormat format, std::size_t length) {
  PictureFacts facts = Whole(format, 0, 0);
  facts.length = length;
  return facts;
}

}  // namespace

PictureFault SizeFault(std::uint64_t width, std::uint64_t height) {
  if (width == 0 || height == 0) return PictureFault::kDamaged;
  const bool shown = width <= kMostPixels && height <= kMostPixels && width * height <= kMostPixels;
  return shown ? PictureFault::kNone : PictureFault::kTooLarge;
}

std::optional<PictureFormat> FormatOf(std::span<const std::uint8_t> head) {
  if (StartsWith(head, "\x89PNG\r\n\x1A\n")) return PictureFormat::kPng;
  if (StartsWith(head, "GIF87a") || StartsWith(head, "GIF89a")) return PictureFormat::kGif;
  if (StartsWith(head, "\xFF\xD8\xFF")) return PictureFormat::kJpeg;
  if (StartsWith(head, "BM")) return PictureFormat::kBmp;
  if (StartsWith(head, {"II*\0", 4}) || StartsWith(head, {"MM\0*", 4})) return PictureFormat::kTiff;
  if (head.size() < kFormatBytes) return {};
  if (StartsWith(head, "RIFF") && StartsWith(head.subspan(8), "WEBP")) return PictureFormat::kWebp;
  // Films begin alike, with other brands.
  if (StartsWith(head.subspan(4), "ftyp"))
    for (const std::string_view brand :
         {"heic", "heix", "hevc", "hevx", "heim", "heis", "mif1", "msf1", "avif"})
      if (StartsWith(head.subspan(8), brand)) return PictureFormat::kHeif;
  return {};
}

PictureFacts ReducePicture(std::span<std::uint8_t> file) {
  const std::optional<PictureFormat> format = FormatOf(file);
  if (!format) return Refused(PictureFault::kOtherKind);
  switch (*format) {
    case PictureFormat::kPng:
      return ReducePng(file);
    case PictureFormat::kGif:
      return ReduceGif(file);
    case PictureFormat::kJpeg:
      return ReduceJpeg(file);
    case PictureFormat::kBmp:
      return ReduceBmp(file);
    case PictureFormat::kTiff:
      return ReduceTiff(file);
    case PictureFormat::kWebp:
    case PictureFormat::kHeif:
      break;
  }
  return Unmeasured(*format, file.size());
}

}  // namespace tarnwick
