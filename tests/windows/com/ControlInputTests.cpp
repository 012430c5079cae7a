// What the user does with the list control: drags, drops and keys.
#include "Form.h"

namespace tarnwick::test {
namespace {

using Arguments = std::vector<VARIANT>;

constexpr LONG kText = CF_TEXT;
constexpr LONG kFiles = CF_HDROP;

// Calls of the data object that a drag event hands to the host.
class Dragged {
 public:
  explicit Dragged(const VARIANT& argument) : object_(*V_DISPATCHREF(&argument)) {}

  bool Has(LONG format) const { return Told(object_, L"GetFormat", {VariantOf(format)}) == L"-1"; }
  // Or why the data refuses to give it.
  std::wstring Text() const { return Told(object_, L"GetData", {VariantOf(kText)}); }
  void SetText(const wchar_t* text) const {
    const Bstr owned(text);
    EXPECT_EQ(Told(object_, L"SetData", {VariantOf(kText), VariantOf(owned)}), L"");
  }
  // Says that there will be a text, without giving it.
  void PromiseText() const {
    VARIANT missing = {};
    V_VT(&missing) = VT_ERROR;
    V_ERROR(&missing) = DISP_E_PARAMNOTFOUND;
    EXPECT_EQ(Told(object_, L"SetData", {VariantOf(kText), missing}), L"");
  }
  void Clear() const { EXPECT_EQ(Told(object_, L"Clear"), L""); }
  Lines Files() const {
    Lines files;
    const ComPtr<IDispatch> collection = Object(object_, L"Files");
    for (LONG i = 1; i <= std::stol(Told(collection.Get(), L"Count")); ++i)
      files.push_back(Told(collection.Get(), L"Item", {VariantOf(i)}));
    return files;
  }

