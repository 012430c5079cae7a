// A form with a control on it, in the full container, and what the control told.
#pragma once

#include <gtest/gtest.h>

#include <ole2.h>
#include <shlobj.h>

#include <algorithm>
#include <cstring>
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

// For what the program itself asks about the keyboard.
inline void Hold(BYTE key, bool down) {
  BYTE keys[256] = {};
  GetKeyboardState(keys);
  keys[key] = down ? 0x80 : 0;
  SetKeyboardState(keys);
}

// Of the error that the last call of this thread has left.
inline std::wstring LastDescription() {
  ComPtr<IErrorInfo> info;
  Bstr description;
  if (GetErrorInfo(0, info.Receive()) == S_OK) info->GetDescription(description.Receive());
  return description.Text();
}

using Pixels = std::vector<std::uint32_t>;
// What `draw` draws.
inline Pixels Drawn(int width, int height, const std::function<void(HDC)>& draw) {
  BITMAPINFO info = {};
  info.bmiHeader = {sizeof info.bmiHeader, width, -height, 1, 32, BI_RGB, 0, 0, 0, 0, 0};
  void* bits = nullptr;
  const HDC dc = CreateCompatibleDC(nullptr);
  const HBITMAP bitmap = CreateDIBSection(dc, &info, DIB_RGB_COLORS, &bits, nullptr, 0);
  const HGDIOBJ old = SelectObject(dc, bitmap);
  draw(dc);
  GdiFlush();
  const auto* first = static_cast<const std::uint32_t*>(bits);
  Pixels pixels(first, first + width * height);
  for (std::uint32_t& pixel : pixels) pixel &= 0xFFFFFF;
  SelectObject(dc, old);
  DeleteObject(bitmap);
  DeleteDC(dc);
  return pixels;
}

// A drag of files as another program would offer it: the clipboard's data object.
inline ComPtr<IDataObject> FilesFromOutside(HWND window, const std::vector<std::wstring>& files) {
  std::wstring paths;
  for (const std::wstring& file : files) paths += file + L'\0';
  paths += L'\0';
  const std::size_t size = paths.size() * sizeof(wchar_t);
  const HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, sizeof(DROPFILES) + size);
  auto* head = static_cast<DROPFILES*>(GlobalLock(block));
  *head = {sizeof(DROPFILES), {0, 0}, FALSE, TRUE};
  std::memcpy(head + 1, paths.data(), size);
  GlobalUnlock(block);
  EXPECT_TRUE(OpenClipboard(window) && EmptyClipboard() && SetClipboardData(CF_HDROP, block) &&
              CloseClipboard());
  ComPtr<IDataObject> data;
  EXPECT_EQ(OleGetClipboard(data.Receive()), S_OK);
  return data;
}

// Calls of a control by the slots that it has in either interface.
template <typename Interface>
bool Init(Interface& control, const wchar_t* filter) {
  const Bstr text(filter);
  BSTR given = text;
  VARIANT_BOOL done = VARIANT_FALSE;
  return SUCCEEDED(control.Init(&given, &done)) && done;
}
template <typename Interface>
void Select(Interface& control, const wchar_t* name) {
  const Bstr text(name);
  BSTR given = text;
  VARIANT ignored = {};
  EXPECT_EQ(control.UploadedFileSetFocus(&given, &ignored), S_OK);
}

template <typename Interface>
std::wstring Selected(Interface& control) {
  Bstr name;
  control.SelectedFileName(name.Receive());
  return name.Text();
}

template <typename Interface>
ComPtr<Interface> NewControl(REFCLSID classId, IUnknown* outer = nullptr) {
  ComPtr<Interface> control;
  EXPECT_EQ(
      CoCreateInstance(classId, outer, CLSCTX_INPROC_SERVER, __uuidof(Interface), control.ReceiveVoid()),
      S_OK);
  return control;
}

// `Interface` is the control's.
template <typename Interface>
class ControlForm {
 public:
  HWND frame = CreateWindowExW(WS_EX_CONTROLPARENT, L"STATIC", L"form", WS_POPUP, 0, 0, 400, 300, nullptr,
                               nullptr, nullptr, nullptr);
  ComPtr<ControlContainer> container = ComPtr<ControlContainer>::Adopt(new ControlContainer(frame));
  using Members = Interface;
  ComPtr<Interface> control;
  // FileManagerEvents as "CODE TEXT", and the byte counts of those that tell progress.
  std::vector<std::wstring> events;
  std::vector<int> progress;
  // Runs inside each FileManagerEvent, and inside each other event.
  std::function<void(int code)> onEvent;
  std::function<void(DISPID event, std::vector<VARIANT>& arguments)> onOther;

