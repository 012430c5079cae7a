// The thumbnail control on a form: pages of real pictures from a server, and what the user does with them.
#include <algorithm>
#include <functional>
#include <map>
#include <thread>

#include "Form.h"
#include "controls/windows/ThumbnailLayout.h"

namespace tarnwick::test {
namespace {

// Where the control keeps its copies.
std::wstring CopyOf(const std::wstring& file) {
  wchar_t temporary[MAX_PATH] = {};
  GetTempPathW(MAX_PATH, temporary);
  return temporary + (L"bv\\" + FolderName()) + L"\\" + file;
}
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
      const VARIANT count = files ? Call(files.Get(), L"Count", {}) : VARIANT{};
      for (LONG i = 1; i <= V_I4(&count); ++i) {
        VARIANT item = Call(files.Get(), L"Item", {VariantOf(i)});
        VARIANT name = Call(V_DISPATCH(&item), L"FileName", {});
        names.emplace_back(V_BSTR(&name));
        VariantClear(&name);
        VariantClear(&item);
      }
    }
    CoUninitialize();
  }).join();
  return names;
}
bool Holds(const Lines& lines, const std::wstring& line) {
  return std::find(lines.begin(), lines.end(), line) != lines.end();
}

constexpr int kSide = 131;  // of a slot's picture, at 96 dots per inch

// The square of a slot's picture on the screen; empty when it shows nothing.
Pixels Picture(const ThumbForm& form, int slot) {
  UpdateWindow(form.Slot(slot));
  Pixels pixels = Drawn(kSide, kSide, [&](HDC dc) {
    const RECT square = layout::Pixels(layout::kPicture, 96);
    const HDC window = GetDC(form.Slot(slot));
    BitBlt(dc, 0, 0, kSide, kSide, window, square.left, square.top, SRCCOPY);
    ReleaseDC(form.Slot(slot), window);
  });
  if (std::count(pixels.begin(), pixels.end(), pixels[0]) == kSide * kSide) pixels.clear();
  return pixels;
}

void Scroll(const ThumbForm& form, int code, int position = 0) {
  SendMessageW(form.Window(), WM_VSCROLL, MAKEWPARAM(code, position),
               reinterpret_cast<LPARAM>(form.ScrollBar()));
}
int ScrollPosition(const ThumbForm& form) {
  return GetScrollPos(form.ScrollBar(), SB_CTL);
}
bool Upload(const ThumbForm& form, const std::wstring& path) {
  VARIANT_BOOL done = VARIANT_FALSE;
  form.control->UploadImage(Bstr(path), &done);
  return done != VARIANT_FALSE;
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
    EXPECT_EQ(ScrollPosition(form), first);
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
  EXPECT_EQ(form.events, Lines());
}

TEST(ThumbNailControl, TellsWhatTheUserDoes) {
  ThumbForm form;
  form.LogOn(TheServer().name);
  form.Show();
  ASSERT_TRUE(form.Init(L"jpg"));
  const auto click = [&](int slot, UINT down, UINT up) {
    const LPARAM at = MAKELPARAM(20, 150);
    SendMessageW(form.Slot(slot), down, down == WM_LBUTTONDOWN ? MK_LBUTTON : MK_RBUTTON, at);
    SendMessageW(form.Slot(slot), up, 0, at);
  };
  const auto key = [&](WPARAM code) { form.Press(code); };
  const std::wstring second = L"1015 " + Address(kJpegs[1]);
  const std::wstring third = L"1015 " + Address(kJpegs[2]);
  const struct {
    const char* what;
    std::function<void()> action;
    Lines events;
  } rows[] = {
      {"left", [&] { click(2, WM_LBUTTONDOWN, WM_LBUTTONUP); }, {L"1022 ", second}},
      {"right",
       [&] { click(3, WM_RBUTTONDOWN, WM_RBUTTONUP); },
       {L"1022 ", third, L"1016 " + Address(kJpegs[2])}},
      {"background",
       [&] { SendMessageW(form.Window(), WM_RBUTTONDOWN, MK_RBUTTON, MAKELPARAM(200, 400)); },
       {L"1016 " + Address(kJpegs[2])}},
      {"Delete", [&] { key(VK_DELETE); }, {L"1022 ", third, L"2222 " + Address(kJpegs[2])}},
      {"Enter", [&] { key(VK_RETURN); }, {L"1022 ", third, L"1024 " + Address(kJpegs[2])}},
      {"F5", [&] { key(VK_F5); }, {L"7777 "}},
      {"F2 while it is not allowed", [&] { key(VK_F2); }, {}},
      {"arrow", [&] { key(VK_UP); }, {}},
      {"switch",
       [&] {
         const HWND button = FindWindowExW(form.Window(), nullptr, L"BUTTON", L"List view");
         SendMessageW(button, BM_CLICK, 0, 0);
       },
       {L"5554 5554"}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.what);
    form.events.clear();
    row.action();
    EXPECT_EQ(form.events, row.events);
    EXPECT_TRUE(form.container->IsUiActive());
  }
  SHORT slot = 0;
  form.control->get_iImgNo(&slot);
  EXPECT_EQ(slot, 3);
  EXPECT_EQ(form.Selected(), kJpegs[2]);
  EXPECT_FALSE(IsWindowVisible(form.Editor()));
}

