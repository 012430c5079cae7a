#include "DemoHost.h"

#include "EventWording.h"

#include <commdlg.h>

#include "platform/windows/CommonControls.h"
#include "platform/windows/SystemDpi.h"

namespace tarnwick::demo {
namespace {

struct Button {
  Command command;
  const wchar_t* text;
};
constexpr const wchar_t* kToThumbnails = L"&Thumbnails";
constexpr const wchar_t* kToList = L"&List";
constexpr Button kButtons[] = {{kUpload, L"&Upload"},     {kDelete, L"&Delete"},   {kRename, L"&Rename"},
                               {kDownload, L"Do&wnload"}, {kAll, L"&All"},         {kGif, L"&GIF"},
                               {kJpg, L"&JPG"},           {kSwitch, kToThumbnails}};

// Pixels at 96 dots per inch.
constexpr int kWidth = 690;
constexpr int kHeight = 596;
constexpr int kGap = 6;
constexpr int kButtonWidth = 78;
constexpr int kButtonHeight = 26;
constexpr int kStatusHeight = 18;
constexpr int kProgressWidth = 200;
// The size that the thumbnails ask for.
constexpr SIZE kThumbnails = {336, 408};

std::string Utf8(const std::wstring& text) {
  const int length = static_cast<int>(text.size());
  std::string bytes(text.size() * 3, '\0');
  bytes.resize(static_cast<std::size_t>(WideCharToMultiByte(
      CP_UTF8, 0, text.data(), length, bytes.data(), static_cast<int>(bytes.size()), nullptr, nullptr)));
  return bytes;
}

}  // namespace

DemoHost::~DemoHost() {
  if (frame_) DestroyWindow(frame_);
  if (log_) std::fclose(log_);
}

bool DemoHost::Open() {
  log_ = _wfopen(Given(kLog).c_str(), L"w");
  if (!MakeWindows() || !MakeControls()) return false;
  ShowWindow(frame_, SW_SHOW);
  UpdateWindow(frame_);
  return LogOn();
}

int DemoHost::RunUntilClosed() {
  MSG message = {};
  while (GetMessageW(&message, nullptr, 0, 0) > 0) Handle(message);
  return static_cast<int>(message.wParam);
}

// --- Messages ---

void DemoHost::Handle(MSG& message) {
  if (list_.TranslateKey(message) || thumbnails_.TranslateKey(message)) return;
  if (IsDialogMessageW(frame_, &message)) return;
  TranslateMessage(&message);
  DispatchMessageW(&message);
}

void DemoHost::Pump() {
  MSG message = {};
  while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) Handle(message);
}

void DemoHost::Rest(DWORD milliseconds) {
  const DWORD begin = GetTickCount();
  for (;;) {
    Pump();
    const DWORD passed = GetTickCount() - begin;
    if (passed >= milliseconds) return;
    MsgWaitForMultipleObjects(0, nullptr, FALSE, milliseconds - passed, QS_ALLINPUT);
  }
}

LRESULT CALLBACK DemoHost::FrameProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_NCCREATE)
    SetWindowLongPtrW(
        window, GWLP_USERDATA,
        reinterpret_cast<LONG_PTR>(reinterpret_cast<const CREATESTRUCTW*>(lParam)->lpCreateParams));
  auto* host = reinterpret_cast<DemoHost*>(GetWindowLongPtrW(window, GWLP_USERDATA));
  if (!host) return DefWindowProcW(window, message, wParam, lParam);
  switch (message) {
    case WM_SIZE:
      host->Layout();
      return 0;
    case WM_COMMAND:
      host->Do(LOWORD(wParam));
      return 0;
    case WM_DESTROY:
      host->list_.Close();
      host->thumbnails_.Close();
      host->frame_ = nullptr;
      PostQuitMessage(0);
      return 0;
    default:
      return DefWindowProcW(window, message, wParam, lParam);
  }
}

// --- Windows and controls ---

