// The thumbnail page's window: what it tells of real messages, what it looks like, and that it may end inside
// any of them.
#include "platform/windows/WindowsHeaders.h"

#include <gtest/gtest.h>
#include <objbase.h>
#include <oleacc.h>

#include <algorithm>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "controls/windows/TextTip.h"
#include "controls/windows/WindowsScrollHook.h"
#include "controls/windows/WindowsThumbnailPage.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/CommonControls.h"
#include "platform/windows/SystemDpi.h"

namespace tarnwick {
namespace {

// A control that writes down what it is told, and does what a test wants in it.
class ScriptedUser : public ThumbnailPageUser, public ControlWindowUser {
 public:
  std::shared_ptr<WindowsThumbnailPage> page;
  std::vector<std::string> told;
  std::function<void(const std::string&)> on;
  bool tellsFocus = false;
  // Of the page in the list.
  int first = 0;

  void OnSlotPressed(int slot, bool right) override {
    Tell("slot " + std::to_string(slot) + (right ? " right" : ""));
  }
  void OnBackgroundPressed(bool right) override { Tell(right ? "background right" : "background"); }
  void OnKeyDown(int key) override { Tell("key " + std::to_string(key)); }
  void OnScrollChanged(int value) override { Tell("changed " + std::to_string(value)); }
  void OnScrollDragged(int value) override { Tell("dragged " + std::to_string(value)); }
  void OnLinkClicked() override { Tell("link"); }
  void OnSwitchView() override { Tell("switch"); }
  void OnEditorEntered() override { Tell("entered"); }
  void OnEditorLeft() override { Tell("left"); }
  void OnPictureUnreadable(int slot) override { Tell("unreadable " + std::to_string(slot)); }
  Text NameOf(int slot) const override {
    return slot == kSlotCount ? Text()
                              : TextFromNumber(first + slot) + u" & a name that is longer than captions.gif";
  }
  Text PlaceOfPage() const override { return u"from " + TextFromNumber(first + 1); }
  void DragBegins() override { Tell("drag"); }
  void FocusLeft() override {
    if (tellsFocus) Tell("focus left");
  }
  void Activated() override {
    if (tellsFocus) Tell("focus");
  }

  void WindowEnds() override {}
  ULONG STDMETHODCALLTYPE AddRef() override {
    held_.push_back(page);
    return 1;
  }
  ULONG STDMETHODCALLTYPE Release() override {
    held_.pop_back();
    return 1;
  }

  // What was told since the last time.
  std::vector<std::string> Take() { return std::exchange(told, {}); }

 private:
  void Tell(const std::string& what) {
    told.push_back(what);
    // A copy: the test may take the function away inside of it.
    if (const auto does = on) does(what);
  }

  // Each message keeps the page that there is.
  std::vector<std::shared_ptr<WindowsThumbnailPage>> held_;
};

using Told = std::vector<std::string>;

void Pump() {
  MSG message = {};
  while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
    TranslateMessage(&message);
    DispatchMessageW(&message);
  }
}

std::wstring NameOf(HWND window) {
  std::wstring text(200, L'\0');
  text.resize(static_cast<std::size_t>(GetWindowTextW(window, text.data(), static_cast<int>(text.size()))));
  return text;
}

std::vector<HWND> ChildrenOf(HWND parent) {
  std::vector<HWND> children;
  for (HWND child = GetWindow(parent, GW_CHILD); child; child = GetWindow(child, GW_HWNDNEXT))
    children.push_back(child);
  return children;
}

RECT PlaceOf(HWND window) {
  RECT place = {};
  GetWindowRect(window, &place);
  MapWindowPoints(nullptr, GetParent(window), reinterpret_cast<POINT*>(&place), 2);
  return place;
}

// What both have in common; empty when they do not overlap.
RECT Common(const RECT& one, const RECT& other) {
  RECT common = {};
  IntersectRect(&common, &one, &other);
  return common;
}

// A picture of one colour, in the temporary folder.
class PictureFile {
 public:
  PictureFile(const wchar_t* name, COLORREF color) {
    wchar_t folder[MAX_PATH] = {};
    GetTempPathW(MAX_PATH, folder);
    path_ = std::wstring(folder) + name;
    Write(color, 1);
  }
  ~PictureFile() { DeleteFileW(path_.c_str()); }
  PictureFile(const PictureFile&) = delete;
  PictureFile& operator=(const PictureFile&) = delete;
  Text Path() const { return TextFromWide(path_); }

  // A file of one pixel, whatever height it claims.
  void Write(COLORREF color, unsigned char height) const {
    // File header, information header, one pixel of 24 bits and its padding.
    unsigned char bytes[58] = {'B', 'M', 58, 0, 0, 0, 0, 0,      0, 0, 54, 0, 0, 0,  40,
                               0,   0,   0,  1, 0, 0, 0, height, 0, 0, 0,  1, 0, 24, 0};
    bytes[54] = GetBValue(color);
    bytes[55] = GetGValue(color);
    bytes[56] = GetRValue(color);
    Write({bytes, sizeof bytes});
  }
  void Write(std::span<const unsigned char> bytes) const {
    const FileOwner file(CreateFileW(path_.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr));
    DWORD written = 0;
    WriteFile(file.Get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr);
  }

 private:
  std::wstring path_;
};

constexpr PicturePlace kWholeSquare = {150, 180, 1965, 1965};

class ThumbnailPageTest : public testing::Test {
 protected:
  ThumbnailPageTest() {
    CoInitialize(nullptr);
    top_ =
        CreateWindowExW(0, L"STATIC", L"host", WS_POPUP, 0, 0, 600, 600, nullptr, nullptr, nullptr, nullptr);
    // Waiting for a window manager that is not there would take seconds.
    ShowWindow(top_, SW_SHOWNOACTIVATE);
    other_ = CreateWindowExW(0, L"EDIT", L"", WS_CHILD | WS_VISIBLE | WS_TABSTOP, 0, 0, 10, 10, top_, nullptr,
                             nullptr, nullptr);
    Make();
  }
  ~ThumbnailPageTest() override {
    page_.reset();
    Pump();
    DestroyWindow(top_);
    CoUninitialize();
  }

  // A page in the host's window, with a grid of three pictures and a scroll bar from 0 to 6.
  void Make() {
    page_ = std::make_shared<WindowsThumbnailPage>(GetModuleHandleW(nullptr), user_);
    page_->SetUser(user_);
    page_->ShowGrid(true);
    page_->SetEmptyTexts(u"There are no images.", u"Click here");
    for (int slot = 1; slot < kSlotCount; ++slot) {
      page_->SetCaption(slot, u"picture " + TextFromNumber(slot) + u".gif");
      page_->SetPicture(slot, file_.Path(), kWholeSquare);
    }
    page_->SetScrollRange(6);
    Place(page_->Window());
    page_->Focus();
  }
  void Place(HWND window) {
    const RECT size = layout::Pixels(layout::kPage, SystemDpi());
    SetParent(window, top_);
    MoveWindow(window, 0, 0, size.right, size.bottom, TRUE);
    ShowWindow(window, SW_SHOW);
  }

