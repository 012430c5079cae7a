#include "DemoHost.h"

#include "EventWording.h"

#include <commdlg.h>

#include <algorithm>
#include <iterator>
#include <utility>

#include "platform/windows/CommonControls.h"
#include "platform/windows/SystemDpi.h"

namespace tarnwick::demo {
namespace {

struct Button {
  Command command;
  const wchar_t* text;
};
constexpr Button kButtons[] = {{kUpload, L"&Upload"}, {kOpen, L"&Open"},         {kRename, L"&Rename"},
                               {kDelete, L"&Delete"}, {kDownload, L"Do&wnload"}, {kAll, L"&All"},
                               {kGif, L"&GIF"},       {kJpg, L"&JPG"},           {kStop, L"&Stop"}};
constexpr Button kMenu[] = {
    {kOpen, L"&Open"}, {kRename, L"&Rename"}, {kDownload, L"Do&wnload"}, {kDelete, L"&Delete..."}};

// What the filter of that command lets pass; null for commands that are no filter.
const wchar_t* Filter(int command) {
  return command == kAll ? L"*" : command == kGif ? L"gif" : command == kJpg ? L"jpg" : nullptr;
}

// The filters are one group, in which the Tab key stops once and the arrow keys choose.
DWORD ButtonStyle(int command) {
  if (!Filter(command)) return WS_GROUP | WS_TABSTOP | BS_PUSHBUTTON;
  return command == kAll ? WS_GROUP | WS_TABSTOP | BS_AUTORADIOBUTTON : BS_AUTORADIOBUTTON;
}

// Messages of the form to itself, for what shall not run inside an event.
constexpr UINT kShowMenu = WM_APP;
constexpr UINT kRefreshOther = WM_APP + 1;
constexpr UINT kUploadDropped = WM_APP + 2;

// Pixels at 96 dots per inch.
constexpr int kWidth = 800;
constexpr int kGap = 6;
constexpr int kButtonWidth = 78;
constexpr int kButtonHeight = 26;
constexpr int kStatusHeight = 18;
constexpr int kProgressWidth = 200;
constexpr int kEventsHeight = 88;
// The size that the thumbnails ask for. They do not grow.
constexpr SIZE kThumbnails = {336, 408};
constexpr int kSiteTop = kButtonHeight + 2 * kGap;
// On a small screen the event log gives way.
constexpr int kLeastHeight = kSiteTop + kThumbnails.cy + kStatusHeight + 3 * kGap;
constexpr int kHeight = kLeastHeight + kEventsHeight;
// The tool bar and, below it, some of the list beside the thumbnails.
constexpr int kLeastWidth = static_cast<int>(std::size(kButtons)) * (kButtonWidth + kGap) + kGap;

constexpr DWORD kFrameStyle = WS_OVERLAPPEDWINDOW | WS_CLIPCHILDREN;

// Of errors. Where red could not be read, such as with the system's dark colors, it is the text's own.
COLORREF ErrorColor() {
  const COLORREF face = GetSysColor(COLOR_BTNFACE);
  const int brightness = (GetRValue(face) * 3 + GetGValue(face) * 6 + GetBValue(face)) / 10;
  return brightness < 160 ? GetSysColor(COLOR_BTNTEXT) : RGB(176, 0, 32);
}

// The system tells only the windows of the desktop.
BOOL CALLBACK TellOfColors(HWND child, LPARAM) {
  SendMessageW(child, WM_SYSCOLORCHANGE, 0, 0);
  return TRUE;
}

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
  // The list has no event for this key, the thumbnails have.
  if (message.message == WM_KEYDOWN && message.wParam == VK_DELETE && message.hwnd == list_.ListWindow())
    return Do(kDelete);
  // Neither control has an event for a double click.
  const bool opens = message.message == WM_LBUTTONDBLCLK &&
                     (message.hwnd == list_.ListWindow() || thumbnails_.IsPicture(message.hwnd));
  if (!list_.TranslateKey(message) && !thumbnails_.TranslateKey(message) &&
      !IsDialogMessageW(frame_, &message)) {
    TranslateMessage(&message);
    DispatchMessageW(&message);
  }
  if (opens) Do(kOpen);
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
    case WM_SETFOCUS:
      host->used_->Focus();
      return 0;
    case WM_GETMINMAXINFO: {
      RECT least = {0, 0, host->Scaled(kLeastWidth), host->Scaled(kLeastHeight)};
      AdjustWindowRect(&least, kFrameStyle, FALSE);
      reinterpret_cast<MINMAXINFO*>(lParam)->ptMinTrackSize = {least.right - least.left,
                                                               least.bottom - least.top};
      return 0;
    }
    case WM_SYSCOLORCHANGE:
      host->TakeColors();
      return 0;
    case WM_CTLCOLORSTATIC: {
      const LRESULT brush = DefWindowProcW(window, message, wParam, lParam);
      if (host->isError_ && reinterpret_cast<HWND>(lParam) == host->status_)
        SetTextColor(reinterpret_cast<HDC>(wParam), ErrorColor());
      return brush;
    }
    case WM_COMMAND:
      host->Do(LOWORD(wParam));
      return 0;
    case WM_CONTEXTMENU: {
      // The list has no event for its menu, but its window passes the system's message on. From which window
      // it comes, not every system says.
      const POINT at = {static_cast<SHORT>(LOWORD(lParam)), static_cast<SHORT>(HIWORD(lParam))};
      const HWND list = host->list_.ListWindow();
      const bool byKey = at.x == -1 && at.y == -1;
      if (GetFocus() != list || (!byKey && WindowFromPoint(at) != list))
        return DefWindowProcW(window, message, wParam, lParam);
      host->ShowMenu(at);
      return 0;
    }
    case kShowMenu:
      host->ShowMenu({static_cast<SHORT>(LOWORD(lParam)), static_cast<SHORT>(HIWORD(lParam))});
      return 0;
    case kRefreshOther:
      host->Show(host->Other(*reinterpret_cast<const FilePane*>(lParam)));
      return 0;
    case kUploadDropped:
      host->UploadDropped();
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
  RECT size = {0, 0, Scaled(kWidth), Scaled(kHeight)};
  AdjustWindowRect(&size, kFrameStyle, FALSE);
  RECT screen = {};
  SystemParametersInfoW(SPI_GETWORKAREA, 0, &screen, 0);
  const LONG width = std::min(size.right - size.left, screen.right - screen.left);
  const LONG height = std::min(size.bottom - size.top, screen.bottom - screen.top);
  frame_ =
      CreateWindowExW(WS_EX_CONTROLPARENT, L"TarnwickDemo", L"Picture account", kFrameStyle,
                      (screen.left + screen.right - width) / 2, (screen.top + screen.bottom - height) / 2,
                      width, height, nullptr, nullptr, module, this);
  if (!frame_) return false;
  NONCLIENTMETRICSW metrics = {};
  metrics.cbSize = sizeof metrics;
  SystemParametersInfoW(SPI_GETNONCLIENTMETRICS, sizeof metrics, &metrics, 0);
  font_ = FontOwner(CreateFontIndirectW(&metrics.lfMessageFont));
  const auto child = [&](const wchar_t* kind, const wchar_t* text, DWORD style, int id) {
    const HWND made = CreateWindowExW(0, kind, text, WS_CHILD | WS_VISIBLE | style, 0, 0, 0, 0, frame_,
                                      reinterpret_cast<HMENU>(static_cast<INT_PTR>(id)), module, nullptr);
    SendMessageW(made, WM_SETFONT, reinterpret_cast<WPARAM>(font_.Get()), FALSE);
    return made;
  };
  for (const Button& button : kButtons)
    buttons_.push_back(child(L"BUTTON", button.text, ButtonStyle(button.command), button.command));
  ShowFilter();
  site_ = child(L"STATIC", L"", WS_CLIPCHILDREN, 0);
  SetWindowLongPtrW(site_, GWL_EXSTYLE, WS_EX_CONTROLPARENT);
  progress_ = child(PROGRESS_CLASSW, L"", PBS_SMOOTH, 0);
  status_ = child(L"STATIC", L"", SS_LEFT | SS_CENTERIMAGE | SS_NOPREFIX | SS_ENDELLIPSIS, 0);
  events_ = child(L"LISTBOX", L"", WS_VSCROLL | WS_BORDER | LBS_NOINTEGRALHEIGHT, 0);
  UpdateStop();
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
  const int siteTop = Scaled(kSiteTop);
  const int eventsHeight =
      std::clamp(static_cast<int>(client.bottom) - Scaled(kLeastHeight), 0, Scaled(kEventsHeight));
  const int statusHeight = Scaled(kStatusHeight);
  const int siteHeight = client.bottom - siteTop - eventsHeight - statusHeight - 3 * gap;
  MoveWindow(site_, gap, siteTop, width, siteHeight, TRUE);
  // The list grows with the form.
  const int thumbnailsLeft = width - Scaled(kThumbnails.cx);
  list_.SetBounds({0, 0, thumbnailsLeft - gap, siteHeight});
  list_.SpreadColumns();
  thumbnails_.SetBounds({thumbnailsLeft, 0, width, Scaled(kThumbnails.cy)});