bool DemoHost::MakeWindows() {
  dpi_ = SystemDpi();
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
  constexpr DWORD kStyle = WS_OVERLAPPEDWINDOW | WS_CLIPCHILDREN;
  RECT size = {0, 0, Scaled(kWidth), Scaled(kHeight)};
  AdjustWindowRect(&size, kStyle, FALSE);
  frame_ = CreateWindowExW(WS_EX_CONTROLPARENT, L"TarnwickDemo", L"Picture account", kStyle, 0, 0,
                           size.right - size.left, size.bottom - size.top, nullptr, nullptr, module, this);
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
  status_ = child(L"STATIC", L"", SS_LEFT | SS_NOPREFIX | SS_ENDELLIPSIS, 0);
  events_ = child(L"LISTBOX", L"", WS_VSCROLL | WS_BORDER | LBS_NOINTEGRALHEIGHT, 0);
  Layout();
  return true;
}

void DemoHost::Layout() {
  RECT client = {};
  GetClientRect(frame_, &client);
  const int gap = Scaled(kGap);
  int left = gap;
  for (const HWND button : buttons_) {
    MoveWindow(button, left, gap, Scaled(kButtonWidth), Scaled(kButtonHeight), TRUE);
    left += Scaled(kButtonWidth) + gap;
  }
  const int width = client.right - 2 * gap;
  const int siteTop = Scaled(kButtonHeight) + 2 * gap;
  const int siteHeight = Scaled(kThumbnails.cy);
  MoveWindow(site_, gap, siteTop, width, siteHeight, TRUE);
  list_.SetBounds({0, 0, width, siteHeight});
  // They do not grow, so they stand in the middle.
  const int thumbnailsLeft = (width - Scaled(kThumbnails.cx)) / 2;
  thumbnails_.SetBounds({thumbnailsLeft, 0, thumbnailsLeft + Scaled(kThumbnails.cx), siteHeight});

  const int statusTop = siteTop + siteHeight + gap;
  const int statusHeight = Scaled(kStatusHeight);
  const int progressLeft = client.right - gap - Scaled(kProgressWidth);
  MoveWindow(status_, gap, statusTop, progressLeft - 2 * gap, statusHeight, TRUE);
  MoveWindow(progress_, progressLeft, statusTop, Scaled(kProgressWidth), statusHeight, TRUE);
  const int eventsTop = statusTop + statusHeight + gap;
  MoveWindow(events_, gap, eventsTop, width, client.bottom - gap - eventsTop, TRUE);
}

bool DemoHost::MakeControls() {
  const auto onEvent = [this](DISPID event, std::vector<VARIANT>& arguments) { OnEvent(event, arguments); };
  if (!list_.Create(site_, onEvent) || !thumbnails_.Create(site_, onEvent)) {
    Log(L"The controls could not be created: is the library registered?");
    return false;
  }
  // One client for both.
  thumbnails_.UseClient(list_.Client().Get());
  Layout();
  list_.Show();
  return true;
}

void DemoHost::Show(FilePane& pane) {
  if (shown_ == &pane) return;
  shown_->Hide();
  shown_ = &pane;
  SetWindowTextW(buttons_.back(), shown_ == &list_ ? kToThumbnails : kToList);
  shown_->Show();
  Fill();
}

// --- The account ---

bool DemoHost::LogOn() {
  const ComPtr<_CFileUpload> client = list_.Client();
  if (!client) return false;
  VARIANT_BOOL done = VARIANT_FALSE;
  client->ConnectToServer(Argument(Given(kServer)).Get(), &done);
  const Argument user(Given(kUser));
  const Argument product(Given(kProduct));
  const Argument password(Given(kPassword));
  if (done) client->LogonAs(product.Get(), user.Get(), password.Get(), Argument(L"").Get(), &done);
  SetStatus((done ? L"Logged on as " : L"The service refused ") + Given(kUser));
  return done && Fill();
}

bool DemoHost::Fill() {
  const bool done = shown_->Init(filter_);
  if (!done) SetStatus(L"The files could not be listed");
  return done;
}