  HWND Child(const wchar_t* className) const {
    return FindWindowExW(page_->Window(), nullptr, className, nullptr);
  }
  HWND Grid() const { return Child(L"Static"); }
  HWND ScrollBar() const { return Child(L"ScrollBar"); }
  HWND Link() const { return Child(L"Button"); }
  HWND Switch() const { return FindWindowExW(page_->Window(), Link(), L"Button", nullptr); }
  HWND Editor() const { return FindWindowExW(Grid(), nullptr, L"Edit", nullptr); }
  // The slots stand behind the editor and its label.
  HWND Slot(int slot) const { return ChildrenOf(Grid()).at(static_cast<std::size_t>(slot) + 1); }
  void Scroll(int code, int position = 0) const {
    SendMessageW(page_->Window(), WM_VSCROLL, MAKEWPARAM(code, position),
                 reinterpret_cast<LPARAM>(ScrollBar()));
  }
  static LPARAM At(int x, int y) { return MAKELPARAM(x, y); }

  // The middle of a slot on the screen.
  COLORREF Seen(int slot) const {
    const int middle = layout::Pixels(1130, SystemDpi());
    const WindowDcOwner dc = DcOf(Slot(slot));
    return GetPixel(dc.Get().dc, middle, middle);
  }
  // Lets the window live until `happened`.
  static void Await(const std::function<bool()>& happened) {
    for (int i = 0; i < 500 && !happened(); ++i) {
      MsgWaitForMultipleObjects(0, nullptr, FALSE, 10, QS_ALLINPUT);
      Pump();
    }
    EXPECT_TRUE(happened());
  }