TEST(ThumbNailControl, UploadsRenamesInPlaceAndDeletes) {
  ThumbForm form;
  form.LogOn(TheServer().name);
  form.Show();
  ASSERT_TRUE(form.Init(L"jpg"));
  const Pixels rose = Picture(form, 4);
  const std::wstring first = L"thumb test.jpg";
  CopyFileW(L"demo\\pictures\\rose.jpg", first.c_str(), FALSE);
  form.events.clear();
  EXPECT_TRUE(Upload(form, L".\\" + first));
  DeleteFileW(first.c_str());
  EXPECT_EQ(form.events, Lines{L"1015 " + Address(first)});
  EXPECT_TRUE(Contents(CopyOf(first)) == Contents(L"demo\\pictures\\rose.jpg"));
  EXPECT_EQ(form.Captions(), (Lines{kJpegs[2], kJpegs[3], first}));

  const std::wstring renamed = L"R\u00F6se & co.jpg";
  VARIANT_BOOL allowed = VARIANT_TRUE;
  VARIANT answer = {};
  form.control->EnableRename(&allowed, &answer);
  const struct {
    const wchar_t* typed;
    WPARAM key;  // that ends it
    Lines events;
    std::wstring name;  // afterwards
    std::wstring caption;
  } rows[] = {
      {L"other.jpg", VK_ESCAPE, {}, first, first},
      {L"a#b.jpg", VK_RETURN, {L"1034 "}, first, first},
      {L"ROSE.jpg", VK_RETURN, {L"1032 "}, first, first},
      {L"con.jpg", VK_RETURN, {L"1035 "}, first, first},
      {L"R\u00F6se & co.gif", VK_RETURN, {L"1031 "}, renamed, L"R\u00F6se && co.jpg"},
      {L"thumb test.jpg", VK_RETURN, {L"1031 "}, first, first},
  };
  int offers = 0;
  form.container->onKey = [&](const MSG& message, DWORD) {
    offers += message.message == WM_KEYDOWN && message.wParam != VK_F2 ? 1 : 0;
    return false;
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.typed << " " << row.key);
    form.events.clear();
    form.Press(VK_F2);
    EXPECT_EQ(form.events, Lines{L"8888 "});
    ASSERT_TRUE(IsWindowVisible(form.Editor()));
    // The form may activate the control once more.
    EXPECT_EQ(form.container->Do(OLEIVERB_UIACTIVATE), S_OK);
    EXPECT_EQ(GetFocus(), form.Editor());
    const std::wstring before = form.Selected();
    EXPECT_EQ(TextOf(form.Editor()), before);
    form.events.clear();
    // These keys are the editor's, not the form's. All of the name is selected.
    form.Press(VK_DELETE, form.Editor());
    form.Press(VK_F5, form.Editor());
    EXPECT_EQ(TextOf(form.Editor()), L"");
    for (const wchar_t* letter = row.typed; *letter; ++letter)
      SendMessageW(form.Editor(), WM_CHAR, static_cast<WPARAM>(*letter), 0);
    form.Press(row.key, form.Editor());
    EXPECT_FALSE(IsWindowVisible(form.Editor()));
    EXPECT_EQ(GetFocus(), form.Grid());
    EXPECT_EQ(form.events, row.events);
    EXPECT_EQ(form.Selected(), row.name);
    EXPECT_EQ(TextOf(form.Slot(3)), row.caption);
    EXPECT_TRUE(Picture(form, 3) == rose);
    if (row.name == before) continue;
    EXPECT_FALSE(Contents(CopyOf(before)));
    EXPECT_TRUE(Contents(CopyOf(row.name)) == Contents(L"demo\\pictures\\rose.jpg"));
    const Lines account = Account();
    EXPECT_TRUE(Holds(account, row.name) && !Holds(account, before));
  }
  EXPECT_EQ(offers, 0);

  form.events.clear();
  form.control->DeleteFile();
  const Lines gone = {L"1001 ", L"1022 ", L"1015 " + Address(kJpegs[0])};
  EXPECT_EQ(form.events, gone);
  EXPECT_EQ(form.Captions(), kJpegs);
  EXPECT_FALSE(Contents(CopyOf(first)));
  EXPECT_FALSE(Holds(Account(), first));
}