  const int statusTop = siteTop + siteHeight + gap;
  const int progressLeft = client.right - gap - Scaled(kProgressWidth);
  MoveWindow(status_, gap, statusTop, progressLeft - 2 * gap, statusHeight, TRUE);
  MoveWindow(progress_, progressLeft, statusTop, Scaled(kProgressWidth), statusHeight, TRUE);
  MoveWindow(events_, gap, statusTop + statusHeight + gap, width, eventsHeight, TRUE);
  // On their way windows cover each other.
  RedrawWindow(frame_, nullptr, nullptr, RDW_INVALIDATE | RDW_ERASE | RDW_ALLCHILDREN);
}

void DemoHost::TakeColors() {
  EnumChildWindows(frame_, TellOfColors, 0);
  list_.TakeColors();
  thumbnails_.TakeColors();
  RedrawWindow(frame_, nullptr, nullptr, RDW_INVALIDATE | RDW_ERASE | RDW_ALLCHILDREN);
}

bool DemoHost::MakeControls() {
  for (FilePane* const pane : {static_cast<FilePane*>(&list_), static_cast<FilePane*>(&thumbnails_)}) {
    pane->onUse = [this, pane] { Use(*pane); };
    if (!pane->Create(site_, font_.Get(), [this, pane](DISPID event, std::vector<VARIANT>& arguments) {
          OnEvent(*pane, event, arguments);
        })) {
      Log(L"The controls could not be created: is the library registered?");
      return false;
    }
  }
  // One client for both.
  thumbnails_.UseClient(list_.Client().Get());
  Layout();
  thumbnails_.Show();
  list_.Show();
  return true;
}

FilePane& DemoHost::Other(const FilePane& pane) {
  if (&pane == &list_) return thumbnails_;
  return list_;
}

void DemoHost::Use(FilePane& pane) {
  used_ = &pane;
  Other(pane).Deactivate();
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
  SetStatus((done ? L"Logged on as " : L"The service refused ") + Given(kUser), !done);
  return done && Fill();
}

bool DemoHost::Show(FilePane& pane) {
  // Whoever closes the form in the middle of a command wants no more of it.
  if (!frame_) return false;
  FilePane& used = *used_;
  const bool done = pane.Init(Filter(filter_));
  // The thumbnails take the keyboard when they are filled.
  Use(used);
  used.Focus();
  if (!done) SetStatus(L"The files could not be listed: " + pane.Problem(), true);
  return done;
}

bool DemoHost::Fill() {
  // The thumbnails show what the list has listed.
  return Show(list_) && Show(thumbnails_);
}

void DemoHost::ShowFilter() {
  CheckRadioButton(frame_, kAll, kJpg, filter_);
}

void DemoHost::ChangeFilter(int command) {
  filter_ = command;
  ShowFilter();
  // The arrow keys go on to the next filter.
  const HWND focus = GetFocus();
  const bool stays = GetParent(focus) == frame_ && Filter(GetDlgCtrlID(focus));
  FilePane& used = *used_;
  list_.ChangeFilter(Filter(filter_));
  thumbnails_.ChangeFilter(Filter(filter_));
  Use(used);
  if (stays)
    SetFocus(focus);
  else
    used.Focus();
}

// --- Commands ---

void DemoHost::BeginWork(int size) {
  working_ = true;
  workSize_ = size;
  SendMessageW(progress_, PBM_SETRANGE32, 0, std::max(size, 1));
  SendMessageW(progress_, PBM_SETPOS, 0, 0);
  UpdateStop();
}

void DemoHost::EndWork(const std::wstring& outcome, const std::wstring& failure) {
  // The last progress event may come before the last byte, and a file without bytes has none.
  SendMessageW(progress_, PBM_SETPOS, failure.empty() ? static_cast<WPARAM>(std::max(workSize_, 1)) : 0, 0);
  workSize_ = 0;
  working_ = false;
  UpdateStop();
  SetStatus(failure.empty() ? outcome : failure, !failure.empty());
  // What was dropped meanwhile is next.
  if (!dropped_.empty()) PostMessageW(frame_, kUploadDropped, 0, 0);
}

void DemoHost::UpdateStop() {
  const HWND stop = buttons_.back();
  const bool on = working_ || fetching_ || !dropped_.empty();
  // A button that is switched off would keep the keyboard for itself.
  if (!on && GetFocus() == stop) used_->Focus();
  EnableWindow(stop, on);
}

bool DemoHost::Upload(const std::wstring& path) {
  FilePane& pane = *used_;
  const bool done = UploadOne(pane, path).empty();
  if (done) Show(Other(pane));
  return done;
}

std::wstring DemoHost::UploadOne(FilePane& pane, const std::wstring& path) {
  // The events of an upload count percent.
  BeginWork(100);
  std::wstring failure;
  if (!pane.Upload(path))
    failure = L"Not uploaded: " + path.substr(path.find_last_of(L'\\') + 1) + L": " + pane.Problem();
  EndWork(L"Uploaded " + path, failure);
  return failure;
}

void DemoHost::UploadDropped() {
  if (working_ || fetching_) return;
  FilePane& pane = *used_;
  std::wstring failure;
  std::size_t done = 0;
  // Stop empties the queue.
  while (!dropped_.empty() && failure.empty()) {
    const std::wstring path = std::exchange(dropped_.front(), {});
    dropped_.erase(dropped_.begin());
    failure = UploadOne(pane, path);
    if (failure.empty()) ++done;
  }
  // Whatever one file failed for, the user has to know before the next one.
  const std::size_t left = std::exchange(dropped_, {}).size();
  UpdateStop();
  if (done > 0) Show(Other(pane));
  if (left > 0) failure += L" Not tried: " + std::to_wstring(left) + L" more.";
  if (!failure.empty()) return SetStatus(failure, true);
  if (done > 1) SetStatus(L"Uploaded " + std::to_wstring(done) + L" files");
}

std::wstring DemoHost::Download() {
  // Those of a download count bytes.
  BeginWork(used_->SelectedSize());
  FilePane& pane = *used_;
  const std::wstring path = pane.Download(Given(kDownloads));
  const std::wstring problem = pane.Problem();
  EndWork(L"Downloaded to " + path, problem.empty() ? L"" : L"Not downloaded: " + problem);
  return problem.empty() ? path : L"";
}

void DemoHost::OpenPicture() {
  if (used_->SelectedCount() == 0) return SetStatus(L"Select a file first", true);
  const std::wstring path = Download();
  if (!path.empty() && !picture_.Show(frame_, path)) SetStatus(L"No picture: " + path, true);
}

void DemoHost::Delete() {
  FilePane& pane = *used_;
  const int count = pane.SelectedCount();
  if (count == 0) return SetStatus(L"Select a file first", true);
  const std::wstring what = count == 1 ? pane.Selected() : std::to_wstring(count) + L" files";
  if (MessageBoxW(frame_, (L"Delete " + what + L" from the account?").c_str(), L"Picture account",
                  MB_YESNO | MB_ICONQUESTION | MB_DEFBUTTON2) != IDYES)
    return;
  BeginWork(0);
  pane.Delete();
  const std::wstring problem = pane.Problem();
  EndWork(L"Deleted " + what, problem.empty() ? L"" : L"Not deleted: " + problem);
  Show(Other(pane));
}

void DemoHost::Stop() {
  dropped_.clear();
  VARIANT on = {};
  V_VT(&on) = VT_BOOL;
  V_BOOL(&on) = VARIANT_TRUE;
  VARIANT ignored = {};
  // The client of both controls: whatever they have under way ends.
  const ComPtr<_CFileUpload> client = list_.Client();
  client->AbortFileTransfer(&on, &ignored);
  // What stays stored would end the next drop of files as well.
  V_BOOL(&on) = VARIANT_FALSE;
  client->AbortFileTransfer(&on, &ignored);
}

void DemoHost::ChooseUpload() {
  wchar_t path[MAX_PATH] = L"";
  OPENFILENAMEW dialog = {};
  dialog.lStructSize = sizeof dialog;
  dialog.hwndOwner = frame_;
  dialog.lpstrFilter =
      L"Pictures\0*.jpg;*.jpeg;*.gif;*.png;*.bmp;*.tif;*.tiff;*.webp;*.heic;*.avif\0All files\0*.*\0";
  dialog.lpstrFile = path;
  dialog.nMaxFile = MAX_PATH;
  dialog.lpstrTitle = L"Upload";
  dialog.Flags = OFN_NOCHANGEDIR | OFN_FILEMUSTEXIST;
  if (GetOpenFileNameW(&dialog)) Upload(path);
}

void DemoHost::ShowMenu(POINT at) {
  if (used_->SelectedCount() == 0) return;
  // By the keyboard the menu has no place.
  if (at.x == -1 && at.y == -1) {
    at = {0, 0};
    ClientToScreen(used_->Window(), &at);
  }
  const HMENU menu = CreatePopupMenu();
  for (const Button& item : kMenu)
    AppendMenuW(menu, MF_STRING, static_cast<UINT_PTR>(item.command), item.text);
  SetMenuDefaultItem(menu, kOpen, FALSE);
  TrackPopupMenu(menu, TPM_RIGHTBUTTON, at.x, at.y, 0, frame_, nullptr);
  DestroyMenu(menu);
}

void DemoHost::Do(int command) {
  if (command == kStop) return Stop();
  // Controls pump messages while they work; one command at a time.
  if (working_) return ShowFilter();
  switch (command) {
    case kUpload:
      return ChooseUpload();
    case kOpen:
      return OpenPicture();
    case kRename:
      return used_->StartRename();
    case kDelete:
      return Delete();
    case kDownload:
      Download();
      return;
    case kAll:
    case kGif:
    case kJpg:
      return ChangeFilter(command);
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

void DemoHost::SetStatus(const std::wstring& text, bool isError) {
  isError_ = isError;
  SetWindowTextW(status_, text.c_str());
  Log(L"-- " + text);
}

std::wstring DemoHost::Status() const {
  wchar_t text[MAX_PATH] = L"";
  GetWindowTextW(status_, text, MAX_PATH);
  return text;
}

int DemoHost::Progress() const {
  const auto position = static_cast<int>(SendMessageW(progress_, PBM_GETPOS, 0, 0));
  return MulDiv(position, 100, static_cast<int>(SendMessageW(progress_, PBM_GETRANGE, FALSE, 0)));
}

void DemoHost::OnEvent(FilePane& pane, DISPID event, const std::vector<VARIANT>& arguments) {
  if (event == DISPID_StateChanged) Log(L"StateChanged " + std::to_wstring(*V_I4REF(&arguments[0])));
  if (event != DISPID_FileManagerEvent) return;
  const BSTR text = *V_BSTRREF(&arguments[1]);
  OnFileManagerEvent(pane, V_I2(V_VARIANTREF(&arguments[0])), text ? text : L"");
}

void DemoHost::OnFileManagerEvent(FilePane& pane, int code, const std::wstring& text) {
  Log(L"FileManagerEvent " + std::to_wstring(code) + L" \"" + text + L"\"");
  isError_ = TellsFailure(code);
  std::wstring words = Wording(code, text);
  if (isError_) words += L": " + pane.Problem();
  SetWindowTextW(status_, words.c_str());
  // What a command does may take its time, so those run when the control has done with its event.
  const auto post = [this](Command command) {
    PostMessageW(frame_, WM_COMMAND, static_cast<WPARAM>(command), 0);
  };
  switch (code) {
    case kCodeProgress:
      // The pictures of a page count their bytes, too.
      if (!working_ || workSize_ == 0) return;
      SendMessageW(progress_, PBM_SETPOS, static_cast<WPARAM>(_wtoi(text.c_str())), 0);
      if (onProgress) onProgress();
      return;
    case kCodeBusy:
      fetching_ = text == L"1";
      if (!fetching_ && !dropped_.empty()) PostMessageW(frame_, kUploadDropped, 0, 0);
      return UpdateStop();
    case kCodeMenu:
      PostMessageW(frame_, kShowMenu, 0, static_cast<LPARAM>(GetMessagePos()));
      return;
    case kCodeClickBegins:
      listClicked_ = &pane == &list_;
      return;
    case kCodeDropped:
      // One event for each file, and one without a path at the end.
      if (!text.empty()) return dropped_.push_back(text);
      Use(pane);
      PostMessageW(frame_, kUploadDropped, 0, 0);
      return;
    case kCodeOpen:
      // Enter. In the list a click ends with this event, too, and that opens nothing.
      if (!std::exchange(listClicked_, false)) post(kOpen);
      return;
    case kCodeDeleteKey:
      return post(kDelete);
    case kCodeRenamed:
      PostMessageW(frame_, kRefreshOther, 0, reinterpret_cast<LPARAM>(&pane));
      return;
    case kCodeRefreshKey:
      if (!working_) LogOn();
      return;
    case kCodeSwitchView:
      return list_.Focus();
    default:
      return;
  }
}

}  // namespace tarnwick::demo
