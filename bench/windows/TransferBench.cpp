// Measures transfers of the list control side by side with a plain loop over WinINet and with
// URLDownloadToFile, and the filling of the list beside a bare owner-data list. Prints one table of ratios;
// ends with 1 when one is out of bounds.
//
//   tarnwick_transfer_bench SERVER USER PASSWORD PRODUCT LARGE SMALL-COUNT
//
// The account holds the file "large.jpg" of LARGE bytes and SMALL-COUNT files "small-N.jpg". Each figure is
// the fastest of several runs that take turns.
#include "ControlContainer.h"
#include "platform/windows/CommonControls.h"
#include "support/surface/TypeLibrary.h"

#include <psapi.h>
#include <urlmon.h>
#include <wininet.h>

#include <algorithm>
#include <cstdio>
#include <functional>
#include <string>
#include <vector>

namespace tarnwick::bench {
namespace {

constexpr int kRuns = 3;

[[noreturn]] void Stop(const char* what) {
  std::fprintf(stderr, "transfer bench: %s\n", what);
  ExitProcess(2);
}

double Seconds(const std::function<void()>& work) {
  LARGE_INTEGER frequency = {};
  LARGE_INTEGER begin = {};
  LARGE_INTEGER end = {};
  QueryPerformanceFrequency(&frequency);
  QueryPerformanceCounter(&begin);
  work();
  QueryPerformanceCounter(&end);
  return static_cast<double>(end.QuadPart - begin.QuadPart) / static_cast<double>(frequency.QuadPart);
}

// The fastest of several runs of each; they take turns, so that a busy moment hits all alike.
std::vector<double> Fastest(const std::vector<std::function<void()>>& works) {
  std::vector<double> best(works.size(), 1e9);
  for (int run = 0; run < kRuns; ++run)
    for (std::size_t i = 0; i < works.size(); ++i) best[i] = std::min(best[i], Seconds(works[i]));
  return best;
}

class Bstr {
 public:
  explicit Bstr(const std::wstring& text)
      : text_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}
  ~Bstr() { SysFreeString(text_); }
  Bstr(const Bstr&) = delete;
  Bstr& operator=(const Bstr&) = delete;
  operator BSTR() const { return text_; }  // NOLINT(google-explicit-constructor)
  BSTR* Reference() { return &text_; }

