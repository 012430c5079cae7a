// Reading the sizes of pictures beside plain reading, Windows imaging and stb; loading a page of large
// pictures beside what the system draws; and the pictures that are made to take long.
//
// The folder holds "picture-*" (any number of small pictures), "large-0.jpg" to "large-3.jpg" (12 megapixels
// each), and "crafted-*" (pictures just within the limits of what is shown).
#include "Bench.h"

#include <olectl.h>
#include <wincodec.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <fstream>
#include <iterator>

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

// The peer: decodes the whole picture and lets GDI shrink it.
void LoadByOle(const std::wstring& path) {
  const HANDLE file =
      CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
  const DWORD size = GetFileSize(file, nullptr);
  const HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, size);
  DWORD count = 0;
  ReadFile(file, GlobalLock(block), size, &count, nullptr);
  GlobalUnlock(block);
  CloseHandle(file);
  ComPtr<IStream> stream;
  CreateStreamOnHGlobal(block, TRUE, stream.Receive());
  ComPtr<IPicture> picture;
  if (FAILED(
          OleLoadPicture(stream.Get(), static_cast<LONG>(size), FALSE, IID_IPicture, picture.ReceiveVoid())))
    Stop("OleLoadPicture failed");
  OLE_HANDLE handle = 0;
  picture->get_Handle(&handle);
  BITMAP facts = {};
  const auto bitmap = reinterpret_cast<HBITMAP>(static_cast<UINT_PTR>(handle));
  GetObjectW(bitmap, sizeof facts, &facts);
  const HDC screen = GetDC(nullptr);
  const HDC source = CreateCompatibleDC(screen);
  const HDC target = CreateCompatibleDC(screen);
  const HBITMAP small = CreateCompatibleBitmap(screen, kSide, kSide);
  const HGDIOBJ oldSource = SelectObject(source, bitmap);
  const HGDIOBJ oldTarget = SelectObject(target, small);
  SetStretchBltMode(target, HALFTONE);
  StretchBlt(target, 0, 0, kSide, kSide, source, 0, 0, facts.bmWidth, facts.bmHeight, SRCCOPY);
  SelectObject(source, oldSource);
  SelectObject(target, oldTarget);
  DeleteObject(small);
  DeleteDC(source);
  DeleteDC(target);
  ReleaseDC(nullptr, screen);
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
      for (std::size_t i = 0; i < files.size(); ++i)
        if (!work(i)) Stop("a picture was not recognised");
    };
  };
  const auto ours = each([&](std::size_t i) {
    reader.ReadImageInfo(paths[i]);
    return reader.Width() > 0;
  });
  const auto plain = Fastest(20, {ours, each([&](std::size_t i) { return ReadHead(files[i], room) > 0; })});
  const auto others =
      Fastest(3, {each([&](std::size_t i) { return ImagingWidth(*factory.Get(), files[i]) > 0; }),
                  each([&](std::size_t i) { return StbWidth(narrow[i].c_str()) > 0; })});
  const std::string what = "sizes of " + std::to_string(files.size()) + " pictures";
  AtMost(1.3, what.c_str(), plain[0], "open, read, close", plain[1]);
  AtLeast(4.0, what.c_str(), plain[0], "Windows imaging", others[0]);
  Beside(what.c_str(), plain[0], "stbi_info", others[1]);
}

}  // namespace

void ImageBench(const std::wstring& folder) {
  SizesBench(folder);

  const std::vector<std::wstring> large = Files(folder, L"large-*.jpg");
  const auto load = [](const std::wstring& path) {
    return static_cast<bool>(LoadPicture(path, kSide, kSide, RGB(255, 255, 255)));
  };
  const auto page = Fastest(3, {[&] {
                                  for (const std::wstring& path : large)
                                    if (!load(path)) Stop("a large picture was not loaded");
                                },
                                [&] { std::for_each(large.begin(), large.end(), LoadByOle); }});
  AtLeast(1.0, "page of four 12-megapixel JPEGs", page[0], "OleLoadPicture, Stretch", page[1]);

  for (const std::wstring& path : Files(folder, L"crafted-*")) {
    bool shown = false;
    const auto times = Fastest(3, {[&] { shown = load(path); }, [&] { load(large[0]); }});
    const std::string name(path.begin() + static_cast<std::ptrdiff_t>(path.rfind(L'\\') + 1), path.end());
    AtMost(3.0, (name + (shown ? "" : ", refused")).c_str(), times[0], "12-megapixel JPEG", times[1]);
  }
}

}  // namespace tarnwick::bench
