// A page of four large pictures in the window of the thumbnail control, beside what the system decodes and
// draws, and how long the window's thread answers nothing meanwhile.
//
// The account holds four JPEGs of 12 megapixels, in which red outweighs blue, and nothing else.
#include "Bench.h"

#include <olectl.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <thread>

namespace tarnwick::bench {
namespace {

constexpr int kSlots = 4;
constexpr SIZE kSize = {336, 408};
// Side of a slot's picture, in pixels.
constexpr int kSide = 131;

// --- The peer ---

// Decodes the whole picture and lets GDI shrink it.
void DrawByOle(HDC target, const std::wstring& path) {
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
  const HDC source = CreateCompatibleDC(target);
  const HGDIOBJ old = SelectObject(source, bitmap);
  SetStretchBltMode(target, HALFTONE);
  StretchBlt(target, 0, 0, kSide, kSide, source, 0, 0, facts.bmWidth, facts.bmHeight, SRCCOPY);
  SelectObject(source, old);
  DeleteDC(source);
}

// --- The library ---

// Posts a message to the thread that makes it every 5 ms, and notes the longest time until one is handled.
class Pulse {
 public:
  Pulse()
      : window_(CreateWindowExW(0, L"STATIC", L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr, nullptr, nullptr)) {
    SetWindowLongPtrW(window_, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(this));
    SetWindowLongPtrW(window_, GWLP_WNDPROC, reinterpret_cast<LONG_PTR>(&Handle));
    poster_ = std::thread([this] {
      while (!ended_) {
        PostMessageW(window_, WM_APP, 0, static_cast<LPARAM>(Now()));
        Sleep(5);
      }
    });
  }
  // Seconds of the longest wait; no message comes after that.
  double End() {
    ended_ = true;
    poster_.join();
    Pump();
    DestroyWindow(window_);
    return longest_ / 1e3;
  }

 private:
  // Milliseconds; the system's own count goes in steps of 16 under Wine.
  static DWORD Now() {
    using namespace std::chrono;
    return static_cast<DWORD>(duration_cast<milliseconds>(steady_clock::now().time_since_epoch()).count());
  }
  static LRESULT CALLBACK Handle(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
    auto* const pulse = reinterpret_cast<Pulse*>(GetWindowLongPtrW(window, GWLP_USERDATA));
    if (message == WM_APP) pulse->longest_ = std::max(pulse->longest_, Now() - static_cast<DWORD>(lParam));
    return DefWindowProcW(window, message, wParam, lParam);
  }

