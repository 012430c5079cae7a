#include "Tour.h"

#include <algorithm>

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

HWND VisibleChild(HWND parent, const wchar_t* kind, const wchar_t* text) {
  const HWND child = FindWindowExW(parent, nullptr, kind, text);
  return child && IsWindowVisible(child) ? child : nullptr;
}

}  // namespace

bool Tour::Run() {
  ShowList();
  ShowThumbnails();
  RenameAndDelete();
  ShowEmptyAccount();
  return well_;
}

// --- The steps ---

void Tour::ShowList() {
  const auto listed = [&](Command filter) {
    Do(filter);
    return host_.List().Count();
  };
  all_ = host_.List().Count();
  Expect(all_ > kPage, L"an account with more than a page of pictures");
  Step(L"01-list");
  jpg_ = listed(kJpg);
  gif_ = listed(kGif);
  Expect(gif_ > 0 && jpg_ > 0 && gif_ + jpg_ < all_, L"filtered lists");
  Step(L"02-list-gif");
  Expect(listed(kAll) == all_, L"all files again");

  bool shown = false;
  host_.onProgress = [&] {
    if (shown || host_.Progress() < 40) return;
    shown = true;
    Step(L"03-list-upload-under-way");
  };
  Upload();
  Expect(shown, L"upload progress");
  host_.onProgress = nullptr;
  Step(L"04-list-uploaded");

  Expect(host_.Shown().Select(kUploaded), L"selecting the uploaded file");
  TypeName(kTyped, L"05-list-editor");
  Expect(host_.Shown().Select(kRenamed), L"rename");
  Step(L"06-list-renamed");
  Download();
  Step(L"07-list-downloaded");
  Do(kDelete);
  Expect(!host_.Shown().Select(kRenamed) && host_.List().Count() == all_, L"delete");
  Step(L"08-list-deleted");
  WithEmptyAccount([&] {
    Expect(host_.List().Count() == 0, L"an empty list");
    Step(L"09-list-empty");
  });
}

void Tour::ShowThumbnails() {
  Do(kSwitch);
  Expect(Grid() && Pictures().size() == kPage, L"a page of pictures");
  Expect(!IsWindowVisible(host_.List().Window()), L"the list hidden");
  Step(L"10-thumbnails");
  const auto shows = [&](int count) { return static_cast<int>(Pictures().size()) == std::min(count, kPage); };
  Do(kGif);
  Expect(shows(gif_), L"a page of GIF pictures");
  Step(L"11-thumbnails-gif");
  Do(kJpg);
  Expect(shows(jpg_), L"a page of JPEG pictures");
  Step(L"12-thumbnails-jpg");
  Do(kAll);
  Expect(shows(all_), L"a page of all pictures");

  ScrollToEnd();
  Expect(ShowsLastOf(all_), L"the last page");
  Step(L"13-thumbnails-last-page");
  const HWND bar = VisibleChild(host_.Thumbnails().Window(), L"ScrollBar", nullptr);
  PostMessageW(host_.Thumbnails().Window(), WM_VSCROLL, SB_TOP, reinterpret_cast<LPARAM>(bar));
  host_.Rest(200);
  Expect(shows(all_) && host_.Shown().Selected() == TextOf(Pictures().front()), L"the first page again");

  // One picture more or less makes the last page odd.
  Upload();
  Expect(ShowsLastOf(all_ + 1) && Picture(kUploaded) && host_.Shown().Selected() == kUploaded,
         L"the page of the uploaded picture");
  Step(L"14-thumbnails-uploaded");
}

void Tour::RenameAndDelete() {
  Expect(Press(Pictures().front()), L"selecting by the mouse");
  Step(L"15-thumbnails-selected");
  Expect(Press(Picture(kUploaded)), L"selecting the uploaded picture");
  TypeName(kTyped, L"16-thumbnails-editor");
  Expect(Picture(kRenamed) && host_.Shown().Selected() == kRenamed, L"rename of a picture");
  Step(L"17-thumbnails-renamed");
  Download();
  host_.Log(L"-- Delete key");
  PostMessageW(Grid(), WM_KEYDOWN, VK_DELETE, 1);
  host_.Rest(300);
  Expect(!Picture(kRenamed) && ShowsLastOf(all_), L"delete of a picture");
  Step(L"18-thumbnails-deleted");
}

void Tour::ShowEmptyAccount() {
  WithEmptyAccount([&] {
    const HWND link =
        VisibleChild(host_.Thumbnails().Window(), L"Button", L"Click here for a QuickStart tutorial");
    Expect(!Grid() && link, L"the page of an empty account");
    Step(L"19-thumbnails-empty");
    PostMessageW(link, BM_CLICK, 0, 0);
    host_.Rest(200);
    Expect(host_.Status() == L"QuickStart", L"the link to the QuickStart");
    Step(L"20-thumbnails-quickstart");
  });
  Expect(Pictures().size() == kPage, L"the pictures again");
  PostMessageW(VisibleChild(host_.Thumbnails().Window(), L"Button", L"List view"), BM_CLICK, 0, 0);
  host_.Rest(200);
  Expect(&host_.Shown() == &host_.List() && IsWindowVisible(host_.List().Window()) &&
             !IsWindowVisible(host_.Thumbnails().Window()) && host_.List().Count() == all_,
         L"the list again");
  Step(L"21-list-again");
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

void Tour::Upload() {
  Expect(host_.Upload(host_.Given(DemoHost::kPictures) + L"\\" + kUploaded), L"upload");
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
  const ComPtr<_CFileUpload> client = host_.Shown().Client();
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

bool Tour::Press(HWND picture) {
  RECT area = {};
  GetClientRect(picture, &area);
  const LPARAM middle = MAKELPARAM(area.right / 2, area.bottom / 2);
  PostMessageW(picture, WM_LBUTTONDOWN, MK_LBUTTON, middle);
  PostMessageW(picture, WM_LBUTTONUP, 0, middle);
  host_.Rest(200);
  return host_.Shown().Selected() == TextOf(picture);
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
