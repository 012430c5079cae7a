// A host program with the file list on its form: a tool bar, a progress bar that its events drive, a status
// line that words each event, and an event log.
//
//   tarnwick-demo SERVER USER PASSWORD PRODUCT PICTURES DOWNLOADS LOG [SHOTS]
//
// With SHOTS, a folder, it runs through a tour and, after each step, waits for a file STEP.png to appear
// there, which somebody takes of the screen. Without, it stays open for the user.
#include "ControlContainer.h"
#include "support/surface/TypeLibrary.h"

#include <commdlg.h>
#include <shellapi.h>

#include "platform/windows/CommonControls.h"

#include <cstdio>
#include <string>
#include <vector>

namespace tarnwick::demo {
namespace {

enum Command : int { kUpload = 100, kDelete, kRename, kDownload, kAll, kGif, kJpg };

struct Button {
  Command command;
  const wchar_t* text;
};
constexpr Button kButtons[] = {
    {kUpload, L"&Upload"}, {kDelete, L"&Delete"}, {kRename, L"&Rename"}, {kDownload, L"Do&wnload"},
    {kAll, L"&All"},       {kGif, L"&GIF"},       {kJpg, L"&JPG"}};

constexpr int kCodeProgress = 9999;

// What an event's code means to a person.
const wchar_t* Wording(int code) {
  switch (code) {
    case 1001:
      return L"file deleted";
    case 1002:
      return L"item skipped by the delete";
    case 1005:
      return L"not allowed for this account";
    case 1014:
      return L"upload refused: the quota is used up";
    case 1015:
      return L"current item";
    case 1021:
      return L"dropped from the list itself";
    case 1022:
      return L"selection about to change";
    case 1023:
      return L"file dropped";
    case 1024:
      return L"open";
    case 1031:
      return L"renamed to";
    case 1033:
      return L"rename failed";
    case 1034:
      return L"name refused";
    case 5555:
      return L"download failed";
    case kCodeProgress:
      return L"progress";
    default:
      return L"event";
  }
}

// A BSTR for the time of a call.
class Argument {
 public:
  explicit Argument(const std::wstring& text)
      : text_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}
  ~Argument() { SysFreeString(text_); }
  Argument(const Argument&) = delete;
  Argument& operator=(const Argument&) = delete;
  BSTR Get() const { return text_; }
  BSTR* Reference() { return &text_; }

 private:
  BSTR text_;
};

class Host {
 public:
  explicit Host(std::vector<std::wstring> arguments) : arguments_(std::move(arguments)) {}
  ~Host() {
    if (log_) std::fclose(log_);
  }
  Host(const Host&) = delete;
  Host& operator=(const Host&) = delete;

  int Run() {
    log_ = _wfopen(Given(6).c_str(), L"w");
    if (!MakeWindows() || !MakeControl()) return 1;
    ShowWindow(frame_, SW_SHOW);
    UpdateWindow(frame_);
    if (!LogOn()) return 1;
    if (arguments_.size() > 7) {
      const bool done = Tour();
      DestroyWindow(frame_);
      Pump();
      return done ? 0 : 1;
    }
    MSG message = {};
    while (GetMessageW(&message, nullptr, 0, 0) > 0) Handle(message);
    return static_cast<int>(message.wParam);
  }

 private:
  const std::wstring& Given(std::size_t index) const { return arguments_[index]; }

  void Log(const std::wstring& line) {
    if (log_) {
      std::fprintf(log_, "%ls\n", line.c_str());
      std::fflush(log_);
    }
    SendMessageW(events_, LB_ADDSTRING, 0, reinterpret_cast<LPARAM>(line.c_str()));
    const auto count = SendMessageW(events_, LB_GETCOUNT, 0, 0);
    SendMessageW(events_, LB_SETTOPINDEX, static_cast<WPARAM>(count - 1), 0);
  }