  HWND window_;
  DWORD longest_ = 0;
  std::atomic<bool> ended_ = false;
  std::thread poster_;
};

// How many slots show a picture: in the middle of one is a colour, and of one without is none.
BOOL CALLBACK CountPictures(HWND child, LPARAM count) {
  RECT area = {};
  GetClientRect(child, &area);
  // The grid around the slots is wider.
  if (area.right > 2 * kSide || !IsWindowVisible(child)) return TRUE;
  const HDC dc = GetDC(child);
  const COLORREF middle = GetPixel(dc, area.right / 2, kSide / 2);
  ReleaseDC(child, dc);
  if (middle != CLR_INVALID && GetRValue(middle) > GetBValue(middle) + 30) ++*reinterpret_cast<int*>(count);
  return TRUE;
}

int PicturesShown(HWND window) {
  int count = 0;
  EnumChildWindows(window, CountPictures, reinterpret_cast<LPARAM>(&count));
  return count;
}

// Handles messages until `done`, and waits for the next one meanwhile; false after that many seconds.
bool PumpUntil(double limit, const std::function<bool()>& done) {
  bool met = false;
  const auto begin = std::chrono::steady_clock::now();
  while (!(met = done()) && std::chrono::steady_clock::now() - begin < std::chrono::duration<double>(limit)) {
    MsgWaitForMultipleObjects(0, nullptr, FALSE, 5, QS_ALLINPUT);
    Pump();
  }
  return met;
}

void CALLBACK EndIdling(HWND, UINT, UINT_PTR timer, DWORD) {
  KillTimer(nullptr, timer);
  PostQuitMessage(0);
}

// Handles messages for that many milliseconds, as a host that has nothing else to do.
void Idle(UINT milliseconds) {
  SetTimer(nullptr, 0, milliseconds, EndIdling);
  MSG message = {};
  while (GetMessageW(&message, nullptr, 0, 0) > 0) DispatchMessageW(&message);
}

struct Page {
  double seconds;
  // For that long the thread handled no message.
  double silence;
};

// Shows the account in a new control, which has not seen the pictures yet.
Page ShowPage(const Form& form, const Account& account) {
  const ComPtr<_ctrlThumbNailView> control = form.Control<_ctrlThumbNailView>();
  ComPtr<_CFileUpload> client;
  control->get_mobjFileupload(client.Receive());
  const std::wstring url = LogOn(*client, account);
  Native("mkdir -p '" + NativePath(UserFolder(url)) + "'; touch '" + NativePath(UserFolder(url)) + "'/*");
  Pulse pulse;
  Page page = {};
  page.seconds = Seconds([&] {
    Bstr all(L"*");
    VARIANT_BOOL done = VARIANT_FALSE;
    control->Init(all.Reference(), &done);
    if (!PumpUntil(60, [&] { return PicturesShown(form.Window()) == kSlots; })) Stop("the page is not drawn");
  });
  page.silence = pulse.End();
  return page;
}

}  // namespace

void PageBench(const Account& account) {
  std::wstring folder;
  {
    // Fetches the pictures.
    const Form form(CLSID_ctrlThumbNailView, kSize);
    ShowPage(form, account);
    ComPtr<_CFileUpload> client;
    form.Control<_ctrlThumbNailView>()->get_mobjFileupload(client.Receive());
    folder = UserFolder(LogOn(*client, account));
  }
  const HDC screen = GetDC(nullptr);
  const HDC memory = CreateCompatibleDC(screen);
  const HBITMAP bitmap = CreateCompatibleBitmap(screen, kSide, kSide);
  SelectObject(memory, bitmap);
  std::vector<double> silences;
  std::vector<Side> sides = {{"library",
                              [&] {
                                const Form form(CLSID_ctrlThumbNailView, kSize);
                                const Page page = ShowPage(form, account);
                                silences.push_back(page.silence);
                                return page.seconds;
                              }},
                             {"OleLoadPicture, StretchBlt", [&] {
                                return Seconds([&] {
                                  for (int i = 0; i < kSlots; ++i)
                                    DrawByOle(memory, folder + L"\\large-" + std::to_wstring(i) + L".jpg");
                                });
                              }}};
  Measure(sides);
  // Of the round that does not count.
  silences.erase(silences.begin());
  DeleteDC(memory);
  DeleteObject(bitmap);
  ReleaseDC(nullptr, screen);
  Row("page of four 12-megapixel JPEGs", sides[0], sides[1], BoundByProcessors(">=2.0", ">=1.4"),
      "the decoder in windowscodecs, two thirds of all samples, and fresh memory for its pixels, a fifth; "
      "both have them");
  Row("the same, processors that were free", FreeProcessors(), "x", "", "other programs");
  Row("the same, longest time without an answer", {"library", {}, 1, silences}, "s", "<=0.1",
      "what the window's thread does in one piece");

  const Form form(CLSID_ctrlThumbNailView, kSize);
  ShowPage(form, account);
  const double before = ProcessorSeconds();
  Idle(10'000);
  Row("processor time of a page that is shown for 10 s", {"library", {}, 1, {ProcessorSeconds() - before}},
      "s", "<=0.01", "none: the wait is for messages");
}

}  // namespace tarnwick::bench
