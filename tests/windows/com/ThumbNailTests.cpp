// The thumbnail control on a form: pages of real pictures from a server, and what the user does with them.
#include <oleacc.h>

#include <algorithm>
#include <functional>
#include <map>
#include <thread>

#include "Form.h"
#include "controls/windows/ThumbnailLayout.h"

namespace tarnwick::test {
namespace {

// Of the pictures, in the user's folder.
Lines Copies() {
  Lines files;
  WIN32_FIND_DATAW found = {};
  const HANDLE search = FindFirstFileW(CopyOf(L"*").c_str(), &found);
  if (search == INVALID_HANDLE_VALUE) return files;
  do
    if (!(found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY)) files.emplace_back(found.cFileName);
  while (FindNextFileW(search, &found));
  FindClose(search);
  std::sort(files.begin(), files.end());
  return files;
}
void RemoveCopies() {
  for (const std::wstring& file : Copies()) DeleteFileW(CopyOf(file).c_str());
}

// The account as the server has it. Asked for by a thread of its own: a client of this one would log the
// control off.
Lines Account() {
  Lines names;
  std::thread([&] {
    CoInitialize(nullptr);
    {
      const ComPtr<_CFileUpload> client = LoggedOnClient();
      ComPtr<IDispatch> files;
      VARIANT_BOOL done = VARIANT_FALSE;
      client->ListFilesForUser(files.Receive(), &done);
      for (LONG i = 1; i <= std::stol(Told(files.Get(), L"Count")); ++i)
        names.push_back(Told(Object(files.Get(), L"Item", {VariantOf(i)}).Get(), L"FileName"));
    }
    CoUninitialize();
  }).join();
  return names;
}
constexpr int kSide = 131;  // of a slot's picture, at 96 dots per inch

// The square of a slot's picture on the screen, for which it waits; empty when none comes.
Pixels Picture(ThumbForm& form, int slot) {
  for (int i = 0; i < 500; ++i) {
    form.Pump();
    UpdateWindow(form.Slot(slot));
    Pixels pixels = Drawn(kSide, kSide, [&](HDC dc) {
      const RECT square = layout::Pixels(layout::kPicture, 96);
      const HDC window = GetDC(form.Slot(slot));
      BitBlt(dc, 0, 0, kSide, kSide, window, square.left, square.top, SRCCOPY);
      ReleaseDC(form.Slot(slot), window);
    });
    if (std::count(pixels.begin(), pixels.end(), pixels[0]) != kSide * kSide) return pixels;
    Sleep(10);
  }
  return {};
}

void Scroll(const ThumbForm& form, int code, int position = 0) {
  SendMessageW(form.Window(), WM_VSCROLL, MAKEWPARAM(code, position),
               reinterpret_cast<LPARAM>(form.ScrollBar()));
}

TEST(ThumbNailControl, ShowsPagesOfPicturesFromTheServer) {
  RemoveCopies();
  ThumbForm form;
  form.LogOn(TheServer().name);
  const Lines account = Account();
  ASSERT_GT(account.size(), 4U);
  form.Show();
  ASSERT_TRUE(form.Init(L"*"));
  // Busy once for the four pictures; their bytes arrive meanwhile.
  EXPECT_EQ(form.events, (Lines{L"1234 1", L"1234 -1"}));
  EXPECT_GE(form.progress.size(), 4U);

  std::map<std::wstring, Pixels> seen;
  const int last = static_cast<int>(account.size() - (account.size() % 2 ? 3 : 4));
  const auto expectPage = [&](int first) {
    SCOPED_TRACE(first);
    Lines expected(account.begin() + first,
                   account.begin() + std::min<std::ptrdiff_t>(first + 4, std::ssize(account)));
    EXPECT_EQ(GetScrollPos(form.ScrollBar(), SB_CTL), first);
    EXPECT_EQ(form.Captions(), expected);
    EXPECT_EQ(form.Selected(), expected[0]);
    for (int slot = 1; slot <= static_cast<int>(expected.size()); ++slot) {
      const std::wstring& name = expected[static_cast<std::size_t>(slot - 1)];
      const Pixels picture = Picture(form, slot);
      EXPECT_FALSE(picture.empty()) << slot;
      // A picture looks the same in every slot, and like no other one.
      for (const auto& [other, look] : seen) EXPECT_EQ(look == picture, other == name) << slot;
      seen[name] = picture;
      EXPECT_TRUE(Contents(CopyOf(name)) == Contents(L"demo\\pictures\\" + name)) << slot;
    }
  };
  expectPage(0);
  form.events.clear();
  for (int first = 2; first <= last; first += 2) {
    Scroll(form, first == 2 ? SB_LINEDOWN : SB_PAGEDOWN);
    expectPage(first);
    EXPECT_EQ(form.events, (Lines{L"1234 1", L"1234 -1"}));
    form.events.clear();
  }
  // All are here now.
  for (int first = last - 2; first >= 0; first -= 2) {
    Scroll(form, first == last - 2 ? SB_LINEUP : SB_PAGEUP);
    expectPage(first);
  }
  Scroll(form, SB_BOTTOM);
  expectPage(last);
  Scroll(form, SB_THUMBTRACK, 2);
  Scroll(form, SB_THUMBPOSITION, 2);
  expectPage(2);
  form.control->ChangeFileFilter(Bstr(L"jpg"));
  EXPECT_EQ(form.Captions(), kJpegs);
  EXPECT_FALSE(IsWindowEnabled(form.ScrollBar()));
  // Screen readers are told where the page stands.
  const auto place = [&] {
    ComPtr<IAccessible> grid;
    Bstr value;
    EXPECT_EQ(AccessibleObjectFromWindow(form.Grid(), static_cast<DWORD>(OBJID_CLIENT), __uuidof(IAccessible),
                                         grid.ReceiveVoid()),
              S_OK);
    EXPECT_EQ(grid->get_accValue(VariantOf(LONG{CHILDID_SELF}), value.Receive()), S_OK);
    return value.Text();
  };
  EXPECT_EQ(place(), L"1 to 4 of 4");
  form.control->ChangeFileFilter(Bstr(L"none"));
  EXPECT_EQ(place(), L"No images of this kind.");
  EXPECT_EQ(form.events, Lines());
}

// What is done as soon as a slot waits for a picture, one after the other.
struct Step {
  int slot;
  std::wstring awaited;
  std::function<void()> action;
};
std::function<void()> onTick;
void CALLBACK Tick(HWND, UINT, UINT_PTR, DWORD) {
  onTick();
}

TEST(ThumbNailControl, IsLeftWhileItsServerIsSilent) {
  RemoveCopies();
  ThumbForm form;
  form.LogOn(TheServer().faulty);
  form.Show();
  const auto post = [](HWND window, UINT message, WPARAM wParam, int x = 0, int y = 0) {
    PostMessageW(window, message, wParam, MAKELPARAM(x, y));
  };
  const auto pressBar = [&](int y) {
    post(form.ScrollBar(), WM_LBUTTONDOWN, MK_LBUTTON, 5, y);
    post(form.ScrollBar(), WM_LBUTTONUP, 0, 5, y);
  };
  const std::wstring stalled = L"Downloading stall.jpg";
  std::wstring chosen;
  std::vector<Step> steps = {
      {2, stalled,
       [&] {
         EXPECT_TRUE(IsWindowEnabled(form.ScrollBar()));
         SendMessageW(form.Slot(1), WM_LBUTTONDOWN, MK_LBUTTON, MAKELPARAM(5, 5));
         SendMessageW(form.Slot(1), WM_LBUTTONUP, 0, MAKELPARAM(5, 5));
         chosen = Told(form.control.Get(), L"GetSelectedFilesHttpPath");
         pressBar(3);
       }},
      {4, stalled, [&] { pressBar(330); }},
      {2, stalled, [&] { post(form.Grid(), WM_MOUSEWHEEL, MAKEWPARAM(0, 2 * WHEEL_DELTA)); }},
  };
  auto next = steps.begin();
  onTick = [&] {
    if (next == steps.end() || TextOf(form.Slot(next->slot)) != next->awaited) return;
    const auto action = next++->action;
    action();
  };
  EXPECT_TRUE(form.Init(L"jpg"));
  form.events.clear();
  SetTimer(form.frame, 1, 50, Tick);
  const ULONGLONG begin = GetTickCount64();
  Scroll(form, SB_BOTTOM);
  EXPECT_LT(GetTickCount64() - begin, 20'000U);
  KillTimer(form.frame, 1);
  EXPECT_EQ(next - steps.begin(), std::ssize(steps));
  EXPECT_EQ(form.Captions(),
            (Lines{L"reset-body.jpg", L"reset-head.jpg", L"reset-request.jpg", L"rocket.jpg"}));
  // 5555 is of the pictures whose connection was reset.
  form.events.erase(std::remove(form.events.begin(), form.events.end(), L"5555 "), form.events.end());
  EXPECT_EQ(form.events, (Lines{L"1234 1", L"1022 ", L"1015 " + chosen, L"1234 -1"}));
  EXPECT_TRUE(chosen.ends_with(L"/rose.jpg"));
  RemoveCopies();
}

// The page is filled in a message, or in a late-bound call; in both nothing but the library itself holds the
// control when its host let go of it.
TEST(ThumbNailControl, MayEndInAnEventOfAPageThatIsFilled) {
  for (const bool byUser : {false, true})
    for (const int code : {1234, 9999})
      for (const bool closes : {false, true}) {
        SCOPED_TRACE(testing::Message() << byUser << " " << code << " " << closes);
        ThumbForm form;
        form.Show();
        form.Open(L"*");
        RemoveCopies();
        form.events.clear();
        form.onEvent = [&](int itsCode) {
          if (itsCode != code) return;
          form.control = {};
          if (closes) form.container->Close();
        };
        const HWND window = form.Window();
        if (byUser) {
          Scroll(form, SB_LINEDOWN);
        } else {
          const Bstr filter(L"*");
          Call(form.control.Get(), L"ChangeFileFilter", {VariantOf(filter)});
        }
        EXPECT_FALSE(form.control);
        form.Pump();
        EXPECT_EQ(IsWindow(window), closes ? FALSE : TRUE);
        EXPECT_EQ(form.events, closes ? Lines{L"1234 1"} : (Lines{L"1234 1", L"1234 -1"}));
        EXPECT_EQ(Copies().size(), closes ? 0U : 4U);
      }
}

TEST(ThumbNailControl, LooksTheSameOnAFormThatIsNotRunning) {
  ThumbForm form;
  form.Open(L"jpg");
  const auto view = As<IViewObject2>(*form.control);
  const RECT frame = layout::Pixels(layout::kFrames[1], 96);
  const RECT square = layout::Pixels(layout::kPicture, 96);
  const Pixels drawn = Drawn(kSide, kSide, [&](HDC dc) {
    const LONG left = -frame.left - square.left;
    const LONG top = -frame.top - square.top;
    const RECTL bounds = {left, top, left + ThumbForm::kWidth, top + ThumbForm::kHeight};
    EXPECT_EQ(view->Draw(DVASPECT_CONTENT, -1, nullptr, nullptr, nullptr, dc, &bounds, nullptr, nullptr, 0),
              S_OK);
  });
  form.Show();
  const Pixels shown = Picture(form, 2);
  EXPECT_FALSE(shown.empty());
  EXPECT_TRUE(drawn == shown);
}

TEST(ThumbNailControl, HasItsOwnEventsAndMembers) {
  ThumbForm form;
  form.Show();
  form.Open(L"jpg");
  form.events.clear();
  SendMessageW(form.Slot(3), WM_RBUTTONDOWN, MK_RBUTTON, MAKELPARAM(20, 150));
  form.Press(VK_RETURN);
  SendMessageW(FindWindowExW(form.Window(), nullptr, L"BUTTON", L"List view"), BM_CLICK, 0, 0);
  const std::wstring third = Address(kJpegs[2]);
  EXPECT_EQ(form.events, (Lines{L"1022 ", L"1015 " + third, L"1016 " + third, L"1022 ", L"1015 " + third,
                                L"1024 " + third, L"5554 5554"}));
  SHORT slot = 0;
  form.control->get_iImgNo(&slot);
  EXPECT_EQ(slot, 3);
  EXPECT_EQ(form.Select(L"coffee.jpg"), L"coffee.jpg");
  VARIANT nothing = VariantOf(LONG{1});
  SetFocus(form.frame);
  EXPECT_EQ(form.control->PictureSetFocus(&nothing), S_OK);
  EXPECT_EQ(V_VT(&nothing), VT_EMPTY);
  EXPECT_EQ(GetFocus(), form.Grid());
  const Bstr caption(L"Tom & Jerry");
  BSTR given = caption;
  EXPECT_EQ(form.control->SetLabelText(&given, &nothing), S_OK);
  EXPECT_EQ(TextOf(form.Slot(2)), L"Tom && Jerry");
  std::wstring told;
  form.onOther = [&](DISPID event, std::vector<VARIANT>&) {
    if (event == DISPID_OLEStartDrag) keybd_event(VK_ESCAPE, 0, 0, 0);
    if (event == DISPID_OLEStartDrag || event == DISPID_OLECompleteDrag) told += std::to_wstring(event);
  };
  EXPECT_EQ(form.control->OLEDrag(), S_OK);
  keybd_event(VK_ESCAPE, 0, KEYEVENTF_KEYUP, 0);
  form.Pump();
  EXPECT_EQ(told, L"27");
}

}  // namespace
}  // namespace tarnwick::test