 private:
  BSTR text_;
};

// The plain loop: read a block, write a block.
void WinInetDownload(const std::wstring& url, const wchar_t* path) {
  const HINTERNET session = InternetOpenW(L"bench", INTERNET_OPEN_TYPE_DIRECT, nullptr, nullptr, 0);
  const HINTERNET request = InternetOpenUrlW(session, url.c_str(), nullptr, 0,
                                             INTERNET_FLAG_RELOAD | INTERNET_FLAG_NO_CACHE_WRITE, 0);
  const HANDLE file = CreateFileW(path, GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr);
  std::vector<char> block(64 * 1024);
  DWORD count = 0;
  while (InternetReadFile(request, block.data(), static_cast<DWORD>(block.size()), &count) && count > 0) {
    DWORD written = 0;
    WriteFile(file, block.data(), count, &written, nullptr);
  }
  CloseHandle(file);
  InternetCloseHandle(request);
  InternetCloseHandle(session);
}

// The plain loop upwards: the same multipart body, a block at a time.
void WinInetUpload(const std::wstring& host, INTERNET_PORT port,
                   const std::vector<std::pair<std::string, std::string>>& fields, const wchar_t* path) {
  const std::string boundary = "bench0123456789";
  std::string head;
  for (const auto& [name, value] : fields)
    head += "--" + boundary + "\r\nContent-Disposition: form-data; name=\"" + name + "\"\r\n\r\n" + value +
            "\r\n";
  head +=
      "--" + boundary + "\r\nContent-Disposition: form-data; name=\"File\"; filename=\"upload.jpg\"\r\n\r\n";
  const std::string tail = "\r\n--" + boundary + "--\r\n";
  const HANDLE file = CreateFileW(path, GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
  const HINTERNET session = InternetOpenW(L"bench", INTERNET_OPEN_TYPE_DIRECT, nullptr, nullptr, 0);
  const HINTERNET connection =
      InternetConnectW(session, host.c_str(), port, nullptr, nullptr, INTERNET_SERVICE_HTTP, 0, 0);
  const HINTERNET request = HttpOpenRequestW(connection, L"POST", L"/httpupload/UploadAcceptor.asp", nullptr,
                                             nullptr, nullptr, INTERNET_FLAG_RELOAD, 0);
  const std::wstring header = L"Content-Type: multipart/form-data; boundary=bench0123456789\r\n";
  INTERNET_BUFFERSW buffers = {};
  buffers.dwStructSize = sizeof buffers;
  buffers.lpcszHeader = header.c_str();
  buffers.dwHeadersLength = static_cast<DWORD>(header.size());
  buffers.dwBufferTotal = static_cast<DWORD>(head.size() + GetFileSize(file, nullptr) + tail.size());
  if (!HttpSendRequestExW(request, &buffers, nullptr, 0, 0)) Stop("the upload loop cannot connect");
  DWORD written = 0;
  InternetWriteFile(request, head.data(), static_cast<DWORD>(head.size()), &written);
  std::vector<char> block(64 * 1024);
  DWORD count = 0;
  while (ReadFile(file, block.data(), static_cast<DWORD>(block.size()), &count, nullptr) && count > 0)
    InternetWriteFile(request, block.data(), count, &written);
  InternetWriteFile(request, tail.data(), static_cast<DWORD>(tail.size()), &written);
  if (!HttpEndRequestW(request, nullptr, 0, 0)) Stop("the upload loop has no answer");
  InternetCloseHandle(request);
  InternetCloseHandle(connection);
  InternetCloseHandle(session);
  CloseHandle(file);
}

bool within = true;

// `most`: the ratio may be at most, else at least, `limit`.
void Row(const char* what, double ours, const char* peer, double theirs, double limit, bool most) {
  const double ratio = most ? ours / theirs : theirs / ours;
  const bool good = most ? ratio <= limit : ratio >= limit;
  within = within && good;
  std::printf("%-34s %9.1f ms  %-22s %9.1f ms  %6.2f  %s %5.2f  %s\n", what, ours * 1000, peer, theirs * 1000,
              ratio, most ? "at most " : "at least", limit, good ? "good" : "OUT OF BOUNDS");
}

std::size_t PeakBytes() {
  PROCESS_MEMORY_COUNTERS counters = {};
  GetProcessMemoryInfo(GetCurrentProcess(), &counters, sizeof counters);
  return counters.PeakPagefileUsage;
}

int Run(int count, wchar_t** words) {
  if (count < 7) Stop("SERVER USER PASSWORD PRODUCT LARGE SMALL-COUNT");
  const std::wstring server = words[1];
  const auto large = static_cast<std::size_t>(_wtoi(words[5]));
  const int small = _wtoi(words[6]);

  ComPtr<_ctrlListImage> list;
  if (FAILED(CoCreateInstance(CLSID_ctrlListImage, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_ctrlListImage),
                              list.ReceiveVoid())))
    Stop("the library is not registered");
  ComPtr<_CFileUpload> client;
  list->get_mobjFileupload(client.Receive());
  VARIANT_BOOL done = VARIANT_FALSE;
  client->ConnectToServer(Bstr(server), &done);
  client->LogonAs(Bstr(words[4]), Bstr(words[2]), Bstr(words[3]), Bstr(L""), &done);
  Bstr all(L"*");
  if (!done || FAILED(list->Init(all.Reference(), &done))) Stop("no account");
  BSTR base = nullptr;
  client->GetUserBasePath(&base);
  const std::wstring folder = std::wstring(base) + L"/";
  SysFreeString(base);

  CreateDirectoryW(L"bench-files", nullptr);
  const auto ours = [&](const std::wstring& name) {
    Bstr text(name);
    VARIANT ignored = {};
    list->UploadedFileSetFocus(text.Reference(), &ignored);
    BSTR local = nullptr;
    list->DownLoadFileFromServer(Bstr(L"bench-files"), &local);
    if (GetFileAttributesW(local) == INVALID_FILE_ATTRIBUTES) Stop("a download failed");
    SysFreeString(local);
  };
  const std::size_t before = PeakBytes();
  ours(L"large.jpg");
  const std::size_t peak = PeakBytes() - before;
  const auto big = Fastest({[&] { ours(L"large.jpg"); },
                            [&] { WinInetDownload(folder + L"large.jpg", L"bench-files\\large.wininet"); },
                            [&] {
                              DeleteUrlCacheEntryW((folder + L"large.jpg").c_str());
                              URLDownloadToFileW(nullptr, (folder + L"large.jpg").c_str(),
                                                 L"bench-files\\large.urlmon", 0, nullptr);
                            }});
  const auto each = [&](const std::function<void(const std::wstring&)>& work) {
    return [&, work] {
      for (int i = 0; i < small; ++i) work(L"small-" + std::to_wstring(i) + L".jpg");
    };
  };
  const auto many = Fastest(
      {each(ours),
       each([&](const std::wstring& name) { WinInetDownload(folder + name, L"bench-files\\small.wininet"); }),
       each([&](const std::wstring& name) {
         DeleteUrlCacheEntryW((folder + name).c_str());
         URLDownloadToFileW(nullptr, (folder + name).c_str(), L"bench-files\\small.urlmon", 0, nullptr);
       })});
  CopyFileW(L"bench-files\\large.jpg", L"bench-files\\upload.jpg", FALSE);
  const auto ansi = [](const std::wstring& text) { return std::string(text.begin(), text.end()); };
  const std::size_t colon = server.find(L':');
  const std::vector<std::pair<std::string, std::string>> fields = {
      {"UsersBaseUrl", "http://" + ansi(server) + "/users/"},
      {"Flag", "0"},
      {"User", ansi(words[2])},
      {"Password", ansi(words[3])},
      {"ProductID", "4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E"}};
  const auto up =
      Fastest({[&] { list->UploadImage(Bstr(L"bench-files\\upload.jpg"), &done); },
               [&] {
                 WinInetUpload(server.substr(0, colon),
                               static_cast<INTERNET_PORT>(_wtoi(server.substr(colon + 1).c_str())), fields,
                               L"bench-files\\upload.jpg");
               }});

  std::printf("%-34s %12s  %-22s %12s  %6s\n", "the library", "", "peer", "", "ratio");
  Row("download, one large file", big[0], "WinINet loop", big[1], 1.0, false);
  Row("download, one large file", big[0], "URLDownloadToFile", big[2], 3.0, false);
  Row("download, many small files", many[0], "URLDownloadToFile", many[2], 1.0, false);
  Row("download, many small files", many[0], "WinINet loop", many[1], 0.8, false);
  Row("upload, one large file", up[0], "WinINet loop", up[1], 1.0, false);
  const double share = static_cast<double>(peak) / static_cast<double>(large);
  within = within && share <= 1.25;
  std::printf("peak memory of the large download: %.2f times the file, at most 1.25  %s\n", share,
              share <= 1.25 ? "good" : "OUT OF BOUNDS");
  return within ? 0 : 1;
}

}  // namespace
}  // namespace tarnwick::bench

int wmain(int count, wchar_t** words) {
  OleInitialize(nullptr);
  const int result = tarnwick::bench::Run(count, words);
  OleUninitialize();
  return result;
}
