// A form with the list control on it, in the full container, and what the control told.
#pragma once

#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <iterator>
#include <optional>
#include <string>
#include <vector>

#include "ControlContainer.h"
#include "Host.h"
#include "platform/windows/CommonControls.h"

namespace tarnwick::test {

using demo::ControlContainer;
using demo::PropertyBag;

// Events of the control by their numbers.
inline constexpr DISPID kFileManagerEvent = 1;
inline constexpr DISPID kOLEStartDrag = 2;
inline constexpr DISPID kOLEGiveFeedback = 4;
inline constexpr DISPID kOLEDragOver = 5;
inline constexpr DISPID kOLEDragDrop = 6;
inline constexpr DISPID kOLECompleteDrag = 7;

// nullopt when there is no such file.
inline std::optional<std::string> Contents(const std::wstring& path) {
  const HANDLE handle =
      CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr);
  if (handle == INVALID_HANDLE_VALUE) return std::nullopt;
  std::string bytes(GetFileSize(handle, nullptr), '\0');
  DWORD count = 0;
  ReadFile(handle, bytes.data(), static_cast<DWORD>(bytes.size()), &count, nullptr);
  CloseHandle(handle);
  bytes.resize(count);
  return bytes;
}

class Form {
 public:
  HWND frame = CreateWindowExW(WS_EX_CONTROLPARENT, L"STATIC", L"form", WS_POPUP, 0, 0, 400, 300, nullptr,
                               nullptr, nullptr, nullptr);
  ComPtr<ControlContainer> container = ComPtr<ControlContainer>::Adopt(new ControlContainer(frame));
  ComPtr<_ctrlListImage> list;
  // FileManagerEvents as "CODE TEXT", and the byte counts of those that tell progress.
  std::vector<std::wstring> events;
  std::vector<int> progress;
  // Runs inside each FileManagerEvent, and inside each other event.
  std::function<void(int code)> onEvent;
  std::function<void(DISPID event, std::vector<VARIANT>& arguments)> onOther;

  explicit Form(ControlContainer::WayIn wayIn = ControlContainer::WayIn::kSteps,
                IPropertyBag* bag = nullptr) {
    container->onEvent = [this](DISPID event, std::vector<VARIANT>& arguments) {
      if (event != kFileManagerEvent) {
        if (onOther) onOther(event, arguments);
        return;
      }
      const int code = V_I2(V_VARIANTREF(&arguments[0]));
      const BSTR text = *V_BSTRREF(&arguments[1]);
      if (code == 9999)
        progress.push_back(text ? static_cast<int>(wcstol(text, nullptr, 10)) : -1);
      else
        events.push_back(std::to_wstring(code) + L" " + (text ? text : L""));
      if (onEvent) onEvent(code);
    };
    EXPECT_EQ(container->Create(CLSID_ctrlListImage, wayIn, bag), S_OK);
    EXPECT_EQ(container->Control()->QueryInterface(__uuidof(_ctrlListImage), list.ReceiveVoid()), S_OK);
  }
  ~Form() {
    list = {};
    // The container's was the last reference, and it was never called in a way that it must not be.
    EXPECT_EQ(container->Close(), 0U);
    for (const std::string& violation : container->violations) ADD_FAILURE() << violation;
    container = {};
    DestroyWindow(frame);
  }
  Form(const Form&) = delete;
  Form& operator=(const Form&) = delete;

  void LogOn(const std::wstring& serverName) {
    const Server& server = TheServer();
    ComPtr<_CFileUpload> client;
    ASSERT_EQ(list->get_mobjFileupload(client.Receive()), S_OK);
    VARIANT_BOOL done = VARIANT_FALSE;
    client->ConnectToServer(Bstr(serverName), &done);
    client->LogonAs(Bstr(server.product), Bstr(server.user), Bstr(server.password), Bstr(L""), &done);
    ASSERT_TRUE(done);
  }
  bool Init(const wchar_t* filter) {
    Bstr text(filter);
    BSTR given = text;
    VARIANT_BOOL done = VARIANT_FALSE;
    return SUCCEEDED(list->Init(&given, &done)) && done;
  }
  void Show() {
    ShowWindow(frame, SW_SHOWNOACTIVATE);
    EXPECT_EQ(container->Do(OLEIVERB_UIACTIVATE), S_OK);
  }
  HWND Window() const {
    ComPtr<IOleWindow> window;
    HWND control = nullptr;
    if (SUCCEEDED(list->QueryInterface(IID_IOleWindow, window.ReceiveVoid()))) window->GetWindow(&control);
    return control;
  }
  HWND ListWindow() const { return FindWindowExW(Window(), nullptr, WC_LISTVIEWW, nullptr); }
  // As the message loop of a host handles a message of a window on the form. True when the control or its
  // site took it.
  bool Handle(MSG message) {
    if (container->TranslateKey(message)) return true;
    if (!IsDialogMessageW(frame, &message)) DispatchMessageW(&message);
    return false;
  }
  bool Press(WPARAM key, HWND window) { return Handle({window, WM_KEYDOWN, key, 0, 0, {0, 0}}); }
  bool Press(WPARAM key) { return Press(key, ListWindow()); }
  void Pump() {
    MSG message = {};
    while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) Handle(message);
  }
  std::wstring Select(const wchar_t* name) {
    Bstr text(name);
    BSTR given = text;
    VARIANT ignored = {};
    list->UploadedFileSetFocus(&given, &ignored);
    Bstr selected;
    list->SelectedFileName(selected.Receive());
    return selected.Text();
  }
  // Into the current folder. The path that the control returns.
  std::wstring Download(const wchar_t* name) {
    EXPECT_EQ(Select(name), name);
    events.clear();
    progress.clear();
    Bstr local;
    list->DownLoadFileFromServer(Bstr(L"."), local.Receive());
    return local.Text();
  }
};

}  // namespace tarnwick::test