  ControlForm(REFCLSID classId, ControlContainer::WayIn wayIn, IPropertyBag* bag) {
    container->onEvent = [this](DISPID event, std::vector<VARIANT>& arguments) {
      if (event != DISPID_FileManagerEvent) {
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
    EXPECT_EQ(container->Create(classId, wayIn, bag), S_OK);
    control = As<Interface>(*container->Control());
  }
  ~ControlForm() {
    control = {};
    // The container's was the last reference, and it was never called in a way that it must not be.
    EXPECT_EQ(container->Close(), 0U);
    for (const std::string& violation : container->violations) ADD_FAILURE() << violation;
    container = {};
    DestroyWindow(frame);
  }
  ControlForm(const ControlForm&) = delete;
  ControlForm& operator=(const ControlForm&) = delete;

  void LogOn(const std::wstring& serverName) {
    ComPtr<_CFileUpload> client;
    ASSERT_EQ(control->get_mobjFileupload(client.Receive()), S_OK);
    ASSERT_TRUE(test::LogOn(*client, serverName));
  }
  bool Init(const wchar_t* filter) { return test::Init(*control, filter); }
  void Open(const wchar_t* filter, const std::wstring& serverName = TheServer().name) {
    LogOn(serverName);
    EXPECT_TRUE(Init(filter));
  }
  bool Upload(const std::wstring& path) {
    VARIANT_BOOL done = VARIANT_FALSE;
    control->UploadImage(Bstr(path), &done);
    return done != VARIANT_FALSE;
  }
  void Show() {
    ShowWindow(frame, SW_SHOWNOACTIVATE);
    EXPECT_EQ(container->Do(OLEIVERB_UIACTIVATE), S_OK);
  }
  HWND Window() const {
    HWND outer = nullptr;
    As<IOleWindow>(*control)->GetWindow(&outer);
    return outer;
  }
  // As the message loop of a host handles a message of a window on the form. True when the control or its
  // site took it.
  bool Handle(MSG message) {
    if (container->TranslateKey(message)) return true;
    if (!IsDialogMessageW(frame, &message)) DispatchMessageW(&message);
    return false;
  }
  bool Press(WPARAM key, HWND window) { return Handle({window, WM_KEYDOWN, key, 0, 0, {0, 0}}); }
  void Pump() {
    MSG message = {};
    while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) Handle(message);
  }
  std::wstring Select(const wchar_t* name) {
    test::Select(*control, name);
    return Selected();
  }
  std::wstring Selected() const { return test::Selected(*control); }
};

class Form : public ControlForm<_ctrlListImage> {
 public:
  static constexpr wchar_t kProgId[] = L"Tarnwick.ctrlListImage";
  static const CLSID& ClassId() { return CLSID_ctrlListImage; }
  static const IID& EventsId() { return __uuidof(__ctrlListImage); }
  const ComPtr<_ctrlListImage>& list = control;

  explicit Form(ControlContainer::WayIn wayIn = ControlContainer::WayIn::kSteps, IPropertyBag* bag = nullptr)
      : ControlForm(ClassId(), wayIn, bag) {}
  HWND ListWindow() const { return FindWindowExW(Window(), nullptr, WC_LISTVIEWW, nullptr); }
  using ControlForm::Press;
  bool Press(WPARAM key) { return Press(key, ListWindow()); }
  // Into the current folder. The path that the control returns.
  std::wstring Download(const wchar_t* name) {
    EXPECT_EQ(Select(name), name);
    events.clear();
    progress.clear();
    Bstr local;
    control->DownLoadFileFromServer(Bstr(L"."), local.Receive());
    return local.Text();
  }
};

using Lines = std::vector<std::wstring>;

// The account's folder, on the server and here.
inline std::wstring FolderName() {
  std::wstring name = TheServer().user;
  std::replace(name.begin() + static_cast<std::ptrdiff_t>(name.find(L'@')), name.end(), L'.', L'-');
  return name;
}
inline std::wstring Address(const std::wstring& file) {
  return (TheServer().IsSecure() ? L"" : L"http://") + TheServer().name + L"/users/" + FolderName() + L"/" +
         file;
}
// Where the controls keep their copies.
inline std::wstring CopyOf(const std::wstring& file) {
  wchar_t temporary[MAX_PATH] = {};
  GetTempPathW(MAX_PATH, temporary);
  return temporary + (L"bv\\" + FolderName()) + L"\\" + file;
}
inline const Lines kJpegs = {L"Chelsea the cat.jpg", L"coffee.jpg", L"rocket.jpg", L"rose.jpg"};

inline std::wstring TextOf(HWND window) {
  wchar_t text[300] = {};
  GetWindowTextW(window, text, 300);
  return text;
}

class ThumbForm : public ControlForm<_ctrlThumbNailView> {
 public:
  static constexpr wchar_t kProgId[] = L"Tarnwick.ctrlThumbNailView";
  static const CLSID& ClassId() { return CLSID_ctrlThumbNailView; }
  static const IID& EventsId() { return __uuidof(__ctrlThumbNailView); }
  // A little more than the whole page.
  static constexpr int kWidth = 350;
  static constexpr int kHeight = 420;

  explicit ThumbForm(ControlContainer::WayIn wayIn = ControlContainer::WayIn::kSteps,
                     IPropertyBag* bag = nullptr)
      : ControlForm(ClassId(), wayIn, bag) {
    SetWindowPos(frame, nullptr, 0, 0, 400, 440, SWP_NOZORDER | SWP_NOACTIVATE);
    container->SetBounds({10, 10, 10 + kWidth, 10 + kHeight});
  }
  HWND Grid() const { return FindWindowExW(Window(), nullptr, L"STATIC", L"Pictures of the account"); }
  HWND Editor() const { return FindWindowExW(Grid(), nullptr, L"EDIT", nullptr); }
  HWND ScrollBar() const { return FindWindowExW(Window(), nullptr, L"SCROLLBAR", nullptr); }
  // From 1; before the slots stands the name of the editor.
  HWND Slot(int slot) const {
    HWND window = nullptr;
    for (int i = 0; i <= slot; ++i) window = FindWindowExW(Grid(), window, L"STATIC", nullptr);
    return window;
  }
  // Of the page, in the order of the slots; those that are hidden are not there.
  Lines Captions() const {
    Lines captions;
    for (int slot = 1; slot <= 4; ++slot)
      if (IsWindowVisible(Slot(slot))) captions.push_back(TextOf(Slot(slot)));
    return captions;
  }
  using ControlForm::Press;
  bool Press(WPARAM key) { return Press(key, Grid()); }
};

}  // namespace tarnwick::test