TEST(ThumbNailControl, ShowsTheOthersWhenAServerLosesOne) {
  RemoveCopies();
  ThumbForm form;
  form.LogOn(TheServer().faulty);
  form.Show();
  ASSERT_TRUE(form.Init(L"jpg"));
  const struct {
    int first;  // of the page
    Lines captions;
    std::vector<bool> shown;
    int told;  // with 5555
  } rows[] = {
      {0, {kJpegs[0], kJpegs[1], L"cut.jpg", L"drip-2.jpg"}, {true, true, false, false}, 0},
      // Cut and dripping once more: what there is of them has a picture's head and is kept.
      {2, {L"cut.jpg", L"drip-2.jpg", L"empty.jpg", L"length-5.jpg"}, {false, false, false, true}, 0},
      {6,
       {L"length-999999.jpg", L"refuse.jpg", L"reset-body.jpg", L"reset-head.jpg"},
       {true, false, false, false},
       3},
      {8,
       {L"reset-body.jpg", L"reset-head.jpg", L"reset-request.jpg", L"rocket.jpg"},
       {false, false, false, true},
       3},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.first);
    if (row.first > 0) {
      form.events.clear();
      Scroll(form, SB_THUMBPOSITION, row.first);
    }
    EXPECT_EQ(form.Captions(), row.captions);
    for (int slot = 1; slot <= 4; ++slot)
      EXPECT_EQ(!Picture(form, slot).empty(), row.shown[static_cast<std::size_t>(slot - 1)]) << slot;
    EXPECT_EQ(std::count(form.events.begin(), form.events.end(), L"5555 "), row.told);
    EXPECT_EQ(form.events.front(), L"1234 1");
    EXPECT_EQ(form.events.back(), L"1234 -1");
    EXPECT_EQ(form.events.size(), static_cast<std::size_t>(row.told) + 2);
  }
}

// The page is filled in a message, or in a late-bound call; in both nothing but the library itself holds the
// control when its host let go of it.
TEST(ThumbNailControl, MayEndInAnEventOfAPageThatIsFilled) {
  for (const bool byUser : {false, true})
    for (const int code : {1234, 9999})
      for (const bool closes : {false, true}) {
        SCOPED_TRACE(testing::Message() << byUser << " " << code << " " << closes);
        ThumbForm form;
        form.LogOn(TheServer().name);
        form.Show();
        ASSERT_TRUE(form.Init(L"*"));
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

TEST(ThumbNailControl, WorksWithoutAWindow) {
  {
    ComPtr<_ctrlThumbNailView> control;
    ASSERT_EQ(CoCreateInstance(CLSID_ctrlThumbNailView, nullptr, CLSCTX_INPROC_SERVER,
                               __uuidof(_ctrlThumbNailView), control.ReceiveVoid()),
              S_OK);
    const Bstr all(L"*");
    BSTR filter = all;
    VARIANT_BOOL done = VARIANT_TRUE;
    control->putref_mobjFileupload(nullptr);
    EXPECT_EQ(control->Init(&filter, &done), S_OK);
    EXPECT_FALSE(done);
    control->putref_mobjFileupload(LoggedOnClient().Get());
    EXPECT_EQ(control->Init(&filter, &done), S_OK);
    EXPECT_TRUE(done);
    const Bstr name(L"coffee.jpg");
    BSTR wanted = name;
    VARIANT ignored = {};
    EXPECT_EQ(control->UploadedFileSetFocus(&wanted, &ignored), S_OK);
    VARIANT address = {};
    EXPECT_EQ(control->GetSelectedFilesHttpPath(&address), S_OK);
    ASSERT_EQ(V_VT(&address), VT_BSTR);
    EXPECT_EQ(V_BSTR(&address), Address(L"coffee.jpg"));
    VariantClear(&address);
  }
  // On a form that is not running the control looks as it does on one that is.
  ThumbForm form;
  form.LogOn(TheServer().name);
  ASSERT_TRUE(form.Init(L"jpg"));
  ComPtr<IViewObject2> view;
  ASSERT_EQ(form.control->QueryInterface(IID_IViewObject2, view.ReceiveVoid()), S_OK);
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

TEST(ThumbNailControl, HasItsOwnMembers) {
  ThumbForm form;
  form.LogOn(TheServer().name);
  form.Show();
  ASSERT_TRUE(form.Init(L"jpg"));
  EXPECT_EQ(form.Select(L"coffee.jpg"), L"coffee.jpg");
  VARIANT nothing = VariantOf(LONG{1});
  SetFocus(form.frame);
  EXPECT_EQ(form.control->PictureSetFocus(&nothing), S_OK);
  EXPECT_EQ(V_VT(&nothing), VT_EMPTY);
  EXPECT_EQ(GetFocus(), form.Grid());
  VARIANT_BOOL edits = VARIANT_TRUE;
  EXPECT_EQ(form.control->EditFileLabel(&edits), S_OK);
  EXPECT_FALSE(edits);
  const Bstr caption(L"Tom & Jerry");
  BSTR given = caption;
  EXPECT_EQ(form.control->SetLabelText(&given, &nothing), S_OK);
  EXPECT_EQ(TextOf(form.Slot(2)), L"Tom && Jerry");
  VARIANT key = VariantOf(LONG{1});
  ComPtr<IPictureDisp> overlay;
  EXPECT_EQ(form.control->Overlay(&key, &key, overlay.Receive()), S_OK);
  EXPECT_FALSE(overlay);
  form.events.clear();
  const Bstr name(L"coffee.jpg");
  given = name;
  EXPECT_EQ(form.control->ValidateFileName(&given, &nothing), S_OK);
  EXPECT_EQ(form.events, Lines{L"1031 "});
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