  void Handle(MSG& message) {
    if (container_ && container_->TranslateKey(message)) return;
    if (IsDialogMessageW(frame_, &message)) return;
    TranslateMessage(&message);
    DispatchMessageW(&message);
  }

  void Pump() {
    MSG message = {};
    while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) Handle(message);
  }

  // Lets the windows live for a while.
  void Rest(DWORD milliseconds) {
    const DWORD begin = GetTickCount();
    for (;;) {
      Pump();
      const DWORD passed = GetTickCount() - begin;
      if (passed >= milliseconds) return;
      MsgWaitForMultipleObjects(0, nullptr, FALSE, milliseconds - passed, QS_ALLINPUT);
    }
  }

  static LRESULT CALLBACK FrameProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
    if (message == WM_NCCREATE)
      SetWindowLongPtrW(
          window, GWLP_USERDATA,
          reinterpret_cast<LONG_PTR>(reinterpret_cast<const CREATESTRUCTW*>(lParam)->lpCreateParams));
    auto* host = reinterpret_cast<Host*>(GetWindowLongPtrW(window, GWLP_USERDATA));
    if (!host) return DefWindowProcW(window, message, wParam, lParam);
    switch (message) {
      case WM_SIZE:
        host->Layout();
        return 0;
      case WM_COMMAND:
        host->Do(LOWORD(wParam));
        return 0;
      case WM_DESTROY:
        if (host->container_) host->container_->Close();
        PostQuitMessage(0);
        return 0;
      default:
        return DefWindowProcW(window, message, wParam, lParam);
    }
  }

  int Scaled(int at96) const { return MulDiv(at96, dpi_, 96); }

  bool MakeWindows() {
    const HDC screen = GetDC(nullptr);
    dpi_ = GetDeviceCaps(screen, LOGPIXELSX);
    ReleaseDC(nullptr, screen);
    const INITCOMMONCONTROLSEX classes = {sizeof classes, ICC_PROGRESS_CLASS | ICC_BAR_CLASSES};
    InitCommonControlsEx(&classes);
    const HINSTANCE module = GetModuleHandleW(nullptr);
    WNDCLASSEXW frame = {};
    frame.cbSize = sizeof frame;
    frame.lpfnWndProc = FrameProc;
    frame.hInstance = module;
    frame.hCursor = LoadCursorW(nullptr, reinterpret_cast<LPCWSTR>(IDC_ARROW));
    frame.hbrBackground = reinterpret_cast<HBRUSH>(COLOR_BTNFACE + 1);
    frame.lpszClassName = L"TarnwickDemo";
    RegisterClassExW(&frame);
    frame_ = CreateWindowExW(WS_EX_CONTROLPARENT, L"TarnwickDemo", L"Picture account",
                             WS_OVERLAPPEDWINDOW | WS_CLIPCHILDREN, 20, 20, Scaled(640), Scaled(560), nullptr,
                             nullptr, module, this);
    if (!frame_) return false;
    const auto child = [&](const wchar_t* kind, const wchar_t* text, DWORD style, int id) {
      const HWND made = CreateWindowExW(0, kind, text, WS_CHILD | WS_VISIBLE | style, 0, 0, 0, 0, frame_,
                                        reinterpret_cast<HMENU>(static_cast<INT_PTR>(id)), module, nullptr);
      SendMessageW(made, WM_SETFONT, reinterpret_cast<WPARAM>(GetStockObject(DEFAULT_GUI_FONT)), FALSE);
      return made;
    };
    for (const Button& button : kButtons)
      buttons_.push_back(child(L"BUTTON", button.text, WS_TABSTOP | BS_PUSHBUTTON, button.command));
    site_ = child(L"STATIC", L"", WS_CLIPCHILDREN, 0);
    SetWindowLongPtrW(site_, GWL_EXSTYLE, WS_EX_CONTROLPARENT);
    progress_ = child(PROGRESS_CLASSW, L"", 0, 0);
    status_ = child(L"STATIC", L"", SS_LEFT | SS_NOPREFIX, 0);
    events_ = child(L"LISTBOX", L"", WS_VSCROLL | WS_BORDER | LBS_NOINTEGRALHEIGHT, 0);
    Layout();
    return true;
  }

  void Layout() {
    RECT client = {};
    GetClientRect(frame_, &client);
    const int gap = Scaled(6);
    int left = gap;
    for (const HWND button : buttons_) {
      MoveWindow(button, left, gap, Scaled(78), Scaled(26), TRUE);
      left += Scaled(78) + gap;
    }
    const int top = Scaled(26) + 2 * gap;
    const int logTop = client.bottom - Scaled(130);
    MoveWindow(events_, gap, logTop, client.right - 2 * gap, Scaled(130) - gap, TRUE);
    MoveWindow(progress_, client.right - Scaled(200) - gap, logTop - Scaled(24), Scaled(200), Scaled(16),
               TRUE);
    MoveWindow(status_, gap, logTop - Scaled(24), client.right - Scaled(200) - 3 * gap, Scaled(18), TRUE);
    const RECT site = {gap, top, client.right - gap, logTop - Scaled(30)};
    MoveWindow(site_, site.left, site.top, site.right - site.left, site.bottom - site.top, TRUE);
    if (container_) container_->SetBounds({0, 0, site.right - site.left, site.bottom - site.top});
  }

  bool MakeControl() {
    container_ = ComPtr<ControlContainer>::Adopt(new ControlContainer(site_));
    container_->onEvent = [this](DISPID event, std::vector<VARIANT>& arguments) {
      OnEvent(event, arguments);
    };
    FONTDESC font = {};
    font.cbSizeofstruct = sizeof font;
    std::wstring name = L"Tahoma";
    font.lpstrName = name.data();
    font.cySize.int64 = 90000;  // 9 points
    font.sWeight = FW_NORMAL;
    OleCreateFontIndirect(&font, IID_IFontDisp, container_->ambient.font.ReceiveVoid());
    if (FAILED(container_->Create(CLSID_ctrlListImage, ControlContainer::WayIn::kSteps, nullptr))) {
      Log(L"The control could not be created: is the library registered?");
      return false;
    }
    Layout();
    return SUCCEEDED(container_->Do(OLEIVERB_INPLACEACTIVATE)) &&
           SUCCEEDED(container_->Control()->QueryInterface(__uuidof(_ctrlListImage), list_.ReceiveVoid()));
  }

  bool LogOn() {
    ComPtr<_CFileUpload> client;
    if (FAILED(list_->get_mobjFileupload(client.Receive())) || !client) return false;
    VARIANT_BOOL done = VARIANT_FALSE;
    client->ConnectToServer(Argument(Given(0)).Get(), &done);
    const Argument user(Given(1));
    const Argument product(Given(3));
    if (done)
      client->LogonAs(product.Get(), user.Get(), Argument(Given(2)).Get(), Argument(L"").Get(), &done);
    SetStatus(done ? L"Logged on as " + Given(1) : L"The service refused " + Given(1));
    return done && Fill(L"*");
  }

  bool Fill(const wchar_t* filter) {
    Argument text(filter);
    VARIANT_BOOL done = VARIANT_FALSE;
    VARIANT_BOOL on = VARIANT_TRUE;
    VARIANT ignored = {};
    list_->SetMultiSelectProperty(&on, &ignored);
    list_->EnableRename(&on, &ignored);
    const HRESULT result = list_->Init(text.Reference(), &done);
    if (FAILED(result)) SetStatus(L"The files could not be listed");
    return SUCCEEDED(result) && done;
  }

  void SetStatus(const std::wstring& text) {
    SetWindowTextW(status_, text.c_str());
    Log(L"-- " + text);
  }

  void OnEvent(DISPID event, const std::vector<VARIANT>& arguments) {
    if (event != 1) {
      if (event == 8) Log(L"StateChanged " + std::to_wstring(*V_I4REF(&arguments[0])));
      return;
    }
    const int code = V_I2(V_VARIANTREF(&arguments[0]));
    const std::wstring text = *V_BSTRREF(&arguments[1]) ? *V_BSTRREF(&arguments[1]) : L"";
    Log(L"FileManagerEvent " + std::to_wstring(code) + L" \"" + text + L"\"");
    if (code == kCodeProgress)
      SendMessageW(progress_, PBM_SETPOS, static_cast<WPARAM>(_wtoi(text.c_str())), 0);
    SetWindowTextW(status_, (std::wstring(Wording(code)) + L" " + text).c_str());
    if (onProgress_ && code == kCodeProgress) onProgress_();
  }

  void Do(int command) {
    switch (command) {
      case kUpload: {
        wchar_t path[MAX_PATH] = L"";
        OPENFILENAMEW dialog = {};
        dialog.lStructSize = sizeof dialog;
        dialog.hwndOwner = frame_;
        dialog.lpstrFilter = L"Pictures\0*.jpg;*.gif;*.png\0";
        dialog.lpstrFile = path;
        dialog.nMaxFile = MAX_PATH;
        if (GetOpenFileNameW(&dialog)) Upload(path);
        return;
      }
      case kDelete:
        list_->DeleteFile();
        return;
      case kRename:
        EditLabel();
        return;
      case kDownload:
        Download();
        return;
      case kAll:
        list_->ChangeFileFilter(Argument(L"*").Get());
        return;
      case kGif:
        list_->ChangeFileFilter(Argument(L"gif").Get());
        return;
      case kJpg:
        list_->ChangeFileFilter(Argument(L"jpg").Get());
        return;
      default:
        return;
    }
  }

  bool Upload(const std::wstring& path) {
    SendMessageW(progress_, PBM_SETRANGE32, 0, 100);
    VARIANT_BOOL done = VARIANT_FALSE;
    list_->UploadImage(Argument(path).Get(), &done);
    SetStatus((done ? L"Uploaded " : L"Not uploaded: ") + path);
    return done;
  }

  std::wstring Download() {
    SendMessageW(progress_, PBM_SETRANGE32, 0, 300000);
    BSTR local = nullptr;
    list_->DownLoadFileFromServer(Argument(Given(5)).Get(), &local);
    std::wstring path = local ? local : L"";
    SysFreeString(local);
    SetStatus(L"Downloaded to " + path);
    return path;
  }

  HWND ListWindow() const {
    ComPtr<IOleWindow> window;
    HWND control = nullptr;
    if (SUCCEEDED(container_->Control()->QueryInterface(IID_IOleWindow, window.ReceiveVoid())))
      window->GetWindow(&control);
    return FindWindowExW(control, nullptr, WC_LISTVIEWW, nullptr);
  }

  HWND EditLabel() {
    const HWND list = ListWindow();
    SetFocus(list);
    const auto selected = SendMessageW(list, LVM_GETNEXTITEM, static_cast<WPARAM>(-1), LVNI_SELECTED);
    return reinterpret_cast<HWND>(SendMessageW(list, LVM_EDITLABELW, static_cast<WPARAM>(selected), 0));
  }

  bool Select(const wchar_t* name) {
    Argument text(name);
    VARIANT ignored = {};
    list_->UploadedFileSetFocus(text.Reference(), &ignored);
    BSTR selected = nullptr;
    list_->SelectedFileName(&selected);
    const bool same = selected && std::wstring(selected) == name;
    SysFreeString(selected);
    return same;
  }

  // One step is over: the picture of it is taken.
  void Step(const wchar_t* name) {
    Rest(400);
    Log(std::wstring(L"== ") + name);
    const std::wstring shot = arguments_[7] + L"\\" + name + L".png";
    for (int i = 0; i < 100 && GetFileAttributesW(shot.c_str()) == INVALID_FILE_ATTRIBUTES; ++i) Rest(100);
  }

  // Makes an account for as long as its picture takes. Its key is its password.
  bool ShowEmptyAccount() {
    ComPtr<_CFileUpload> client;
    if (FAILED(list_->get_mobjFileupload(client.Receive())) || !client) return false;
    const Argument product(Given(3));
    const Argument user(L"nobody.yet@demo.example");
    const Argument nothing(L"");
    VARIANT guid = {};
    V_VT(&guid) = VT_BSTR;
    V_BSTR(&guid) = nothing.Get();
    BSTR text = nullptr;
    client->AddUser(product.Get(), user.Get(), guid, &text);
    SysFreeString(text);
    const bool shown = Fill(L"*");
    Step(L"9-empty");
    VARIANT key = {};
    V_VT(&key) = VT_BSTR;
    client->GetKeyForUser(product.Get(), user.Get(), &V_BSTR(&key));
    LONG deleted = 0;
    client->DeleteUser(product.Get(), user.Get(), key, VARIANT_TRUE, &deleted);
    VariantClear(&key);
    return shown && deleted == 1001;
  }

  bool Tour() {
    bool well = true;
    const auto expect = [&](bool happened, const wchar_t* what) {
      if (!happened) Log(std::wstring(L"NOT AS EXPECTED: ") + what);
      well = well && happened;
    };
    Step(L"1-list");
    list_->ChangeFileFilter(Argument(L"gif").Get());
    Step(L"2-gif");
    list_->ChangeFileFilter(Argument(L"*").Get());

    bool shown = false;
    onProgress_ = [&] {
      if (!shown && SendMessageW(progress_, PBM_GETPOS, 0, 0) >= 40) {
        shown = true;
        Step(L"3-upload-under-way");
      }
    };
    expect(Upload(Given(4) + L"\\deep field.png"), L"upload");
    expect(shown, L"upload progress");
    onProgress_ = nullptr;
    Step(L"4-uploaded");

    expect(Select(L"deep field.png"), L"selecting the uploaded file");
    if (const HWND edit = EditLabel()) {
      SetWindowTextW(edit, L"stars.jpg");
      Step(L"5-label-edit");
      // As the user would end it.
      SendMessageW(edit, WM_KEYDOWN, VK_RETURN, 0);
      Rest(300);
    } else {
      expect(false, L"label edit");
    }
    // The name keeps the file's own extension.
    expect(Select(L"stars.png"), L"rename");
    Step(L"6-renamed");

    const std::wstring fetched = Download();
    expect(GetFileAttributesW(fetched.c_str()) != INVALID_FILE_ATTRIBUTES, L"download");
    Step(L"7-downloaded");

    list_->DeleteFile();
    expect(!Select(L"stars.png"), L"delete");
    Step(L"8-deleted");
    expect(ShowEmptyAccount(), L"an account of no files");
    return well;
  }

  const std::vector<std::wstring> arguments_;
  std::FILE* log_ = nullptr;
  int dpi_ = 96;
  HWND frame_ = nullptr;
  HWND site_ = nullptr;
  HWND progress_ = nullptr;
  HWND status_ = nullptr;
  HWND events_ = nullptr;
  std::vector<HWND> buttons_;
  ComPtr<ControlContainer> container_;
  ComPtr<_ctrlListImage> list_;
  std::function<void()> onProgress_;
};

}  // namespace
}  // namespace tarnwick::demo

int WINAPI wWinMain(HINSTANCE, HINSTANCE, LPWSTR, int) {
  int count = 0;
  LPWSTR* words = CommandLineToArgvW(GetCommandLineW(), &count);
  std::vector<std::wstring> arguments(words + 1, words + count);
  LocalFree(words);
  if (arguments.size() < 7) return 2;
  OleInitialize(nullptr);
  int result = 0;
  {
    tarnwick::demo::Host host(std::move(arguments));
    result = host.Run();
  }
  OleUninitialize();
  return result;
}
