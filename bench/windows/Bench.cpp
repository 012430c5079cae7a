#include "Bench.h"

#include <cstdio>
#include <cstdlib>

namespace tarnwick::bench {

double Native(const std::string& command) {
  std::printf("run %s\n", command.c_str());
  std::fflush(stdout);
  char answer[64] = {};
  if (!std::fgets(answer, sizeof answer, stdin)) Stop("nobody runs commands");
  const double microseconds = std::atof(answer);
  if (microseconds <= 0) Stop(("failed: " + command).c_str());
  return microseconds / 1e6;
}

std::string NativePath(const std::wstring& path) {
  using Function = char*(CDECL*)(const wchar_t*);
  const auto convert = reinterpret_cast<Function>(
      reinterpret_cast<void (*)()>(GetProcAddress(GetModuleHandleW(L"kernel32"), "wine_get_unix_file_name")));
  char* const text = convert ? convert(path.c_str()) : nullptr;
  if (!text) Stop("a file has no name outside of Wine");
  std::string result = text;
  HeapFree(GetProcessHeap(), 0, text);
  return result;
}

double ProcessorSeconds() {
  FILETIME created = {};
  FILETIME ended = {};
  FILETIME kernel = {};
  FILETIME user = {};
  GetProcessTimes(GetCurrentProcess(), &created, &ended, &kernel, &user);
  return (kernel.dwLowDateTime + static_cast<double>(user.dwLowDateTime)) / 1e7;
}

void Pump() {
  MSG message = {};
  while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
    TranslateMessage(&message);
    DispatchMessageW(&message);
  }
}

std::wstring LogOn(_CFileUpload& client, const Account& account) {
  VARIANT_BOOL done = VARIANT_FALSE;
  client.ConnectToServer(Bstr(account.server), &done);
  client.LogonAs(Bstr(account.product), Bstr(account.user), Bstr(account.password), Bstr(L""), &done);
  if (!done) Stop("no account");
  BSTR base = nullptr;
  client.GetUserBasePath(&base);
  std::wstring folder = std::wstring(base) + L"/";
  SysFreeString(base);
  return folder;
}

std::wstring ShowAccount(_ctrlListImage& list, const Account& account) {
  ComPtr<_CFileUpload> client;
  list.get_mobjFileupload(client.Receive());
  std::wstring folder = LogOn(*client, account);
  VARIANT_BOOL done = VARIANT_FALSE;
  Bstr all(L"*");
  if (FAILED(list.Init(all.Reference(), &done)) || !done) Stop("no listing");
  return folder;
}

std::wstring UserFolder(std::wstring url) {
  wchar_t temporary[MAX_PATH] = {};
  GetTempPathW(MAX_PATH, temporary);
  url.pop_back();
  return temporary + (L"bv\\" + url.substr(url.rfind(L'/') + 1));
}

Form::Form(const CLSID& control, SIZE size)
    : window_(CreateWindowExW(0, L"STATIC", L"", WS_POPUP | WS_VISIBLE, 0, 0, size.cx, size.cy, nullptr,
                              nullptr, nullptr, nullptr)),
      container_(ComPtr<demo::ControlContainer>::Adopt(new demo::ControlContainer(window_))) {
  if (FAILED(container_->Create(control, demo::ControlContainer::WayIn::kSteps, nullptr)))
    Stop("the library is not registered");
  container_->SetBounds({0, 0, size.cx, size.cy});
  container_->Do(OLEIVERB_SHOW);
  Pump();
}

Form::~Form() {
  container_->Close();
  DestroyWindow(window_);
}

}  // namespace tarnwick::bench
