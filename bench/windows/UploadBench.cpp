// Uploads of the list control beside a plain loop over WinINet, with and without the copy that the library
// leaves in the user's folder, and curl and cp.
#include "Bench.h"

#include <wininet.h>

namespace tarnwick::bench {
namespace {

using Fields = std::vector<std::pair<std::string, std::string>>;

// The plain loop upwards: the same multipart body, a block at a time.
void WinInetUpload(const std::wstring& host, INTERNET_PORT port, const Fields& fields, const wchar_t* path) {
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

std::string Narrow(const std::wstring& text) {
  return {text.begin(), text.end()};
}

}  // namespace

void UploadBench(const Account& account) {
  ComPtr<_ctrlListImage> list;
  if (FAILED(CoCreateInstance(CLSID_ctrlListImage, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_ctrlListImage),
                              list.ReceiveVoid())))
    Stop("the library is not registered");
  // Of a picture that is new there is no copy yet.
  const std::wstring copies = UserFolder(ShowAccount(*list, account)) + L"\\";
  const std::size_t colon = account.server.find(L':');
  const std::wstring host = account.server.substr(0, colon);
  const auto port = static_cast<INTERNET_PORT>(_wtoi(account.server.c_str() + colon + 1));
  const std::string server = "http://" + Narrow(account.server);
  const Fields fields = {{"UsersBaseUrl", server + "/users/"},
                         {"Flag", "0"},
                         {"User", Narrow(account.user)},
                         {"Password", Narrow(account.password)},
                         {"ProductID", "4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E"}};
  std::string curl = "curl -sf -o answer";
  for (const auto& [name, value] : fields)
    curl.append(" -F '").append(name).append("=").append(value).append("'");

  const auto byLibrary = [&](const std::wstring& name) {
    DeleteFileW((copies + name).c_str());
    return Seconds([&] {
      VARIANT_BOOL done = VARIANT_FALSE;
      list->UploadImage(Bstr(L"upload\\" + name), &done);
      if (!done) Stop("an upload failed");
    });
  };
  const auto byLoop = [&](bool copied) {
    DeleteFileW(L"copy.jpg");
    return Seconds([&] {
      WinInetUpload(host, port, fields, L"upload\\upload.jpg");
      if (copied) CopyFileW(L"upload\\upload.jpg", L"copy.jpg", FALSE);
    });
  };
  const auto byCurl = [&] {
    Native("rm -f copy.jpg");
    return Native(curl + " -F 'File=@upload/upload.jpg' " + server +
                  "/httpupload/UploadAcceptor.asp && cp upload/upload.jpg copy.jpg");
  };
  std::vector<Side> sides = {{"library", [&] { return byLibrary(L"upload.jpg"); }},
                             {"WinINet loop, CopyFile", [&] { return byLoop(true); }},
                             {"WinINet loop alone", [&] { return byLoop(false); }},
                             {"curl, cp", byCurl},
                             {"itself, of 8 MiB", [&] { return byLibrary(L"part.jpg"); }, 8}};
  Measure(sides);
  const std::string what = "upload of 64 MiB, " + std::to_string(8 * sizeof(void*)) + " bits";
  Row(what, sides[0], sides[1], ">=1.0",
      "the service is asked before and after; sockets and files in the kernel are three quarters of both");
  Row(what, sides[0], sides[2], "", "the copy, and the service that is asked before and after");
  Row(what, sides[0], sides[3], "", "each piece passes through Wine, and its answer is waited for there");
  Row(what + ", a MiB", PerUnit(sides[0], 64), sides[4], "<=1.2",
      "the requests to the service, whatever the size");
}

}  // namespace tarnwick::bench