 private:
  IDispatch* object_;
};

TEST(ListControl, TakesFilesThatAreDroppedOnIt) {
  Form form;
  form.container->SetBounds({15, 25, 315, 225});
  form.Show();
  const Lines files = {L"C:\\one.jpg", L"C:\\Bl\u00FCmchen.gif"};
  const ComPtr<IDataObject> data = FilesFromOutside(form.frame, files);
  auto* target = static_cast<IDropTarget*>(GetPropW(form.Window(), L"OleDropTargetInterface"));
  ASSERT_TRUE(data && target);
  POINT corner = {0, 0};
  ClientToScreen(form.ListWindow(), &corner);
  const POINTL at = {corner.x + 30, corner.y + 40};
  constexpr DWORD kKeys = MK_LBUTTON | MK_CONTROL;

  std::wstring told;
  bool empties = false;
  form.onOther = [&](DISPID event, Arguments& arguments) {
    const Dragged dragged(arguments[0]);
    told += std::to_wstring(event) +
            (event == DISPID_OLEDragOver ? std::to_wstring(*V_I2REF(&arguments[6])) : L"") + L" ";
    LONG& effect = *V_I4REF(&arguments[1]);
    if (event == DISPID_OLEDragOver && *V_I2REF(&arguments[6]) == 1) return;
    EXPECT_EQ(effect, DROPEFFECT_COPY);
    EXPECT_EQ(*V_I2REF(&arguments[2]), 1);
    EXPECT_EQ(*V_I2REF(&arguments[3]), 2);
    EXPECT_EQ(*V_R4REF(&arguments[4]), 30.0F);
    EXPECT_EQ(*V_R4REF(&arguments[5]), 40.0F);
    if (event == DISPID_OLEDragDrop && empties) {
      dragged.Clear();
      EXPECT_FALSE(dragged.Has(kFiles));
      EXPECT_TRUE(dragged.Files().empty());
      return;
    }
    EXPECT_EQ(dragged.Files(), files);
    EXPECT_TRUE(dragged.Has(kFiles));
    if (event == DISPID_OLEDragDrop) {
      // What was set while the drag was over the list.
      EXPECT_EQ(dragged.Text(), L"a note");
      return;
    }
    EXPECT_EQ(dragged.Has(kText), *V_I2REF(&arguments[6]) == 2);
    EXPECT_EQ(dragged.Text(), dragged.Has(kText) ? L"a note" : L"The data has no such format");
    dragged.SetText(L"a note");
    // The host decides what a drop here would do.
    if (*V_I2REF(&arguments[6]) == 2) effect = DROPEFFECT_NONE;
  };
  for (const bool leaves : {true, false, false}) {
    DWORD effect = DROPEFFECT_COPY | DROPEFFECT_MOVE | DROPEFFECT_LINK;
    EXPECT_EQ(target->DragEnter(data.Get(), kKeys, at, &effect), S_OK);
    EXPECT_EQ(effect, static_cast<DWORD>(DROPEFFECT_COPY));
    EXPECT_EQ(target->DragOver(kKeys, at, &effect), S_OK);
    EXPECT_EQ(effect, static_cast<DWORD>(DROPEFFECT_NONE));
    effect = DROPEFFECT_COPY;
    if (leaves)
      EXPECT_EQ(target->DragLeave(), S_OK);
    else
      EXPECT_EQ(target->Drop(data.Get(), kKeys, at, &effect), S_OK);
    EXPECT_EQ(told, leaves ? L"50 52 51 " : L"50 52 6 ");
    EXPECT_EQ(form.events,
              leaves || empties ? Lines() : (Lines{L"1023 " + files[0], L"1023 " + files[1], L"1023 "}));
    told.clear();
    form.events.clear();
    empties = !leaves;
  }
}

// The parameter is by reference, and the object may be kept and changed.
TEST(ListControl, SurvivesWhatAHostDoesWithDroppedData) {
  Form form;
  form.Show();
  const ComPtr<IDataObject> data = FilesFromOutside(form.frame, {L"C:\\one.jpg", L"C:\\two.jpg"});
  auto* target = static_cast<IDropTarget*>(GetPropW(form.Window(), L"OleDropTargetInterface"));
  ASSERT_TRUE(data && target);
  ComPtr<IDispatch> kept;
  form.onOther = [&](DISPID, Arguments& arguments) {
    IDispatch*& object = *V_DISPATCHREF(&arguments[0]);
    kept = ComPtr<IDispatch>(object);
    object->Release();
    object = nullptr;
  };
  form.onEvent = [&](int) { Call(kept.Get(), L"Clear", {}); };
  DWORD effect = DROPEFFECT_COPY;
  EXPECT_EQ(target->DragEnter(data.Get(), MK_LBUTTON, {50, 50}, &effect), S_OK);
  effect = DROPEFFECT_COPY;
  EXPECT_EQ(target->Drop(data.Get(), MK_LBUTTON, {50, 50}, &effect), S_OK);
  EXPECT_EQ(form.events, (Lines{L"1023 C:\\one.jpg", L"1023 C:\\two.jpg", L"1023 "}));
  kept->AddRef();
  EXPECT_EQ(kept->Release(), 1U) << "the control has let go of it";
}

// The next events of the mouse, as if a person made them.
void Mouse(DWORD what) {
  mouse_event(what, 0, 0, 0, 0);
}

TEST(ListControl, DragsItsOwnFile) {
  Form form;
  form.Open(L"gif");
  form.Show();
  RECT row = {LVIR_BOUNDS, 0, 0, 0};
  SendMessageW(form.ListWindow(), LVM_GETITEMRECT, 1, reinterpret_cast<LPARAM>(&row));
  POINT item = {row.left + 40, (row.top + row.bottom) / 2};
  ClientToScreen(form.ListWindow(), &item);
  const std::wstring name = L"wizard.gif";
  const std::wstring address = Address(name);
  // The copy that other tests may have left.
  std::wstring copy = CopyOf(name);
  DeleteFileW(copy.c_str());

  // A button says that nothing is selected when the list has done with it, and says it once.
  const POINT beside = {item.x, item.y + 4 * (row.bottom - row.top)};
  const auto press = [&](const POINT& at, bool left) {
    form.events.clear();
    SetCursorPos(at.x, at.y);
    Mouse(left ? MOUSEEVENTF_LEFTDOWN : MOUSEEVENTF_RIGHTDOWN);
    Mouse(left ? MOUSEEVENTF_LEFTUP : MOUSEEVENTF_RIGHTUP);
    form.Pump();
    return form.events;
  };
  const Lines none = {L"1015 "};
  const Lines click = {L"1022 ", L"1015 " + address, L"1024 "};
  const Lines clickBeside = {L"1015 ", L"1022 ", L"1024 "};
  EXPECT_EQ(press(item, true), click);
  EXPECT_EQ(press(beside, true), clickBeside);
  EXPECT_EQ(press(item, false), Lines());
  EXPECT_EQ(press(beside, false), none);
  const struct {
    bool hasCopy;
    bool byCall;  // of OLEDrag, in place of the mouse
    bool promises;
    LONG allowed;
    const wchar_t* told;
    Lines events;
  } rows[] = {
      {false, false, false, DROPEFFECT_COPY, L"start over drop complete:1 ", {L"1021 "}},
      {true, false, false, DROPEFFECT_NONE, L"start over complete:0 ", {}},
      // What the host promised is asked for when it is wanted.
      {true, true, true, DROPEFFECT_COPY, L"start set over drop complete:1 ", {L"1021 "}},
  };
  for (const auto& line : rows) {
    SCOPED_TRACE(line.told);
    if (line.hasCopy) {
      form.Download(name.c_str());
      DeleteFileW(name.c_str());
    }
    form.events.clear();
    std::wstring told;
    bool isOver = false;
    form.onOther = [&](DISPID event, Arguments& arguments) {
      switch (event) {
        case DISPID_OLEStartDrag: {
          told += L"start ";
          const Dragged dragged(arguments[0]);
          EXPECT_EQ(dragged.Text(), address);
          const Lines files = dragged.Files();
          EXPECT_EQ(files.size(), line.hasCopy ? 1U : 0U);
          EXPECT_EQ(dragged.Has(kFiles), line.hasCopy);
          if (!files.empty()) copy = files[0];
          EXPECT_EQ(*V_I4REF(&arguments[1]), DROPEFFECT_COPY);
          if (line.promises) dragged.PromiseText();
          *V_I4REF(&arguments[1]) = line.allowed;
          break;
        }
        case DISPID_OLEGiveFeedback:
          EXPECT_EQ(*V_I4REF(&arguments[0]), line.allowed);
          EXPECT_EQ(*V_BOOLREF(&arguments[1]), VARIANT_TRUE);
          break;
        case DISPID_OLESetData:
          told += L"set ";
          EXPECT_EQ(*V_I2REF(&arguments[1]), kText);
          Dragged(arguments[0]).SetText(L"kept");
          break;
        case DISPID_OLEDragOver:
          if (!line.promises) {
            EXPECT_EQ(Dragged(arguments[0]).Text(), address);
          }
          if (std::exchange(isOver, true)) break;
          told += L"over ";
          Mouse(MOUSEEVENTF_LEFTUP);
          break;
        case DISPID_OLEDragDrop:
          if (line.promises) {
            EXPECT_EQ(Dragged(arguments[0]).Text(), L"kept");
          }
          told += L"drop ";
          break;
        case DISPID_OLECompleteDrag:
          told += L"complete:" + std::to_wstring(*V_I4REF(&arguments[0])) + L" ";
          break;
        default:
          break;
      }
    };
    SetCursorPos(item.x, item.y);
    Mouse(MOUSEEVENTF_LEFTDOWN);
    if (line.byCall) form.list->OLEDrag();
    for (int i = 0; i < 100 && told.empty(); ++i) {
      SetCursorPos(item.x + i % 30, item.y);
      Sleep(10);
      form.Pump();
    }
    EXPECT_EQ(told, line.told);
    EXPECT_EQ(form.events, line.events);
    Mouse(MOUSEEVENTF_LEFTUP);
    form.Pump();

    // The list is as before: a click is a click, so far away that it is no double click.
    EXPECT_EQ(press({item.x + 25, item.y}, true), click);
  }
  EXPECT_EQ(Contents(copy), Contents(L"demo\\pictures\\wizard.gif"));
  DeleteFileW(copy.c_str());
}

constexpr UINT_PTR kMenus = 1;

// Where the form is asked for a menu, on the screen.
LRESULT CALLBACK MenuProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam, UINT_PTR, DWORD_PTR data) {
  if (message == WM_CONTEXTMENU)
    *reinterpret_cast<POINT*>(data) = {static_cast<SHORT>(LOWORD(lParam)),
                                       static_cast<SHORT>(HIWORD(lParam))};
  return DefSubclassProc(window, message, wParam, lParam);
}

// On the screen; `column` 0 is the whole row.
RECT PlaceOf(const Form& form, int row, int column) {
  RECT place = {LVIR_BOUNDS, column, 0, 0};
  SendMessageW(form.ListWindow(), LVM_GETSUBITEMRECT, static_cast<WPARAM>(row),
               reinterpret_cast<LPARAM>(&place));
  MapWindowPoints(form.ListWindow(), nullptr, reinterpret_cast<POINT*>(&place), 2);
  return place;
}

void Point(Form& form, LONG x, LONG y) {
  SetCursorPos(x, y);
  form.Pump();
}

TEST(ListControl, SelectsByRowsAndKeys) {
  Form form;
  form.Open(L"jpg");
  form.Show();
  POINT menu = {};
  SetWindowSubclass(form.frame, MenuProc, kMenus, reinterpret_cast<DWORD_PTR>(&menu));
  const auto selectedCount = [&] { return SendMessageW(form.ListWindow(), LVM_GETSELECTEDCOUNT, 0, 0); };

  // A press on the size is one on the file.
  const RECT size = PlaceOf(form, 2, 2);
  const RECT row = PlaceOf(form, 2, 0);
  form.events.clear();
  Point(form, size.left + 20, (size.top + size.bottom) / 2);
  Mouse(MOUSEEVENTF_RIGHTDOWN);
  Mouse(MOUSEEVENTF_RIGHTUP);
  form.Pump();
  EXPECT_EQ(form.Selected(), kJpegs[2]);
  EXPECT_TRUE(PtInRect(&size, menu)) << menu.x << " " << menu.y;
  const Lines clicked = std::exchange(form.events, {});
  menu = {-1, -1};
  Hold(VK_SHIFT, true);
  form.Handle({form.ListWindow(), WM_SYSKEYDOWN, VK_F10, 0, 0, {0, 0}});
  Hold(VK_SHIFT, false);
  EXPECT_EQ(std::exchange(form.events, {}), clicked);
  EXPECT_TRUE(PtInRect(&row, menu)) << menu.x << " " << menu.y;
  // What the menu key sends.
  menu = {-1, -1};
  ListView_SetItemState(form.ListWindow(), -1, 0, LVIS_SELECTED);
  SendMessageW(form.ListWindow(), WM_CONTEXTMENU, reinterpret_cast<WPARAM>(form.ListWindow()), -1);
  EXPECT_EQ(std::exchange(form.events, {}), Lines{L"1015 "});
  EXPECT_EQ(WindowFromPoint(menu), form.ListWindow());

  for (const bool several : {false, true}) {
    form.Select(kJpegs[2].c_str());
    VARIANT_BOOL multiple = several ? VARIANT_TRUE : VARIANT_FALSE;
    VARIANT ignored = {};
    form.list->SetMultiSelectProperty(&multiple, &ignored);
    form.events.clear();
    Hold(VK_CONTROL, true);
    form.Press('A');
    Hold(VK_CONTROL, false);
    EXPECT_EQ(selectedCount(), several ? 4 : 1);
    EXPECT_EQ(form.events, several ? Lines{L"1015 " + Address(kJpegs[0])} : Lines());
  }
  RemoveWindowSubclass(form.frame, MenuProc, kMenus);

  // What is to be painted anew is not seen without its contents meanwhile.
  const HDC screen = GetDC(form.ListWindow());
  constexpr COLORREF kSeen = RGB(200, 10, 20);
  SetPixel(screen, 5, 100, kSeen);
  SendMessageW(form.ListWindow(), WM_ERASEBKGND, reinterpret_cast<WPARAM>(screen), 0);
  EXPECT_EQ(GetPixel(screen, 5, 100), kSeen);
  ReleaseDC(form.ListWindow(), screen);
}

// The tip that is seen; null when there is none within the time that one takes.
HWND TipSeen(Form& form) {
  for (int i = 0; i < 28; ++i) {
    Sleep(25);
    form.Pump();
    for (HWND tip = nullptr; (tip = FindWindowExW(nullptr, tip, TOOLTIPS_CLASSW, nullptr)) != nullptr;)
      if (IsWindowVisible(tip)) return tip;
  }
  return nullptr;
}

TEST(ListControl, ShowsInATipWhatDoesNotFitUntilItsColumnIsMadeWider) {
  Form form;
  // No scroll bar comes.
  form.container->SetBounds({0, 0, 390, 290});
  form.Open(L"jpg");
  form.Show();
  const auto rest = [&](int row, int column) {
    const RECT cell = PlaceOf(form, row, column);
    Point(form, cell.left + 30, (cell.top + cell.bottom) / 2);
    const HWND seen = TipSeen(form);
    wchar_t text[300] = {};
    TTTOOLINFOW tool = {};
    tool.cbSize = sizeof tool;
    tool.hwnd = form.ListWindow();
    tool.lpszText = text;
    if (seen) SendMessageW(seen, TTM_GETTEXTW, 300, reinterpret_cast<LPARAM>(&tool));
    return std::wstring(text);
  };
  EXPECT_EQ(rest(3, 0), L"");
  EXPECT_EQ(rest(0, 1), Address(kJpegs[0]));
  // It goes with what it tells of.
  const HWND tip = TipSeen(form);
  const auto widest = static_cast<int>(SendMessageW(tip, TTM_GETMAXTIPWIDTH, 0, 0));
  EXPECT_TRUE(widest > 0 && widest < GetSystemMetrics(SM_CXSCREEN)) << widest;
  form.list->ChangeFileFilter(Bstr(L"jpg"));
  EXPECT_FALSE(IsWindowVisible(tip));
  EXPECT_EQ(rest(0, 0), kJpegs[0]);

  const auto width = [&] { return SendMessageW(form.ListWindow(), LVM_GETCOLUMNWIDTH, 0, 0); };
  EXPECT_EQ(width(), 96);
  RECT heading = {};
  GetWindowRect(ListView_GetHeader(form.ListWindow()), &heading);
  const LONG y = (heading.top + heading.bottom) / 2;
  Point(form, heading.left + 96, y);
  Mouse(MOUSEEVENTF_LEFTDOWN);
  form.Pump();
  Point(form, heading.left + 150, y);
  Mouse(MOUSEEVENTF_LEFTUP);
  form.Pump();
  const LRESULT dragged = width();
  EXPECT_NEAR(static_cast<int>(dragged), 150, 2);
  EXPECT_EQ(rest(0, 0), L"");
  ASSERT_TRUE(form.Init(L"jpg"));
  EXPECT_EQ(width(), dragged);
}

TEST(ListControl, ShowsWhatIsSelectedOnAnyColourWithoutTheFocus) {
  Form form;
  form.Open(L"jpg");
  form.Show();
  form.Select(kJpegs[1].c_str());
  const HWND list = form.ListWindow();
  const COLORREF face = GetSysColor(COLOR_BTNFACE);
  const COLORREF seen = GetSysColor(COLOR_HIGHLIGHT);
  const struct {
    OLE_COLOR color;
    COLORREF shown;
  } rows[] = {{0x80000000 | COLOR_BTNFACE, seen}, {face - 0x050505, seen}, {RGB(32, 34, 40), face}};
  for (const auto& row : rows) {
    form.container->ambient.backColor = row.color;
    form.container->AmbientChanged(DISPID_AMBIENT_BACKCOLOR);
    SetFocus(form.frame);
    const auto colorOf = [&](int item) {
      RECT name = {};
      ListView_GetItemRect(list, item, &name, LVIR_LABEL);
      COLORREF color = 0;
      Drawn(320, 240, [&](HDC dc) {
        SendMessageW(list, WM_ERASEBKGND, reinterpret_cast<WPARAM>(dc), 0);
        SendMessageW(list, WM_PRINTCLIENT, reinterpret_cast<WPARAM>(dc), PRF_CLIENT);
        color = GetPixel(dc, name.right - 2, name.top + 1);
      });
      return color;
    };
    EXPECT_EQ(colorOf(1), row.shown) << row.color;
    EXPECT_EQ(colorOf(2), ListView_GetBkColor(list)) << row.color;
  }
}

TEST(ListControl, SaysWhyItHasNoItems) {
  Form form;
  // Too narrow for two lines, and too low for their middle to be the list's.
  form.container->SetBounds({0, 0, 60, 100});
  form.Open(L"GIF");
  form.Show();
  const auto label = [&] {
    const HWND window = FindWindowExW(form.Window(), nullptr, L"STATIC", nullptr);
    if (!IsWindowVisible(window)) return std::wstring();
    std::wstring text = TextOf(window);
    RECT room = {};
    RECT head = {};
    GetWindowRect(window, &room);
    GetWindowRect(ListView_GetHeader(form.ListWindow()), &head);
    EXPECT_TRUE(room.top >= head.bottom || !IsWindowVisible(form.ListWindow()));
    RECT needed = {0, 0, room.right - room.left, 0};
    Drawn(1, 1, [&](HDC dc) {
      SelectObject(dc, reinterpret_cast<HFONT>(SendMessageW(window, WM_GETFONT, 0, 0)));
      DrawTextW(dc, text.c_str(), -1, &needed, DT_CALCRECT | DT_WORDBREAK);
    });
    EXPECT_GE(room.bottom - room.top, needed.bottom);
    return text;
  };
  EXPECT_EQ(label(), L"No images of this kind.");
  EXPECT_EQ(GetFocus(), form.ListWindow());
  form.list->ChangeFileFilter(Bstr(L"gif"));
  EXPECT_EQ(label(), L"");

  ComPtr<_CFileUpload> client;
  ASSERT_EQ(form.list->get_mobjFileupload(client.Receive()), S_OK);
  const Bstr product(TheServer().product);
  const Bstr user(L"empty@example.org");
  Bstr given;
  client->AddUser(product, user, VariantOf(Bstr(L"")), given.Receive());
  ASSERT_TRUE(form.Init(L"*"));
  EXPECT_EQ(label(), L"There are no images in the Brimvault account.");
  EXPECT_EQ(GetFocus(), form.Window());
  EXPECT_EQ(TextOf(GetFocus()), label());
  Bstr key;
  LONG status = 0;
  client->GetKeyForUser(product, user, key.Receive());
  client->DeleteUser(product, user, VariantOf(key), VARIANT_TRUE, &status);
  EXPECT_EQ(status, 1001);
}

TEST(ListControl, SharesTheKeyboardWithItsForm) {
  Form form;
  form.Open(L"*");
  form.Show();

  struct Row {
    WPARAM key;
    BYTE held;
    bool offered;  // to the form
    DWORD modifiers;
  };
  const Row rows[] = {{VK_DOWN, 0, false, 0},  {VK_NEXT, 0, false, 0},     {VK_RETURN, 0, false, 0},
                      {VK_ESCAPE, 0, true, 0}, {'U', VK_CONTROL, true, 2}, {VK_INSERT, VK_SHIFT, true, 1}};
  for (const Row& row : rows) {
    SCOPED_TRACE(row.key);
    int offers = 0;
    form.container->onKey = [&](const MSG& message, DWORD modifiers) {
      EXPECT_EQ(message.wParam, row.key);
      EXPECT_EQ(modifiers, row.modifiers);
      ++offers;
      return true;
    };
    if (row.held) Hold(row.held, true);
    EXPECT_TRUE(form.Press(row.key));
    if (row.held) Hold(row.held, false);
    EXPECT_EQ(offers, row.offered ? 1 : 0);
  }
  // What the form does not take either is a key of the list.
  form.container->onKey = [](const MSG&, DWORD) { return false; };
  const auto active = As<IOleInPlaceActiveObject>(*form.list);
  // A form that knows nothing of controls would press its default button.
  MSG enter = {form.ListWindow(), WM_KEYDOWN, VK_RETURN, 0, 0, {0, 0}};
  form.events.clear();
  IsDialogMessageW(form.frame, &enter);
  EXPECT_EQ(form.events, Lines{L"1024 "});
  MSG outside = {GetDesktopWindow(), WM_KEYDOWN, VK_F5, 0, 0, {0, 0}};
  EXPECT_EQ(active->TranslateAccelerator(&outside), S_FALSE);
}

}  // namespace
}  // namespace tarnwick::test