  PictureFile file_{L"thumbnail-test.bmp", RGB(200, 30, 90)};
  ScriptedUser user_;
  HWND top_ = nullptr;
  HWND other_ = nullptr;
  std::shared_ptr<WindowsThumbnailPage>& page_ = user_.page;
};

// --- What it shows ---

TEST_F(ThumbnailPageTest, WindowsStandAsLaidOutAndHaveNames) {
  const auto expectFit = [&](HWND parent) {
    const std::vector<HWND> children = ChildrenOf(parent);
    const RECT room = PlaceOf(parent);
    for (const HWND child : children) {
      if (!IsWindowVisible(child)) continue;
      const RECT place = PlaceOf(child);
      const RECT inside = Common(place, {0, 0, room.right - room.left, room.bottom - room.top});
      EXPECT_TRUE(!IsRectEmpty(&place) && EqualRect(&inside, &place));
      EXPECT_FALSE(NameOf(child).empty());
      for (const HWND sibling : children) {
        const RECT shared = Common(place, PlaceOf(sibling));
        EXPECT_TRUE(sibling == child || !IsWindowVisible(sibling) || IsRectEmpty(&shared));
      }
    }
  };
  const RECT page = layout::Pixels(layout::kPage, SystemDpi());
  EXPECT_EQ(MulDiv(WindowsThumbnailPage::kNaturalExtent.cx, SystemDpi(), 2540), page.right);
  EXPECT_EQ(MulDiv(WindowsThumbnailPage::kNaturalExtent.cy, SystemDpi(), 2540), page.bottom);
  EXPECT_FALSE(NameOf(page_->Window()).empty());
  expectFit(page_->Window());
  expectFit(Grid());
  page_->SetCaption(2, u"Tom && J\u00E9r\u014Dme.gif");
  EXPECT_EQ(NameOf(Slot(2)), L"Tom && J\u00E9r\u014Dme.gif");
  page_->ClearSlot(2);
  EXPECT_EQ(NameOf(Slot(2)), L"Picture 2");

  // A screen reader takes the static before an editor for its name.
  page_->ShowEditor(4, u"name.jpg");
  const HWND label = GetWindow(Editor(), GW_HWNDPREV);
  EXPECT_FALSE(NameOf(label).empty());
  EXPECT_FALSE(IsWindowVisible(label));

  page_->ShowGrid(false);
  expectFit(page_->Window());
  EXPECT_FALSE(IsWindowVisible(Editor()));
  EXPECT_FALSE(IsWindowVisible(ScrollBar()));
  EXPECT_EQ(NameOf(Link()), L"Click here");
  EXPECT_EQ(GetFocus(), Link());
  // In a large font both texts take more lines.
  const auto heights = [&] {
    const RECT link = PlaceOf(Link());
    const RECT message = PlaceOf(GetWindow(Link(), GW_HWNDPREV));
    return SIZE{message.bottom - message.top, link.bottom - link.top};
  };
  const SIZE before = heights();
  const FontOwner large(
      CreateFontW(layout::Pixels(-600, SystemDpi()), 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, L"Arial"));
  page_->SetLook(large.Get(), std::nullopt, std::nullopt);
  expectFit(page_->Window());
  EXPECT_GT(heights().cx, 3 * before.cx);
  EXPECT_GT(heights().cy, 2 * before.cy);
  page_->SetLook(nullptr, std::nullopt, std::nullopt);
  page_->ShowSlot(2, false);
  page_->ShowGrid(true);
  for (int slot = 1; slot <= kSlotCount; ++slot) EXPECT_TRUE(IsWindowVisible(Slot(slot)));
  EXPECT_EQ(user_.Take(), Told{});
}

TEST_F(ThumbnailPageTest, DrawsPicturesSelectionAndCaptions) {
  const RECT size = layout::Pixels(layout::kPage, SystemDpi());
  const HDC screen = GetDC(nullptr);
  const HDC dc = CreateCompatibleDC(screen);
  const BitmapOwner bitmap(CreateCompatibleBitmap(screen, size.right, size.bottom));
  ReleaseDC(nullptr, screen);
  const HGDIOBJ old = SelectObject(dc, bitmap.Get());
  const auto pixel = [&](int slot, double x, double y) {
    const RECT frame = layout::Pixels(layout::kFrames[static_cast<std::size_t>(slot) - 1], SystemDpi());
    return GetPixel(dc, frame.left + layout::Pixels(x, SystemDpi()),
                    frame.top + layout::Pixels(y, SystemDpi()));
  };
  const COLORREF window = GetSysColor(COLOR_WINDOW);
  const COLORREF highlight = GetSysColor(COLOR_HIGHLIGHT);

  page_->SetPicture(1, file_.Path(), PicturePlace{150, 671.5, 1965, 982});
  page_->SetPicture(3, u"C:\\no such picture.gif", kWholeSquare);
  page_->SetSelected(1, true);
  page_->ShowSlot(4, false);
  page_->Draw(dc, size);
  EXPECT_EQ(pixel(1, 160, 690), RGB(200, 30, 90));
  EXPECT_EQ(pixel(1, 2100, 1640), RGB(200, 30, 90));
  EXPECT_EQ(pixel(1, 1130, 640), window);
  EXPECT_EQ(pixel(1, 1130, 1690), window);
  EXPECT_EQ(pixel(1, 115, 1160), highlight);
  EXPECT_EQ(pixel(1, 120, 2240), highlight);
  EXPECT_EQ(pixel(2, 160, 190), RGB(200, 30, 90));
  EXPECT_EQ(pixel(2, 115, 1160), window);
  EXPECT_EQ(pixel(2, 120, 2240), RGB(255, 255, 255));
  // A broken picture leaves its caption and an empty square.
  EXPECT_EQ(pixel(3, 1130, 1160), window);
  EXPECT_NE(pixel(3, 0, 1000), window);
  EXPECT_EQ(pixel(4, 0, 1000), window);

  // Two grey pixels side by side that are seen one above the other, with a size that only a decoder tells.
  const unsigned char tiff[] = {'I', 'I', 42, 0, 8, 0, 0, 0, 9,   0,        //
                                0,   1,   4,  0, 1, 0, 0, 0, 2,   0, 0, 0,  // width
                                1,   1,   4,  0, 1, 0, 0, 0, 1,   0, 0, 0,  // height
                                2,   1,   3,  0, 1, 0, 0, 0, 8,   0, 0, 0,  // bits
                                3,   1,   3,  0, 1, 0, 0, 0, 1,   0, 0, 0,  // as they are
                                6,   1,   3,  0, 1, 0, 0, 0, 1,   0, 0, 0,  // black is 0
                                17,  1,   4,  0, 1, 0, 0, 0, 122, 0, 0, 0,  // where
                                18,  1,   3,  0, 1, 0, 0, 0, 6,   0, 0, 0,  // from the right
                                22,  1,   4,  0, 1, 0, 0, 0, 1,   0, 0, 0,  // lines
                                23,  1,   4,  0, 1, 0, 0, 0, 2,   0, 0, 0, 0, 0, 0, 0, 80, 160};
  file_.Write(tiff);
  EXPECT_TRUE(page_->SetPicture(1, file_.Path(), std::nullopt));
  page_->Draw(dc, size);
  EXPECT_EQ(pixel(1, 1130, 640), RGB(80, 80, 80));
  EXPECT_EQ(pixel(1, 1130, 1690), RGB(160, 160, 160));
  EXPECT_EQ(pixel(1, 620, 640), window);

  page_->SetSelected(1, false);
  page_->SetPicture(2, u"", kWholeSquare);
  page_->Draw(dc, size);
  EXPECT_EQ(pixel(1, 115, 1160), window);
  EXPECT_EQ(pixel(2, 1130, 1160), window);

  // What the grid says in place of pictures, drawn and on the screen.
  for (int slot = 1; slot <= kSlotCount; ++slot) page_->ShowSlot(slot, false);
  page_->SetGridText(u"none");
  page_->Draw(dc, size);
  UpdateWindow(Grid());
  const RECT message = layout::Pixels(layout::kMessage, SystemDpi());
  const WindowDcOwner grid = DcOf(Grid());
  for (const HDC shown : {dc, grid.Get().dc}) {
    int inked = 0;
    for (LONG x = message.left; x < message.right; ++x)
      inked += GetPixel(shown, x, message.top + 8) != window ? 1 : 0;
    EXPECT_GT(inked, 2);
    EXPECT_LT(inked, 30);
  }

  // The blue link stands on the system's colour also where the container is dark.
  const COLORREF dark = RGB(9, 9, 9);
  page_->SetLook(nullptr, RGB(250, 250, 250), dark);
  page_->ShowGrid(false);
  page_->Draw(dc, size);
  UpdateWindow(page_->Window());
  UpdateWindow(Link());
  const RECT link = PlaceOf(Link());
  const WindowDcOwner page = DcOf(page_->Window());
  const WindowDcOwner label = DcOf(Link());
  EXPECT_EQ(GetPixel(dc, link.left + 2, link.top + 2), window);
  EXPECT_EQ(GetPixel(label.Get().dc, 2, 2), window);
  for (const HDC shown : {dc, page.Get().dc}) EXPECT_EQ(GetPixel(shown, link.left - 2, link.top + 2), dark);
  SelectObject(dc, old);
  DeleteDC(dc);
}

TEST_F(ThumbnailPageTest, DrawsAPictureWhenItIsDecoded) {
  const COLORREF window = GetSysColor(COLOR_WINDOW);
  const COLORREF green = RGB(20, 180, 60);
  const COLORREF blue = RGB(20, 60, 180);
  const PictureFile other(L"thumbnail-other.bmp", green);
  const auto show = [&](int slot) { return page_->SetPicture(slot, other.Path(), kWholeSquare); };
  EXPECT_TRUE(show(1));
  EXPECT_EQ(Seen(1), window) << "a message draws it, so nobody has waited for it";
  Await([&] { return Seen(1) == green; });

  // A picture that comes back is there at once, as long as its file is the same.
  page_->ClearSlot(1);
  show(2);
  EXPECT_EQ(Seen(2), green);
  other.Write(blue, 1);
  show(2);
  EXPECT_EQ(Seen(2), window);
  Await([&] { return Seen(2) == blue; });

  // What turns out to be no picture is told, unless its page was left by then.
  other.Write(blue, 2);
  for (const int slot : {3, 1}) EXPECT_TRUE(show(slot));
  page_->SetPicture(3, file_.Path(), kWholeSquare);
  EXPECT_EQ(user_.Take(), Told{});
  Await([&] { return !user_.told.empty() && Seen(3) != window; });
  EXPECT_EQ(user_.Take(), Told{"unreadable 1"});
  EXPECT_EQ(Seen(1), window);
}

// Asks a tip for the text of the tool; whether the next window is to be asked.
BOOL CALLBACK AskTip(HWND window, LPARAM param) {
  wchar_t name[40] = {};
  GetClassNameW(window, name, 40);
  if (std::wstring(name) != TOOLTIPS_CLASSW) return TRUE;
  auto& tool = *reinterpret_cast<TTTOOLINFOW*>(param);
  return SendMessageW(window, TTM_GETTEXTW, 300, param), tool.lpszText[0] == L'\0';
}

// The text of the tip that a slot has once the pointer was over it.
std::wstring TipOver(HWND slot) {
  SendMessageW(slot, WM_MOUSEMOVE, 0, MAKELPARAM(9, 9));
  std::wstring tip(300, L'\0');
  TTTOOLINFOW tool = {};
  tool.cbSize = TTTOOLINFOW_V2_SIZE;
  tool.hwnd = GetParent(slot);
  tool.uId = reinterpret_cast<UINT_PTR>(slot);
  tool.lpszText = tip.data();
  EnumThreadWindows(GetCurrentThreadId(), AskTip, reinterpret_cast<LPARAM>(&tool));
  tip.resize(wcslen(tip.c_str()));
  return tip;
}

TEST_F(ThumbnailPageTest, TipsSayWhyAPictureIsNotShown) {
  const PictureFile broken(L"thumbnail-broken.picture", 0);
  page_->SetTip(2, u"Tom & J\u00E9r\u014Dme.gif\r\n12 Bytes");
  EXPECT_EQ(TipOver(Slot(2)), L"Tom & J\u00E9r\u014Dme.gif\r\n12 Bytes");
  const auto expect = [&](bool shows, std::wstring_view reason) {
    page_->ClearSlot(1);
    EXPECT_EQ(TipOver(Slot(1)), L"");
    page_->SetTip(1, u"name");
    EXPECT_EQ(page_->SetPicture(1, broken.Path(), kWholeSquare), shows);
    if (shows) Await([&] { return !user_.told.empty(); });
    user_.Take();
    EXPECT_NE(TipOver(Slot(1)).find(reason), std::wstring::npos) << reason.data();
  };
  broken.Write(0, 2);
  expect(true, L"name\r\nNot shown: the file is damaged");
  std::vector<unsigned char> bytes(100, 'x');
  broken.Write(bytes);
  expect(false, L"name\r\nNot shown: this is another kind");
  const std::string huge("GIF89a\xFF\xFF\xFF\xFF\0\0\0,\0\0\0\0\xFF\xFF\xFF\xFF", 22);
  std::copy(huge.begin(), huge.end(), bytes.begin());
  broken.Write(bytes);
  expect(true, L"name\r\nNot shown: the picture is too large");
  // What is shown has nothing more to say, in another window of the host's, too.
  DestroyWindow(page_->Window());
  Place(page_->Window());
  page_->SetTip(1, u"name");
  page_->SetPicture(1, file_.Path(), kWholeSquare);
  Await([&] { return Seen(1) == RGB(200, 30, 90); });
  EXPECT_EQ(TipOver(Slot(1)), L"name");
}

TEST_F(ThumbnailPageTest, TransparentPicturesFollowAChangeOfColours) {
  // A GIF of three pixels, of which the first two are transparent.
  const std::string gif("GIF89a\3\0\1\0\x80\0\0...RGB!\xF9\4\1\0\0\0\0,\0\0\0\0\3\0\1\0\0\2\2\4R\0;", 43);
  const PictureFile transparent(L"thumbnail-transparent.gif", 0);
  transparent.Write(std::span(reinterpret_cast<const unsigned char*>(gif.data()), gif.size()));
  page_->SetPicture(1, transparent.Path(), kWholeSquare);
  const COLORREF before = GetSysColor(COLOR_WINDOW);
  const auto opaque = [&] {
    const WindowDcOwner dc = DcOf(Slot(1));
    return GetPixel(dc.Get().dc, layout::Pixels(1900, SystemDpi()), layout::Pixels(1130, SystemDpi()));
  };
  Await([&] { return Seen(1) == before && opaque() == RGB('R', 'G', 'B'); });
  const COLORREF green = RGB(20, 180, 60);
  const COLORREF blue = RGB(20, 60, 180);
  page_->SetLook(nullptr, std::nullopt, green);
  Await([&] { return Seen(1) == green; });
  page_->SetLook(nullptr, std::nullopt, std::nullopt);
  Await([&] { return Seen(1) == before; });
  const INT element = COLOR_WINDOW;
  SetSysColors(1, &element, &blue);
  Await([&] { return Seen(1) == blue; });
  SetSysColors(1, &element, &before);
  Await([&] { return Seen(1) == before; });
  EXPECT_EQ(user_.Take(), Told{});
}

TEST_F(ThumbnailPageTest, APictureThatWasLeftIsNotDrawn) {
  const PictureFile left(L"thumbnail-left.bmp", RGB(20, 180, 60));
  for (const int slot : {1, 2, 4}) {
    page_->SetPicture(slot, left.Path(), kWholeSquare);
    page_->ClearSlot(slot);
  }
  page_->SetPicture(2, file_.Path(), kWholeSquare);
  Await([&] { return Seen(2) == RGB(200, 30, 90) && Seen(3) == RGB(200, 30, 90); });
  for (const int slot : {1, 4}) EXPECT_EQ(Seen(slot), GetSysColor(COLOR_WINDOW));
}

// --- What it tells ---

TEST_F(ThumbnailPageTest, ADragBeginsBeyondTheSystemsDistanceOnly) {
  const int far = 40 + GetSystemMetrics(SM_CXDRAG) + 1;
  const auto drag = [&](int slot, int x, int y, int toX, int toY) {
    SendMessageW(Slot(slot), WM_LBUTTONDOWN, MK_LBUTTON, At(x, y));
    SendMessageW(Slot(slot), WM_MOUSEMOVE, MK_LBUTTON, At(toX, toY));
    SendMessageW(Slot(slot), WM_MOUSEMOVE, MK_LBUTTON, At(toX, toY));
    SendMessageW(Slot(slot), WM_LBUTTONUP, 0, At(toX, toY));
    SendMessageW(Slot(slot), WM_MOUSEMOVE, MK_LBUTTON, At(far + 50, far + 50));
    EXPECT_EQ(GetCapture(), nullptr);
    return user_.Take();
  };
  EXPECT_EQ(drag(1, 40, 40, far, 40), (Told{"slot 1", "drag"}));
  EXPECT_EQ(drag(2, 40, 40, 40, -far), (Told{"slot 2", "drag"}));
  EXPECT_EQ(drag(3, 40, 40, far - 1, 40), Told{"slot 3"});
  EXPECT_EQ(drag(4, 40, 40, far, 40), Told{"slot 4"});  // no picture
  EXPECT_EQ(drag(1, 2, 40, far, 40), Told{"slot 1"});   // its frame
}

TEST_F(ThumbnailPageTest, TellsWhereTheScrollBarComesToRest) {
  EXPECT_EQ(page_->ScrollValue(), 0);
  const struct {
    int code;
    int position;
    Told told;
    int value;
  } moves[] = {
      {SB_LINEUP, 0, {}, 0},
      {SB_LINEDOWN, 0, {"changed 2"}, 2},
      {SB_BOTTOM, 0, {"changed 6"}, 6},
      {SB_LINEDOWN, 0, {}, 6},
      {SB_ENDSCROLL, 0, {}, 6},
      {SB_PAGEUP, 0, {"changed 4"}, 4},
      {SB_THUMBTRACK, 3, {"dragged 2"}, 2},
      {SB_THUMBTRACK, 2, {}, 2},
      {SB_THUMBTRACK, 9, {"dragged 6"}, 6},
      {SB_THUMBPOSITION, 6, {"changed 6"}, 6},
      {SB_TOP, 0, {"changed 0"}, 0},
      // Back to where it was, past another page.
      {SB_THUMBTRACK, 4, {"dragged 4"}, 4},
      {SB_THUMBTRACK, 0, {"dragged 0"}, 0},
      {SB_THUMBPOSITION, 0, {"changed 0"}, 0},
      {SB_THUMBPOSITION, 0, {}, 0},
  };
  for (const auto& move : moves) {
    SCOPED_TRACE(move.code);
    Scroll(move.code, move.position);
    EXPECT_EQ(user_.Take(), move.told);
    EXPECT_EQ(page_->ScrollValue(), move.value);
    // While the thumb is dragged the bar has its own idea of it.
    if (move.code != SB_THUMBTRACK) {
      EXPECT_EQ(GetScrollPos(ScrollBar(), SB_CTL), move.value);
    }
  }

  // Half notches add up; a notch is a row.
  for (const int delta : {-60, -60, -240, 120}) SendMessageW(Slot(1), WM_MOUSEWHEEL, MAKEWPARAM(0, delta), 0);
  EXPECT_EQ(user_.Take(), (Told{"changed 2", "changed 6", "changed 4"}));

  // What the rules set is no news.
  page_->SetScrollRange(-1);
  EXPECT_EQ(page_->ScrollValue(), 0);
  Scroll(SB_LINEDOWN);
  page_->SetScrollRange(6);
  page_->EnableScroll(false);
  EXPECT_FALSE(IsWindowEnabled(ScrollBar()));
  SendMessageW(Grid(), WM_MOUSEWHEEL, MAKEWPARAM(0, -120), 0);
  EXPECT_EQ(user_.Take(), Told{});

  // A list longer than the message has room for.
  page_->SetScrollRange(100'000);
  page_->EnableScroll(true);
  page_->SetScrollValue(99'998);
  EXPECT_EQ(GetScrollPos(ScrollBar(), SB_CTL), 99'998);
  Scroll(SB_LINEDOWN);
  EXPECT_EQ(user_.Take(), Told{"changed 100000"});
}

TEST_F(ThumbnailPageTest, TheEditorTellsItsEndOnce) {
  page_->ShowEditor(2, u"Bl\u00FCm\u014Dhen.gif");
  EXPECT_EQ(GetFocus(), Editor());
  DWORD begin = 1;
  DWORD end = 1;
  SendMessageW(Editor(), EM_GETSEL, reinterpret_cast<WPARAM>(&begin), reinterpret_cast<LPARAM>(&end));
  EXPECT_EQ(begin, 0U);
  EXPECT_EQ(end, 12U);
  EXPECT_EQ(page_->EditorText(), u"Bl\u00FCm\u014Dhen.gif");
  SendMessageW(Editor(), WM_CHAR, L'\u20AC', 0);
  // The other line of a long caption is not seen below.
  const auto below = [&] {
    UpdateWindow(Slot(2));
    const WindowDcOwner dc = DcOf(Slot(2));
    return GetPixel(dc.Get().dc, layout::Pixels(150, SystemDpi()), layout::Pixels(2550, SystemDpi()));
  };
  page_->SetCaption(2, u"WWWWWWWWWWWWWWWWWWWW.gif");
  page_->SetSelected(2, true);
  EXPECT_EQ(below(), GetSysColor(COLOR_WINDOW));

  // The host shows a message inside: the focus that the editor loses then is no second end.
  user_.on = [&](const std::string&) {
    SetFocus(other_);
    EXPECT_EQ(page_->EditorText(), u"\u20AC");
    page_->HideEditor();
  };
  SendMessageW(Editor(), WM_KEYDOWN, VK_RETURN, 0);
  EXPECT_EQ(user_.Take(), Told{"entered"});
  EXPECT_FALSE(IsWindowVisible(Editor()));
  EXPECT_EQ(below(), GetSysColor(COLOR_HIGHLIGHT));

  user_.on = [&](const std::string&) { page_->HideEditor(); };
  page_->ShowEditor(1, u"a");
  SendMessageW(Editor(), WM_KEYDOWN, VK_ESCAPE, 0);
  EXPECT_EQ(GetFocus(), Grid());
  page_->ShowEditor(1, u"a");
  SetFocus(other_);
  page_->ShowEditor(1, u"a");
  // A press elsewhere first ends the edit.
  SendMessageW(Slot(3), WM_LBUTTONDOWN, MK_LBUTTON, At(3, 3));
  EXPECT_EQ(user_.Take(), (Told{"left", "left", "left", "slot 3"}));
  page_->ShowEditor(1, u"a");
  page_->HideEditor();
  EXPECT_EQ(GetFocus(), Grid());
  EXPECT_EQ(user_.Take(), Told{});
}

TEST_F(ThumbnailPageTest, TheKeyboardReachesWhatIsShown) {
  // A control that becomes active takes the focus; what has it inside keeps it then.
  user_.tellsFocus = true;
  user_.on = [&](const std::string& what) {
    if (what == "focus") page_->Focus();
  };
  SetFocus(Switch());
  EXPECT_EQ(GetFocus(), Switch());
  SetFocus(other_);
  SetFocus(page_->Window());
  EXPECT_EQ(GetFocus(), Grid());
  EXPECT_EQ(user_.Take(), (Told{"focus", "focus left", "focus"}));
  user_.on = {};
  page_->ShowEditor(1, u"a");
  SetFocus(other_);
  EXPECT_EQ(user_.Take(), (Told{"focus", "left", "focus left"}));
  page_->HideEditor();
  user_.tellsFocus = false;
  SetFocus(Grid());

  // By the control itself, and in the loop of a dialog that knows nothing of controls.
  const auto walk = [&](bool backward) {
    const HWND begin = GetFocus();
    std::vector<HWND> stops = {begin};
    while (page_->MoveFocus(backward) && stops.size() < 9) stops.push_back(GetFocus());
    const HWND end = GetFocus();
    SetFocus(begin);
    BYTE keys[256] = {};
    keys[VK_SHIFT] = backward ? 0x80 : 0;
    SetKeyboardState(keys);
    for (std::size_t i = 1; i <= stops.size(); ++i) {
      MSG tab = {GetFocus(), WM_KEYDOWN, VK_TAB, 0, 0, {0, 0}};
      EXPECT_TRUE(IsDialogMessageW(top_, &tab));
      EXPECT_EQ(GetFocus(), i < stops.size() ? stops[i] : other_);
    }
    keys[VK_SHIFT] = 0;
    SetKeyboardState(keys);
    SetFocus(end);
    return stops;
  };
  using Windows = std::vector<HWND>;
  EXPECT_EQ(walk(false), (Windows{Grid(), ScrollBar(), Switch()}));
  EXPECT_EQ(walk(true), (Windows{Switch(), ScrollBar(), Grid()}));
  page_->ShowEditor(1, u"a");
  MSG tab = {Editor(), WM_KEYDOWN, VK_TAB, 0, 0, {0, 0}};
  IsDialogMessageW(top_, &tab);
  EXPECT_EQ(GetFocus(), ScrollBar());
  page_->HideEditor();
  SetFocus(Grid());
  page_->EnableScroll(false);
  EXPECT_EQ(walk(false), (Windows{Grid(), Switch()}));
  page_->ShowGrid(false);
  page_->Focus();
  EXPECT_EQ(walk(false), (Windows{Link(), Switch()}));
  SetFocus(other_);
  EXPECT_FALSE(page_->MoveFocus(false));
}

// --- Screen readers ---

ComPtr<IAccessible> AccessibleOf(HWND window) {
  ComPtr<IAccessible> found;
  EXPECT_EQ(AccessibleObjectFromWindow(window, static_cast<DWORD>(OBJID_CLIENT), __uuidof(IAccessible),
                                       found.ReceiveVoid()),
            S_OK);
  return found;
}

VARIANT Item(LONG number) {
  VARIANT item = {};
  V_VT(&item) = VT_I4;
  V_I4(&item) = number;
  return item;
}

std::string TakenText(HRESULT result, BSTR text) {
  std::string told = result == S_OK ? Utf8FromText(TextFromWide(text)) : result == S_FALSE ? "" : "failed";
  SysFreeString(text);
  return told;
}

// Role, state, name, value, action and, where there is one, description, as such a program would read them
// out.
std::string ReadOut(IAccessible& object, LONG number = CHILDID_SELF) {
  VARIANT role = {};
  VARIANT state = {};
  if (FAILED(object.get_accRole(Item(number), &role)) || FAILED(object.get_accState(Item(number), &state)))
    return "gone";
  std::string told = V_I4(&role) == ROLE_SYSTEM_LIST       ? "list"
                     : V_I4(&role) == ROLE_SYSTEM_LISTITEM ? "item"
                                                           : "?";
  for (const auto& [bit, word] : {std::pair{STATE_SYSTEM_SELECTABLE, " selectable"},
                                  {STATE_SYSTEM_SELECTED, " selected"},
                                  {STATE_SYSTEM_FOCUSED, " focused"},
                                  {STATE_SYSTEM_INVISIBLE, " hidden"}})
    if (V_I4(&state) & bit) told += word;
  using Get = HRESULT (STDMETHODCALLTYPE IAccessible::*)(VARIANT, BSTR*);
  for (const Get get :
       {&IAccessible::get_accName, &IAccessible::get_accValue, &IAccessible::get_accDefaultAction}) {
    BSTR text = nullptr;
    const HRESULT result = (object.*get)(Item(number), &text);
    told += "|" + TakenText(result, text);
  }
  BSTR text = nullptr;
  const HRESULT result = object.get_accDescription(Item(number), &text);
  const std::string description = TakenText(result, text);
  return description.empty() ? told : told + "|" + description;
}

// What is told to who listens, as event and window.
std::vector<std::pair<DWORD, HWND>> heard;
void CALLBACK Hear(HWINEVENTHOOK, DWORD event, HWND window, LONG object, LONG child, DWORD, DWORD) {
  if (object == OBJID_CLIENT && child == CHILDID_SELF) heard.emplace_back(event, window);
}

TEST_F(ThumbnailPageTest, ScreenReadersFindAListOfPictures) {
  const auto name = [](int number) {
    return std::to_string(number) + " & a name that is longer than captions.gif";
  };
  page_->SetSelected(2, true);
  ComPtr<IAccessible> grid = AccessibleOf(Grid());
  LONG count = 0;
  EXPECT_EQ(grid->get_accChildCount(&count), S_OK);
  EXPECT_EQ(count, 3);
  EXPECT_EQ(ReadOut(*grid), "list|Pictures of the account|from 1|");
  EXPECT_EQ(ReadOut(*grid, 1), "item selectable|" + name(1) + "||Open");
  // What its tip tells, when the picture has turned out to be none.
  const PictureFile broken(L"thumbnail-broken.picture", 0);
  broken.Write(0, 2);
  page_->SetTip(1, u"name\r\n12 Bytes");
  page_->SetPicture(1, broken.Path(), kWholeSquare);
  EXPECT_EQ(ReadOut(*grid, 1), "item selectable|" + name(1) + "||Open|12 Bytes");
  Await([&] { return !user_.told.empty(); });
  EXPECT_EQ(user_.Take(), Told{"unreadable 1"});
  EXPECT_EQ(ReadOut(*grid, 1),
            "item selectable|" + name(1) +
                "||Open|12 Bytes\r\nNot shown: the file is damaged, or this system cannot read it.");
  EXPECT_EQ(ReadOut(*grid, 2), "item selectable selected focused|" + name(2) + "||Open");
  EXPECT_EQ(ReadOut(*grid, 4), "gone");
  // By itself, as the selection, and as what is under the pointer.
  const auto expectSecond = [&](IDispatch* object, const char* what) {
    SCOPED_TRACE(what);
    ComPtr<IAccessible> item;
    ASSERT_TRUE(object && object->QueryInterface(__uuidof(IAccessible), item.ReceiveVoid()) == S_OK);
    object->Release();
    EXPECT_EQ(ReadOut(*item), "item selectable selected focused|" + name(2) + "||Open");
    LONG left = 0;
    LONG top = 0;
    LONG width = 0;
    LONG height = 0;
    EXPECT_EQ(item->accLocation(&left, &top, &width, &height, Item(CHILDID_SELF)), S_OK);
    RECT place = {};
    GetWindowRect(Slot(2), &place);
    const RECT told = {left, top, left + width, top + height};
    EXPECT_TRUE(EqualRect(&place, &told));
    ComPtr<IDispatch> parent;
    EXPECT_EQ(item->get_accParent(parent.Receive()), S_OK);
    EXPECT_EQ(parent.Get(), static_cast<IDispatch*>(grid.Get()));
  };
  IDispatch* child = nullptr;
  EXPECT_EQ(grid->get_accChild(Item(2), &child), S_OK);
  expectSecond(child, "child");
  expectSecond(AccessibleOf(Slot(2)).Detach(), "window");
  RECT place = {};
  GetWindowRect(Slot(2), &place);
  VARIANT found = {};
  EXPECT_EQ(grid->accHitTest(place.left + 5, place.top + 5, &found), S_OK);
  expectSecond(V_DISPATCH(&found), "hit");
  for (const auto get : {&IAccessible::get_accSelection, &IAccessible::get_accFocus}) {
    EXPECT_EQ((grid.Get()->*get)(&found), S_OK);
    expectSecond(V_DISPATCH(&found), "selected");
  }
  SetFocus(other_);
  EXPECT_EQ(ReadOut(*grid, 2), "item selectable selected|" + name(2) + "||Open");
  EXPECT_EQ(grid->get_accFocus(&found), S_FALSE);

  // What it is told to do is what the user does.
  EXPECT_EQ(grid->accSelect(SELFLAG_TAKESELECTION, Item(3)), S_OK);
  EXPECT_EQ(grid->accSelect(SELFLAG_ADDSELECTION, Item(1)), E_INVALIDARG);
  EXPECT_EQ(user_.Take(), Told{}) << "not while the other program waits";
  Pump();
  EXPECT_EQ(GetFocus(), other_);
  EXPECT_EQ(grid->accDoDefaultAction(Item(1)), S_OK);
  EXPECT_EQ(grid->accDoDefaultAction(Item(CHILDID_SELF)), DISP_E_MEMBERNOTFOUND);
  Pump();
  EXPECT_EQ(GetFocus(), Grid());
  EXPECT_EQ(user_.Take(), (Told{"slot 3", "slot 1", "key 13"}));

  // Another thread's program asks by messages, and keeps what it got.
  std::string told;
  bool done = false;
  ComPtr<IAccessible> kept = AccessibleOf(Slot(1));
  std::thread other([&, window = Grid()] {
    CoInitializeEx(nullptr, COINIT_MULTITHREADED);
    if (const ComPtr<IAccessible> far = AccessibleOf(window)) told = ReadOut(*far, 3);
    CoUninitialize();
    done = true;
  });
  Await([&] { return done; });
  other.join();
  EXPECT_EQ(told, "item selectable|" + name(3) + "||Open");
  page_.reset();
  EXPECT_EQ(ReadOut(*kept), "gone");
  EXPECT_TRUE(PageAccessible::AnyLeft());
  kept = grid = {};
  EXPECT_FALSE(PageAccessible::AnyLeft());
}

TEST_F(ThumbnailPageTest, ScreenReadersHearOfEachSelection) {
  const HWINEVENTHOOK hook = SetWinEventHook(EVENT_OBJECT_REORDER, EVENT_OBJECT_VALUECHANGE, nullptr, Hear,
                                             GetCurrentProcessId(), 0, WINEVENT_OUTOFCONTEXT);
  ASSERT_TRUE(hook);
  using Heard = std::vector<std::pair<DWORD, HWND>>;
  const auto hears = [&](const std::function<void()>& action) {
    Pump();
    heard.clear();
    action();
    Pump();
    std::erase_if(heard, [](const auto& event) {
      return event.first != EVENT_OBJECT_REORDER && event.first != EVENT_OBJECT_FOCUS &&
             event.first != EVENT_OBJECT_SELECTION && event.first != EVENT_OBJECT_VALUECHANGE &&
             event.first != EVENT_OBJECT_DESCRIPTIONCHANGE;
    });
    return heard;
  };
  const auto select = [&](int selected) {
    for (int slot = 1; slot <= kSlotCount; ++slot) page_->SetSelected(slot, slot == selected);
  };
  select(1);
  EXPECT_EQ(hears([&] { select(2); }),
            (Heard{{EVENT_OBJECT_SELECTION, Slot(2)}, {EVENT_OBJECT_FOCUS, Slot(2)}}));
  EXPECT_EQ(hears([&] { select(2); }), Heard{});
  // The same slot of another page.
  EXPECT_EQ(hears([&] {
              user_.first = 4;
              select(2);
            }),
            (Heard{{EVENT_OBJECT_REORDER, Grid()},
                   {EVENT_OBJECT_VALUECHANGE, Grid()},
                   {EVENT_OBJECT_SELECTION, Slot(2)},
                   {EVENT_OBJECT_FOCUS, Slot(2)}}));
  EXPECT_EQ(hears([&] { SetFocus(other_); }), (Heard{{EVENT_OBJECT_FOCUS, other_}}));
  EXPECT_EQ(hears([&] { select(0); }), Heard{});
  EXPECT_EQ(hears([&] { select(2); }), (Heard{{EVENT_OBJECT_SELECTION, Slot(2)}}));
  EXPECT_EQ(hears([&] { SetFocus(Grid()); }),
            (Heard{{EVENT_OBJECT_FOCUS, Grid()}, {EVENT_OBJECT_FOCUS, Slot(2)}}));
  // A picture that turns out to be none.
  const PictureFile broken(L"thumbnail-broken.picture", 0);
  broken.Write(0, 2);
  EXPECT_EQ(hears([&] {
              page_->SetPicture(3, broken.Path(), kWholeSquare);
              Await([&] { return !user_.told.empty(); });
            }),
            (Heard{{EVENT_OBJECT_DESCRIPTIONCHANGE, Slot(3)}}));
  UnhookWinEvent(hook);
}

// --- How it ends ---

TEST_F(ThumbnailPageTest, MayEndInsideAnyOfItsEvents) {
  user_.tellsFocus = true;
  const struct {
    const char* event;
    std::function<void()> cause;
  } cases[] = {
      {"focus", [&] { SetFocus(Switch()); }},
      {"slot 1", [&] { SendMessageW(Slot(1), WM_LBUTTONDOWN, MK_LBUTTON, At(60, 60)); }},
      {"slot 2", [&] { SendMessageW(Slot(2), WM_LBUTTONDBLCLK, MK_LBUTTON, At(60, 60)); }},
      {"slot 3 right", [&] { SendMessageW(Slot(3), WM_RBUTTONDOWN, MK_RBUTTON, At(60, 165)); }},
      {"left", [&] { SendMessageW(Slot(1), WM_LBUTTONDOWN, MK_LBUTTON, At(60, 60)); }},
      {"background", [&] { SendMessageW(Grid(), WM_LBUTTONDOWN, MK_LBUTTON, At(1, 1)); }},
      {"key 46", [&] { SendMessageW(Grid(), WM_KEYDOWN, VK_DELETE, 0); }},
      {"changed 2", [&] { Scroll(SB_LINEDOWN); }},
      {"dragged 4", [&] { Scroll(SB_THUMBTRACK, 4); }},
      {"changed 2", [&] { SendMessageW(Grid(), WM_MOUSEWHEEL, MAKEWPARAM(0, -120), 0); }},
      {"background right", [&] { SendMessageW(page_->Window(), WM_RBUTTONDOWN, MK_RBUTTON, At(1, 1)); }},
      {"switch", [&] { SendMessageW(Switch(), BM_CLICK, 0, 0); }},
      {"switch", [&] { SendMessageW(Switch(), WM_KEYDOWN, VK_RETURN, 0); }},
      {"link", [&] { SendMessageW(Link(), BM_CLICK, 0, 0); }},
      {"entered", [&] { SendMessageW(Editor(), WM_KEYDOWN, VK_RETURN, 0); }},
      {"left", [&] { SendMessageW(Editor(), WM_KEYDOWN, VK_ESCAPE, 0); }},
      {"left", [&] { SetFocus(other_); }},
      {"drag",
       [&] {
         SendMessageW(Slot(1), WM_LBUTTONDOWN, MK_LBUTTON, At(40, 40));
         SendMessageW(Slot(1), WM_MOUSEMOVE, MK_LBUTTON, At(99, 99));
       }},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.event);
    if (!page_) Make();
    const HWND window = page_->Window();
    const std::weak_ptr<WindowsThumbnailPage> page = page_;
    if (std::string(each.event) == "left" || std::string(each.event) == "entered") page_->ShowEditor(1, u"a");
    user_.Take();
    user_.on = [&](const std::string& what) {
      if (what != each.event) return;
      user_.on = {};
      page_.reset();
      EXPECT_FALSE(page.expired()) << "gone in its own message";
    };
    each.cause();
    user_.on = {};
    EXPECT_EQ(page_, nullptr);
    EXPECT_TRUE(page.expired()) << "still there after it";
    EXPECT_TRUE(IsWindow(window)) << "the system's windows are not done with the message";
    EXPECT_FALSE(IsWindowVisible(window));
    Pump();
    EXPECT_FALSE(IsWindow(window));
  }
}

TEST_F(ThumbnailPageTest, ShowsTheSameInANewWindow) {
  page_->SetScrollValue(4);
  page_->ShowSlot(3, false);
  DestroyWindow(page_->Window());
  page_->SetCaption(1, u"other.gif");
  Place(page_->Window());
  EXPECT_EQ(NameOf(Slot(1)), L"other.gif");
  EXPECT_EQ(NameOf(Slot(2)), L"picture 2.gif");
  EXPECT_TRUE(IsWindowVisible(Slot(2)));
  EXPECT_FALSE(IsWindowVisible(Slot(3)));
  EXPECT_EQ(GetScrollPos(ScrollBar(), SB_CTL), 4);
  EXPECT_EQ(NameOf(Link()), L"Click here");
  // Its pictures were on their way when the window ended.
  Await([&] { return Seen(2) == RGB(200, 30, 90); });
}

// --- The scroll bar's hook ---

TEST_F(ThumbnailPageTest, TheHookTakesTheColourRequestAndNothingElse) {
  const HWND window = page_->Window();
  const auto request = [&](UINT message) {
    const HDC dc = GetDC(ScrollBar());
    const LRESULT result =
        SendMessageW(window, message, reinterpret_cast<WPARAM>(dc), reinterpret_cast<LPARAM>(ScrollBar()));
    ReleaseDC(ScrollBar(), dc);
    return result;
  };
  ASSERT_NE(request(WM_CTLCOLORSCROLLBAR), 0);
  const LRESULT statics = request(WM_CTLCOLORSTATIC);
  ScrollHookState state;
  {
    WindowsScrollHook hook(state);
    hook.Install(window);
    hook.Install(window);
    EXPECT_TRUE(state.hooked);
    EXPECT_NE(state.previous, 0U);
    EXPECT_EQ(request(WM_CTLCOLORSCROLLBAR), 0);
    EXPECT_EQ(request(WM_CTLCOLORSTATIC), statics);

    // The control goes on as before, texts that are not ANSI included.
    page_->SetCaption(1, u"\u65E5\u202E\u672C.gif");
    EXPECT_EQ(NameOf(Slot(1)), L"\u65E5\uFFFD\u672C.gif");

    // A second control takes the state over; both work on.
    WindowsThumbnailPage second(GetModuleHandleW(nullptr), user_);
    WindowsScrollHook secondHook(state);
    secondHook.Install(second.Window());
    EXPECT_EQ(state.window, reinterpret_cast<WindowHandle>(second.Window()));
    EXPECT_EQ(SendMessageW(second.Window(), WM_CTLCOLORSCROLLBAR, 0, 0), 0);
    EXPECT_EQ(request(WM_CTLCOLORSCROLLBAR), 0);
    Scroll(SB_LINEDOWN);
    EXPECT_EQ(user_.Take(), Told{"changed 2"});
  }
  // The procedure is still there, what it needs is not.
  EXPECT_NE(request(WM_CTLCOLORSCROLLBAR), 0);
  SendMessageW(window, WM_SETTEXT, 0, reinterpret_cast<LPARAM>(L"name"));
  page_.reset();
  EXPECT_FALSE(IsWindow(window));
}

BOOL CALLBACK FindTipText(HWND window, LPARAM text) {
  wchar_t found[INFOTIPSIZE] = {};
  TTTOOLINFOW tool = {};
  tool.cbSize = TTTOOLINFOW_V2_SIZE;
  tool.hwnd = GetDesktopWindow();
  tool.lpszText = found;
  SendMessageW(window, TTM_GETTEXTW, INFOTIPSIZE, reinterpret_cast<LPARAM>(&tool));
  if (*found != L'\0') *reinterpret_cast<std::wstring*>(text) = found;
  return TRUE;
}

TEST(TextTip, BreaksWhatIsWiderThanHalfOfTheScreen) {
  TextTip tip;
  const auto shown = [&](const std::wstring& text) {
    tip.Set(GetDesktopWindow(), {0, 0, 10, 10}, text);
    std::wstring broken;
    EnumThreadWindows(GetCurrentThreadId(), FindTipText, reinterpret_cast<LPARAM>(&broken));
    return broken;
  };
  const std::wstring blanks = L"a few words, which the system breaks itself";
  EXPECT_EQ(shown(blanks), blanks);
  for (const std::wstring& word : {std::wstring(700, L'w'), L"after a blank " + std::wstring(600, L'w')}) {
    const std::wstring broken = shown(word);
    std::size_t longest = 0;
    for (std::size_t from = 0; from < broken.size();) {
      const std::size_t end = std::min(broken.find(L"\r\n", from), broken.size());
      longest = std::max(longest, end - from);
      from = end + 2;
    }
    // A w is at least five pixels wide.
    EXPECT_LE(longest, static_cast<std::size_t>(GetSystemMetrics(SM_CXSCREEN)) / 10);
    EXPECT_GT(longest, 40U) << "and not at each letter";
  }
}

}  // namespace
}  // namespace tarnwick
