#include "Tour.h"

#include <shlobj.h>

#include <algorithm>
#include <utility>

#include "platform/windows/CommonControls.h"

namespace tarnwick::demo {
namespace {

constexpr const wchar_t* kUploaded = L"deep field.png";
constexpr const wchar_t* kTyped = L"stars.jpg";
// A name keeps the file's own extension.
constexpr const wchar_t* kRenamed = L"stars.png";

constexpr int kPage = 4;

std::wstring TextOf(HWND window) {
  wchar_t text[MAX_PATH] = L"";
  GetWindowTextW(window, text, MAX_PATH);
  return text;
}

LONG WidthOf(HWND window) {
  RECT area = {};
  GetWindowRect(window, &area);
  return area.right - area.left;
}

void PressKey(HWND window, WPARAM key) {
  PostMessageW(window, WM_KEYDOWN, key, 1);
}

HWND VisibleChild(HWND parent, const wchar_t* kind, const wchar_t* text) {
  const HWND child = FindWindowExW(parent, nullptr, kind, text);
  return child && IsWindowVisible(child) ? child : nullptr;
}

// What waits for a menu or a dialog: a timer's messages arrive in the loops of those, too.
struct Wait {
  const wchar_t* kind;
  std::function<void(HWND)> meanwhile;
};
Wait waiting;

void CALLBACK OnTimer(HWND, UINT, UINT_PTR timer, DWORD) {
  const HWND opened = FindWindowW(waiting.kind, nullptr);
  if (!opened || !IsWindowVisible(opened)) return;
  KillTimer(nullptr, timer);
  std::exchange(waiting.meanwhile, nullptr)(opened);
}

}  // namespace

bool Tour::Run() {
  ShowAccount();
  ShowUploads();
  ShowListChanges();
  ShowMenuAndPicture();
  ShowThumbnailChanges();
  ShowEmptyAccount();
  CloseUnderWay();
  return well_;
}

// --- The steps ---

void Tour::ShowAccount() {
  const auto shows = [&](int count) { return static_cast<int>(Pictures().size()) == std::min(count, kPage); };
  all_ = host_.List().Count();
  Expect(all_ > kPage && Grid() && shows(all_), L"an account with more than a page of pictures");
  Expect(&host_.Used() == &host_.List(), L"the list first");
  Expect(GetFocus() == host_.List().ListWindow(), L"focus in the list");
  Step(L"01-account");
  Do(kJpg);
  jpg_ = host_.List().Count();
  Expect(shows(jpg_), L"a page of JPEG pictures");
  Do(kGif);
  gif_ = host_.List().Count();
  Expect(gif_ > 0 && jpg_ > 0 && gif_ + jpg_ < all_ && shows(gif_), L"filtered lists");
  Step(L"02-gif");
  Do(kAll);
  Expect(host_.List().Count() == all_ && shows(all_), L"all files again");

  const LONG list = WidthOf(host_.List().Window());
  const LONG thumbnails = WidthOf(host_.Thumbnails().Window());
  RECT frame = {};
  GetWindowRect(host_.Frame(), &frame);
  const auto resize = [&](LONG by) {
    SetWindowPos(host_.Frame(), nullptr, 0, 0, frame.right - frame.left + by, frame.bottom - frame.top + by,
                 SWP_NOMOVE | SWP_NOZORDER);
  };
  resize(60);
  Expect(WidthOf(host_.List().Window()) == list + 60 && WidthOf(host_.Thumbnails().Window()) == thumbnails,
         L"a list that grows with the window");
  Step(L"03-larger");
  resize(0);
}

void Tour::ShowUploads() {
  host_.onProgress = [&] {
    if (host_.Progress() < 40) return;
    host_.onProgress = nullptr;
    Do(kStop);
  };
  Expect(!host_.Upload(UploadPath()) && host_.Progress() == 0 && host_.List().Count() == all_,
         L"an upload that is stopped");
  Step(L"04-upload-stopped");
  Expect(!host_.Upload(UploadPath() + L".gone") && host_.Status().find(L"not found") != std::wstring::npos,
         L"the reason in words");
  Step(L"05-error");

  bool shown = false;
  host_.onProgress = [&] {
    if (shown || host_.Progress() < 40) return;
    shown = true;
    Step(L"06-upload-under-way");
  };
  Upload();
  host_.onProgress = nullptr;
  Expect(shown && host_.Progress() == 100, L"upload progress");
  Step(L"07-uploaded");
}

void Tour::ShowListChanges() {
  Expect(host_.Thumbnails().Select(kUploaded) && Picture(kUploaded), L"the uploaded file in the thumbnails");
  Expect(host_.List().Select(kUploaded), L"selecting the uploaded file");
  TypeName(kTyped, L"08-list-editor");
  Expect(host_.Thumbnails().Select(kRenamed) && host_.List().Select(kRenamed), L"rename in both");
  Step(L"09-list-renamed");
  int most = 0;
  host_.onProgress = [&] { most = std::max(most, host_.Progress()); };
  Download();
  host_.onProgress = nullptr;
  Expect(most == 100 && host_.Progress() == 100, L"download progress up to the size in the listing");
  Step(L"10-downloaded");
  const auto pressDelete = [&] { Do(kDelete); };
  DeleteAndAnswer(pressDelete, IDNO, L"11-question");
  Expect(host_.List().Selected() == kRenamed, L"no delete without a yes");
  DeleteAndAnswer(pressDelete, IDYES, nullptr);
  Expect(
      !host_.List().Select(kRenamed) && host_.List().Count() == all_ && !host_.Thumbnails().Select(kRenamed),
      L"delete in both");
  Step(L"12-list-deleted");

  // Enter on a file opens it; a click does not.
  Expect(host_.List().Select(L"coffee.jpg"), L"selecting in the list");
  const HWND list = host_.List().ListWindow();
  RECT row = {};
  row.left = LVIR_LABEL;
  SendMessageW(list, LVM_GETITEMRECT, 0, reinterpret_cast<LPARAM>(&row));
  const POINT first = {row.left + 4, (row.top + row.bottom) / 2};
  const auto press = [&](UINT button) {
    PointAt(list, first);
    PostMessageW(list, button, 0, MAKELPARAM(first.x, first.y));
    PostMessageW(list, button + (WM_LBUTTONUP - WM_LBUTTONDOWN), 0, MAKELPARAM(first.x, first.y));
    host_.Rest(500);
  };
  press(WM_LBUTTONDOWN);
  Expect(!host_.OpenedPicture(), L"a click opens nothing");
  While(
      L"#32768", [&] { press(WM_RBUTTONDOWN); }, [&](HWND) { PressKey(host_.Frame(), VK_ESCAPE); });
  PressKey(list, VK_RETURN);
  host_.Rest(500);
  Expect(ClosePicture(), L"Enter opens a picture");
}

void Tour::ShowMenuAndPicture() {
  While(
      L"#32768",
      [&] {
        PointAt(Pictures()[2], {20, 30});
        Expect(Press(Pictures()[2], WM_RBUTTONDOWN), L"selecting by the right button");
      },
      [&](HWND) {
        Step(L"13-menu");
        PressKey(host_.Frame(), VK_DOWN);
        PressKey(host_.Frame(), VK_RETURN);
      });
  host_.Rest(500);
  Expect(host_.OpenedPicture() && TextOf(host_.OpenedPicture()) == host_.Thumbnails().Selected(),
         L"the menu opens the selected picture");
  Step(L"14-picture");
  ClosePicture();
  PostMessageW(Pictures()[1], WM_LBUTTONDBLCLK, MK_LBUTTON, MAKELPARAM(20, 20));
  host_.Rest(500);
  Expect(ClosePicture(), L"a double click opens a picture");
}

void Tour::ShowThumbnailChanges() {
  ScrollToEnd();
  Expect(ShowsLastOf(all_), L"the last page");
  Step(L"15-last-page");
  const HWND bar = VisibleChild(host_.Thumbnails().Window(), L"ScrollBar", nullptr);
  PostMessageW(host_.Thumbnails().Window(), WM_VSCROLL, SB_TOP, reinterpret_cast<LPARAM>(bar));
  host_.Rest(200);
  Expect(Pictures().size() == kPage && host_.Used().Selected() == TextOf(Pictures().front()),
         L"the first page again");

  // One picture more or less makes the last page odd.
  Drop(host_.Thumbnails().Window());
  Expect(ShowsLastOf(all_ + 1) && Picture(kUploaded) && host_.Used().Selected() == kUploaded,
         L"the page of the uploaded picture");
  Expect(host_.List().Count() == all_ + 1, L"the uploaded picture in the list");
  Step(L"16-thumbnails-uploaded");
  Expect(Press(Pictures().front()) && Press(Picture(kUploaded)), L"selecting by the mouse");
  TypeName(kTyped, L"17-thumbnails-editor");
  Expect(Picture(kRenamed) && host_.Used().Selected() == kRenamed, L"rename of a picture");
  Step(L"18-thumbnails-renamed");
  Download();
  host_.Log(L"-- Delete key");
  DeleteAndAnswer(
      [&] {
        PressKey(Grid(), VK_DELETE);
        host_.Rest(500);
      },
      IDYES, L"19-thumbnails-question");
  Expect(!Picture(kRenamed) && ShowsLastOf(all_) && host_.List().Count() == all_, L"delete of a picture");
  Step(L"20-thumbnails-deleted");
}

void Tour::ShowEmptyAccount() {
  WithEmptyAccount([&] {
    const HWND link =
        VisibleChild(host_.Thumbnails().Window(), L"Button", L"Click here for a QuickStart tutorial");
    Expect(!Grid() && link && host_.List().Count() == 0, L"the page of an empty account");
    Step(L"21-empty");
    PostMessageW(link, BM_CLICK, 0, 0);
    host_.Rest(200);
    Expect(host_.Status() == L"QuickStart", L"the link to the QuickStart");
    Step(L"22-quickstart");
  });
  Expect(Pictures().size() == kPage && host_.List().Count() == all_, L"the pictures again");
  Expect(Press(Pictures().front()) && &host_.Used() == &host_.Thumbnails(), L"using the thumbnails");
  PostMessageW(VisibleChild(host_.Thumbnails().Window(), L"Button", L"List view"), BM_CLICK, 0, 0);
  host_.Rest(200);
  Expect(&host_.Used() == &host_.List() && GetFocus() == host_.List().ListWindow(), L"to the list");
  Step(L"23-list-again");
}

void Tour::CloseUnderWay() {
  host_.onProgress = [&] {
    host_.onProgress = nullptr;
    SendMessageW(host_.Frame(), WM_CLOSE, 0, 0);
  };
  Expect(!host_.Upload(UploadPath()) && !host_.Frame(), L"an upload that ends with the form");
}

// --- What the steps consist of ---

void Tour::Expect(bool happened, const wchar_t* what) {
  if (!happened) host_.Log(std::wstring(L"NOT AS EXPECTED: ") + what);
  well_ = well_ && happened;
}

void Tour::Step(const wchar_t* name) {
  host_.Rest(400);
  host_.Log(std::wstring(L"== ") + name);
  const std::wstring shot = host_.Given(DemoHost::kShots) + L"\\" + name + L".png";
  for (int i = 0; i < 100 && GetFileAttributesW(shot.c_str()) == INVALID_FILE_ATTRIBUTES; ++i)
    host_.Rest(100);
}

void Tour::Do(Command command) {
  host_.Do(command);
  host_.Rest(100);
}

void Tour::While(const wchar_t* kind, const std::function<void()>& act, std::function<void(HWND)> meanwhile) {
  waiting = {kind, std::move(meanwhile)};
  const UINT_PTR timer = SetTimer(nullptr, 0, 50, OnTimer);
  act();
  KillTimer(nullptr, timer);
  Expect(!waiting.meanwhile, L"a menu or a question");
}

void Tour::PointAt(HWND window, POINT at) {
  ClientToScreen(window, &at);
  SetCursorPos(at.x, at.y);
  // Messages that are posted before the pointer's own are still taken for where it was.
  host_.Rest(100);
}

void Tour::DeleteAndAnswer(const std::function<void()>& act, int answer, const wchar_t* step) {
  While(L"#32770", act, [&](HWND question) {
    if (step) Step(step);
    PostMessageW(question, WM_COMMAND, static_cast<WPARAM>(answer), 0);
  });
}

bool Tour::ClosePicture() {
  if (!host_.OpenedPicture()) return false;
  PressKey(host_.OpenedPicture(), VK_ESCAPE);
  host_.Rest(100);
  return !host_.OpenedPicture();
}

std::wstring Tour::UploadPath() const {
  return host_.Given(DemoHost::kPictures) + L"\\" + kUploaded;
}

void Tour::Upload() {
  Expect(host_.Upload(UploadPath()), L"upload");
}

void Tour::Drop(HWND window) {
  // As another program offers files: the system's object for what is on the clipboard.
  const std::wstring path = UploadPath();
  const HGLOBAL block = GlobalAlloc(GHND, sizeof(DROPFILES) + (path.size() + 2) * sizeof(wchar_t));
  auto* files = static_cast<DROPFILES*>(GlobalLock(block));
  files->pFiles = sizeof(DROPFILES);
  files->fWide = TRUE;
  std::copy(path.begin(), path.end(), reinterpret_cast<wchar_t*>(files + 1));
  GlobalUnlock(block);
  OpenClipboard(host_.Frame());
  EmptyClipboard();
  SetClipboardData(CF_HDROP, block);
  CloseClipboard();
  ComPtr<IDataObject> data;
  OleGetClipboard(data.Receive());
  // Where the system keeps what RegisterDragDrop was given.
  auto* const target = static_cast<IDropTarget*>(GetPropW(window, L"OleDropTargetInterface"));
  Expect(data && target, L"a place to drop files on");
  if (!data || !target) return;
  DWORD effect = DROPEFFECT_COPY;
  target->DragEnter(data.Get(), MK_LBUTTON, {0, 0}, &effect);
  target->Drop(data.Get(), MK_LBUTTON, {0, 0}, &effect);
  Expect(effect == DROPEFFECT_COPY, L"a drop that copies");
  host_.Rest(200);
}

void Tour::TypeName(const wchar_t* name, const wchar_t* step) {
  Do(kRename);
  const HWND editor = GetFocus();
  wchar_t kind[16] = L"";
  GetClassNameW(editor, kind, 16);
  Expect(_wcsicmp(kind, L"Edit") == 0, L"an editor over the name");
  Step(step);
  // All of the old name is selected, so the new one takes its place.
  for (const wchar_t* character = name; *character; ++character) PostMessageW(editor, WM_CHAR, *character, 1);
  host_.Rest(100);
  PostMessageW(editor, WM_KEYDOWN, VK_RETURN, 1);
  host_.Rest(300);
}

void Tour::Download() {
  const std::wstring fetched = host_.Download();
  Expect(GetFileAttributesW(fetched.c_str()) != INVALID_FILE_ATTRIBUTES, L"download");
}

void Tour::WithEmptyAccount(const std::function<void()>& steps) {
  const ComPtr<_CFileUpload> client = host_.Used().Client();
  const Argument product(host_.Given(DemoHost::kProduct));
  const Argument user(L"nobody.yet@demo.example");
  const Argument nothing(L"");
  VARIANT guid = {};
  V_VT(&guid) = VT_BSTR;
  V_BSTR(&guid) = nothing.Get();
  BSTR text = nullptr;
  client->AddUser(product.Get(), user.Get(), guid, &text);
  SysFreeString(text);
  Expect(host_.Fill(), L"listing an account without files");
  steps();
  // Its key is its password.
  VARIANT key = {};
  V_VT(&key) = VT_BSTR;
  client->GetKeyForUser(product.Get(), user.Get(), &V_BSTR(&key));
  LONG deleted = 0;
  client->DeleteUser(product.Get(), user.Get(), key, VARIANT_TRUE, &deleted);
  VariantClear(&key);
  Expect(deleted == 1001, L"the end of the empty account");
  Expect(host_.LogOn(), L"logging on again");
}

// --- The thumbnail page ---

HWND Tour::Grid() {
  return VisibleChild(host_.Thumbnails().Window(), L"Static", L"Pictures of the account");
}

std::vector<HWND> Tour::Pictures() {
  std::vector<HWND> pictures;
  const HWND grid = Grid();
  for (HWND child = nullptr; grid && (child = FindWindowExW(grid, child, L"Static", nullptr)) != nullptr;)
    if (IsWindowVisible(child)) pictures.push_back(child);
  return pictures;
}

HWND Tour::Picture(const wchar_t* caption) {
  return VisibleChild(Grid(), L"Static", caption);
}

bool Tour::Press(HWND picture, UINT button) {
  RECT area = {};
  GetClientRect(picture, &area);
  const LPARAM middle = MAKELPARAM(area.right / 2, area.bottom / 2);
  PostMessageW(picture, button, 0, middle);
  PostMessageW(picture, button + (WM_LBUTTONUP - WM_LBUTTONDOWN), 0, middle);
  host_.Rest(200);
  return host_.Used().Selected() == TextOf(picture);
}

bool Tour::ShowsLastOf(int count) {
  const int last = count <= kPage ? count : count % 2 == 0 ? kPage : kPage - 1;
  return static_cast<int>(Pictures().size()) == last;
}

void Tour::ScrollToEnd() {
  for (int row = 0; row < all_; row += 2) {
    PostMessageW(Grid(), WM_MOUSEWHEEL, MAKEWPARAM(0, static_cast<WORD>(-WHEEL_DELTA)), 0);
    host_.Rest(100);
  }
}

}  // namespace tarnwick::demo
