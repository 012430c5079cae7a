// Transfers of the list control beside a plain loop over WinINet and URLDownloadToFile.
//
// The account holds the file "large.jpg" of LARGE bytes, SMALL-COUNT files "small-N.jpg", and "stall.jpg",
// for which the server sends nothing.
#include "Bench.h"

#include <urlmon.h>
#include <wininet.h>

#include <cstdio>
#include <fstream>

namespace tarnwick::bench {
namespace {

// --- The peers ---

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
  const std::string part = "--" + boundary + "\r\nContent-Disposition: form-data; name=\"";
  std::string head;
  for (const auto& [name, value] : fields)
    head.append(part).append(name).append("\"\r\n\r\n").append(value).append("\r\n");
  head.append(part).append("File\"; filename=\"upload.jpg\"\r\n\r\n");
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

// --- What Wine's counters do not tell ---

// A file of this process's that Linux keeps. Its number comes from the script, as Wine has numbers of its
// own.
std::wstring ProcessFile(const wchar_t* name) {
  wchar_t number[16] = {};
  if (GetEnvironmentVariableW(L"TARNWICK_UNIX_PROCESS", number, 16) == 0) Stop("no TARNWICK_UNIX_PROCESS");
  return std::wstring(L"Z:\\proc\\") + number + L"\\" + name;
}

// Bytes of a line of the process's status, such as "VmRSS:".
double StatusBytes(const std::string& wanted) {
  std::ifstream status(ProcessFile(L"status").c_str());
  for (std::string line; std::getline(status, line);)
    if (line.starts_with(wanted)) return std::stod(line.substr(wanted.size())) * 1024;
  Stop("the process has no status");
}

// Most bytes that `work` had in memory beyond those that were there before.
double PeakBytes(const std::function<void()>& work) {
  const double before = StatusBytes("VmRSS:");
  // The peak begins anew.
  std::ofstream(ProcessFile(L"clear_refs").c_str()) << "5";
  work();
  return StatusBytes("VmHWM:") - before;
}

// Processor milliseconds of the process up to now.
double ProcessorMs() {
  FILETIME created = {};
  FILETIME ended = {};
  FILETIME kernel = {};
  FILETIME user = {};
  GetProcessTimes(GetCurrentProcess(), &created, &ended, &kernel, &user);
  return (kernel.dwLowDateTime + static_cast<double>(user.dwLowDateTime)) / 10'000;
}

// --- The library ---

ComPtr<_ctrlListImage> list;

void Select(const std::wstring& name) {
  Bstr text(name);
  VARIANT ignored = {};
  list->UploadedFileSetFocus(text.Reference(), &ignored);
}

void Download(const std::wstring& name) {
  Select(name);
  BSTR local = nullptr;
  list->DownLoadFileFromServer(Bstr(L"bench-files"), &local);
  if (GetFileAttributesW(local) == INVALID_FILE_ATTRIBUTES) Stop("a download failed");
  SysFreeString(local);
}

void CALLBACK LoseConnection(HWND, UINT, UINT_PTR timer, DWORD) {
  KillTimer(nullptr, timer);
  list->put_gbConnectionFailed(VARIANT_TRUE);
}

// Processor milliseconds of a download for which nothing comes in 10 seconds.
double StallMs() {
  Select(L"stall.jpg");
  SetTimer(nullptr, 0, 10'000, LoseConnection);
  const double before = ProcessorMs();
  BSTR local = nullptr;
  const double seconds = Seconds([&] { list->DownLoadFileFromServer(Bstr(L"bench-files"), &local); });
  SysFreeString(local);
  if (seconds < 9.5) Stop("the stalled download ended early");
  return ProcessorMs() - before;
}

}  // namespace

void TransferBench(const Account& account, std::size_t largeBytes, int smallCount) {
  if (FAILED(CoCreateInstance(CLSID_ctrlListImage, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_ctrlListImage),
                              list.ReceiveVoid())))
    Stop("the library is not registered");
  const std::wstring folder = LogOn(*list, account);
  CreateDirectoryW(L"bench-files", nullptr);

  const double peak = PeakBytes([] { Download(L"large.jpg"); });
  const std::wstring large = folder + L"large.jpg";
  const auto big = Fastest(
      3, {[] { Download(L"large.jpg"); }, [&] { WinInetDownload(large, L"bench-files\\large.wininet"); },
          [&] {
            DeleteUrlCacheEntryW(large.c_str());
            URLDownloadToFileW(nullptr, large.c_str(), L"bench-files\\large.urlmon", 0, nullptr);
          }});
  AtLeast(1.0, "download, one large file", big[0], "WinINet loop", big[1]);
  AtLeast(3.0, "download, one large file", big[0], "URLDownloadToFile", big[2]);

  const auto each = [&](const std::function<void(const std::wstring&)>& work) {
    return [=] {
      for (int i = 0; i < smallCount; ++i) work(L"small-" + std::to_wstring(i) + L".jpg");
    };
  };
  const auto many = Fastest(3, {each(Download), each([&](const std::wstring& name) {
                                  WinInetDownload(folder + name, L"bench-files\\small.wininet");
                                }),
                                each([&](const std::wstring& name) {
                                  DeleteUrlCacheEntryW((folder + name).c_str());
                                  URLDownloadToFileW(nullptr, (folder + name).c_str(),
                                                     L"bench-files\\small.urlmon", 0, nullptr);
                                })});
  AtLeast(1.0, "download, many small files", many[0], "URLDownloadToFile", many[2]);
  AtLeast(0.8, "download, many small files", many[0], "WinINet loop", many[1]);

  const wchar_t* const upload = L"bench-files\\upload.jpg";
  CopyFileW(L"bench-files\\large.jpg", upload, FALSE);
  const auto ansi = [](const std::wstring& text) { return std::string(text.begin(), text.end()); };
  const std::size_t colon = account.server.find(L':');
  const std::wstring host = account.server.substr(0, colon);
  const auto port = static_cast<INTERNET_PORT>(_wtoi(account.server.c_str() + colon + 1));
  const std::vector<std::pair<std::string, std::string>> fields = {
      {"UsersBaseUrl", "http://" + ansi(account.server) + "/users/"},
      {"Flag", "0"},
      {"User", ansi(account.user)},
      {"Password", ansi(account.password)},
      {"ProductID", "4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E"}};
  // The library also asks the service before and after, and keeps a copy in the user's folder. Of a picture
  // that is new there is none yet.
  wchar_t temporary[MAX_PATH] = {};
  GetTempPathW(MAX_PATH, temporary);
  const std::wstring userFolder = folder.substr(0, folder.size() - 1);
  const std::wstring copy =
      temporary + (L"bv\\" + userFolder.substr(userFolder.rfind(L'/') + 1)) + L"\\upload.jpg";
  const auto up = Fastest(9,
                          {[&] {
                             VARIANT_BOOL done = VARIANT_FALSE;
                             list->UploadImage(Bstr(upload), &done);
                             if (!done) Stop("an upload failed");
                           },
                           [&] { WinInetUpload(host, port, fields, upload); }},
                          [&] { DeleteFileW(copy.c_str()); });
  AtLeast(1.0, "upload, one large file", up[0], "WinINet loop", up[1]);

  AtMost(1.25, "peak memory of the large download", peak / static_cast<double>(largeBytes), "times the file");
  AtMost(50, "download that stalls for 10 s", StallMs(), "ms of processor time");
  list = {};
}

}  // namespace tarnwick::bench
