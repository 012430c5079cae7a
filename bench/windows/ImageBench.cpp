// Reading the sizes of pictures beside plain reading, Windows imaging and stb, and loading pictures that are
// made to take long.
//
// The folder holds "picture-*" (any number of small pictures), "large-0.jpg" (of 12 megapixels), and
// "crafted-*" (pictures just within the limits of what is shown).
#include "Bench.h"

#include <wincodec.h>

#include "StbImage.h"
#include "controls/windows/PictureLoader.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/WindowsFileSystem.h"
#include "support/CImageHeight.h"

namespace tarnwick::bench {
namespace {

// Side of a slot of the thumbnail page, in pixels.
constexpr int kSide = 160;

// Full names of the files that match the pattern.
std::vector<std::wstring> Files(const std::wstring& folder, const wchar_t* pattern) {
  std::vector<std::wstring> files;
  WIN32_FIND_DATAW found = {};
  const HANDLE search = FindFirstFileW((folder + L"\\" + pattern).c_str(), &found);
  if (search == INVALID_HANDLE_VALUE) Stop("a picture is missing");
  do files.push_back(folder + L"\\" + found.cFileName);
  while (FindNextFileW(search, &found));
  FindClose(search);
  return files;
}

// Opens, reads and closes; at most the bytes that count.
std::size_t ReadHead(const std::wstring& path, std::vector<char>& room) {
  const HANDLE file =
      CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
  DWORD count = 0;
  ReadFile(file, room.data(), static_cast<DWORD>(room.size()), &count, nullptr);
  CloseHandle(file);
  return count;
}

// Width by Windows imaging; 0 on failure.
UINT ImagingWidth(IWICImagingFactory& factory, const std::wstring& path) {
  ComPtr<IWICBitmapDecoder> decoder;
  ComPtr<IWICBitmapFrameDecode> frame;
  UINT width = 0;
  UINT height = 0;
  if (SUCCEEDED(factory.CreateDecoderFromFilename(path.c_str(), nullptr, GENERIC_READ,
                                                  WICDecodeMetadataCacheOnDemand, decoder.Receive())) &&
      SUCCEEDED(decoder->GetFrame(0, frame.Receive())))
    frame->GetSize(&width, &height);
  return width;
}

void SizesBench(const std::wstring& folder) {
  const std::vector<std::wstring> files = Files(folder, L"picture-*");
  std::vector<Text> paths;
  std::vector<std::string> narrow;
  for (const std::wstring& file : files) {
    paths.push_back(TextFromWide(file));
    narrow.emplace_back(file.begin(), file.end());
  }
  WindowsFileSystem system;
  CImageHeight reader(system);
  std::vector<char> room(CImageHeight::kHeadBytes);
  ComPtr<IWICImagingFactory> factory;
  CoCreateInstance(CLSID_WICImagingFactory, nullptr, CLSCTX_INPROC_SERVER, IID_IWICImagingFactory,
                   factory.ReceiveVoid());
  const auto each = [&](const std::function<bool(std::size_t)>& work) {
    return [&files, work] {
      return Seconds([&] {
        for (std::size_t i = 0; i < files.size(); ++i)
          if (!work(i)) Stop("a picture was not recognised");
      });
    };
  };
  const auto ours = each([&](std::size_t i) {
    reader.ReadImageInfo(paths[i]);
    return reader.Width() > 0;
  });
  std::vector<Side> sides = {
      {"library", ours},
      {"open, read, close", each([&](std::size_t i) { return ReadHead(files[i], room) > 0; })},
      {"Windows imaging", each([&](std::size_t i) { return ImagingWidth(*factory.Get(), files[i]) > 0; })},
      {"stbi_info", each([&](std::size_t i) { return StbWidth(narrow[i].c_str()) > 0; })}};
  for (Side& side : sides) side.units = static_cast<double>(files.size());
  Measure(sides);
  const std::string what = "size of one of " + std::to_string(files.size()) + " pictures";
  Row(what, sides[0], sides[1], "<=1.3", "the search for the size; opening is nearly all of both");
  Row(what, sides[0], sides[2], ">=4.0",
      "opening is nearly all of the library's; the peer also makes a decoder");
  Row(what, sides[0], sides[3], "", "the peer reads only as far as the size");
}

}  // namespace

void ImageBench(const std::wstring& folder) {
  SizesBench(folder);

  const auto load = [](const std::wstring& path) {
    return static_cast<bool>(LoadPicture(path, kSide, kSide, RGB(255, 255, 255)));
  };
  const std::wstring large = Files(folder, L"large-0.jpg").front();
  const auto seconds = [&load](const std::wstring& path) { return Seconds([&] { load(path); }); };
  const std::vector<std::wstring> crafted = Files(folder, L"crafted-*");
  std::vector<Side> sides = {{"12-megapixel JPEG", [&] { return seconds(large); }}};
  for (const std::wstring& path : crafted)
    sides.push_back({"library", [&seconds, path] { return seconds(path); }});
  Measure(sides);
  for (std::size_t i = 0; i < crafted.size(); ++i) {
    const std::wstring name = crafted[i].substr(crafted[i].rfind(L'\\') + 1);
    Row(std::string(name.begin(), name.end()) + (load(crafted[i]) ? "" : ", refused"), sides[i + 1], sides[0],
        "<=3.0", "unpacking up to 64 million pixels in windowscodecs, half of all samples");
  }
}

}  // namespace tarnwick::bench