void DemoHost::ChangeFilter(const wchar_t* filter) {
  filter_ = filter;
  shown_->ChangeFilter(filter_);
}

bool DemoHost::Upload(const std::wstring& path) {
  SendMessageW(progress_, PBM_SETRANGE32, 0, 100);
  const bool done = shown_->Upload(path);
  SetStatus((done ? L"Uploaded " : L"Not uploaded: ") + path);
  return done;
}

std::wstring DemoHost::Download() {
  SendMessageW(progress_, PBM_SETRANGE32, 0, 300000);
  std::wstring path = shown_->Download(Given(kDownloads));
  SetStatus(L"Downloaded to " + path);
  return path;
}

void DemoHost::Do(int command) {
  switch (command) {
    case kUpload: {
      wchar_t path[MAX_PATH] = L"";
      OPENFILENAMEW dialog = {};
      dialog.lStructSize = sizeof dialog;
      dialog.hwndOwner = frame_;
      dialog.lpstrFilter = L"Pictures\0*.jpg;*.gif;*.png\0";
      dialog.lpstrFile = path;
      dialog.nMaxFile = MAX_PATH;
      dialog.Flags = OFN_NOCHANGEDIR;
      if (GetOpenFileNameW(&dialog)) Upload(path);
      return;
    }
    case kDelete:
      return shown_->Delete();
    case kRename:
      return shown_->StartRename();
    case kDownload:
      Download();
      return;
    case kAll:
      return ChangeFilter(L"*");
    case kGif:
      return ChangeFilter(L"gif");
    case kJpg:
      return ChangeFilter(L"jpg");
    case kSwitch:
      if (shown_ == &list_) return Show(thumbnails_);
      return Show(list_);
    default:
      return;
  }
}

// --- Events ---

void DemoHost::Log(const std::wstring& line) {
  if (log_) {
    std::fprintf(log_, "%s\n", Utf8(line).c_str());
    std::fflush(log_);
  }
  SendMessageW(events_, LB_ADDSTRING, 0, reinterpret_cast<LPARAM>(line.c_str()));
  const auto count = SendMessageW(events_, LB_GETCOUNT, 0, 0);
  SendMessageW(events_, LB_SETTOPINDEX, static_cast<WPARAM>(count - 1), 0);
}

void DemoHost::SetStatus(const std::wstring& text) {
  SetWindowTextW(status_, text.c_str());
  Log(L"-- " + text);
}

std::wstring DemoHost::Status() const {
  wchar_t text[MAX_PATH] = L"";
  GetWindowTextW(status_, text, MAX_PATH);
  return text;
}

int DemoHost::Progress() const {
  return static_cast<int>(SendMessageW(progress_, PBM_GETPOS, 0, 0));
}

void DemoHost::OnEvent(DISPID event, const std::vector<VARIANT>& arguments) {
  if (event != DISPID_FileManagerEvent) {
    if (event == DISPID_StateChanged) Log(L"StateChanged " + std::to_wstring(*V_I4REF(&arguments[0])));
    return;
  }
  const int code = V_I2(V_VARIANTREF(&arguments[0]));
  const std::wstring text = *V_BSTRREF(&arguments[1]) ? *V_BSTRREF(&arguments[1]) : L"";
  Log(L"FileManagerEvent " + std::to_wstring(code) + L" \"" + text + L"\"");
  SetWindowTextW(status_, Wording(code, text).c_str());
  switch (code) {
    case kCodeProgress:
      SendMessageW(progress_, PBM_SETPOS, static_cast<WPARAM>(_wtoi(text.c_str())), 0);
      if (onProgress) onProgress();
      return;
    case kCodeDeleteKey:
      return Do(kDelete);
    case kCodeRefreshKey:
      LogOn();
      return;
    case kCodeSwitchView:
      return Show(list_);
    default:
      return;
  }
}

}  // namespace tarnwick::demo
