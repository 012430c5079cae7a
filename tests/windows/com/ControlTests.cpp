// The list control in a full container of our own, in the system's, and in none.
#include <gtest/gtest.h>

#include <fstream>
#include <iterator>

#include "ControlContainer.h"
#include "Host.h"
#include "platform/windows/CommonControls.h"

namespace tarnwick::test {
namespace {

using demo::ControlContainer;
using demo::PropertyBag;

constexpr DISPID kDropModeId = 34;

std::string Contents(const std::wstring& path) {
  std::ifstream file(std::string(path.begin(), path.end()), std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

// A form with the control on it, and what the control told.
struct Form {
  HWND frame = CreateWindowExW(WS_EX_CONTROLPARENT, L"STATIC", L"form", WS_OVERLAPPEDWINDOW, 0, 0, 400, 300,
                               nullptr, nullptr, nullptr, nullptr);
  ComPtr<ControlContainer> container = ComPtr<ControlContainer>::Adopt(new ControlContainer(frame));
  ComPtr<_ctrlListImage> list;
  std::vector<std::wstring> events;
  // Runs inside each FileManagerEvent.
  std::function<void(int code)> onEvent;

  explicit Form(ControlContainer::WayIn wayIn = ControlContainer::WayIn::kSteps,
                IPropertyBag* bag = nullptr) {
    container->onEvent = [this](DISPID event, std::vector<VARIANT>& arguments) {
      if (event != 1) return;
      const int code = V_I2(V_VARIANTREF(&arguments[0]));
      const BSTR text = *V_BSTRREF(&arguments[1]);
      if (code != 9999) events.push_back(std::to_wstring(code) + L" " + (text ? text : L""));
      if (onEvent) onEvent(code);
    };
    EXPECT_EQ(container->Create(CLSID_ctrlListImage, wayIn, bag), S_OK);
    EXPECT_EQ(container->Control()->QueryInterface(__uuidof(_ctrlListImage), list.ReceiveVoid()), S_OK);
  }
  ~Form() {
    list = {};
    // The container's was the last reference, and it was never called in a way that it must not be.
    EXPECT_EQ(container->Close(), 0U);
    for (const std::string& violation : container->violations) ADD_FAILURE() << violation;
    container = {};
    DestroyWindow(frame);
  }

  void LogOn(const std::wstring& serverName) {
    const Server& server = TheServer();
    ComPtr<_CFileUpload> client;
    ASSERT_EQ(list->get_mobjFileupload(client.Receive()), S_OK);
    VARIANT_BOOL done = VARIANT_FALSE;
    client->ConnectToServer(Bstr(serverName), &done);
    client->LogonAs(Bstr(server.product), Bstr(server.user), Bstr(server.password), Bstr(L""), &done);
    ASSERT_TRUE(done);
  }
  bool Init(const wchar_t* filter) {
    Bstr text(filter);
    BSTR given = text;
    VARIANT_BOOL done = VARIANT_FALSE;
    return SUCCEEDED(list->Init(&given, &done)) && done;
  }
  void Show() {
    ShowWindow(frame, SW_SHOW);
    EXPECT_EQ(container->Do(OLEIVERB_UIACTIVATE), S_OK);
  }
  HWND Window() const {
    ComPtr<IOleWindow> window;
    HWND control = nullptr;
    if (SUCCEEDED(list->QueryInterface(IID_IOleWindow, window.ReceiveVoid()))) window->GetWindow(&control);
    return control;
  }
  HWND ListWindow() const { return FindWindowExW(Window(), nullptr, WC_LISTVIEWW, nullptr); }
  void Press(WPARAM key) {
    MSG message = {ListWindow(), WM_KEYDOWN, key, 0, 0, {0, 0}};
    if (!container->TranslateKey(message)) DispatchMessageW(&message);
  }
  std::wstring Select(const wchar_t* name) {
    Bstr text(name);
    BSTR given = text;
    VARIANT ignored = {};
    list->UploadedFileSetFocus(&given, &ignored);
    Bstr selected;
    list->SelectedFileName(selected.Receive());
    return selected.Text();
  }
};

TEST(ListControl, KeepsItsPropertiesWithTheForm) {
  const auto bag = ComPtr<PropertyBag>::Adopt(new PropertyBag);
  for (const auto wayIn : {ControlContainer::WayIn::kSteps, ControlContainer::WayIn::kQuickActivate}) {
    Form form(wayIn);
    ComPtr<IPersistPropertyBag> persist;
    ComPtr<IPersistStreamInit> stream;
    ASSERT_EQ(form.list->QueryInterface(IID_IPersistPropertyBag, persist.ReceiveVoid()), S_OK);
    ASSERT_EQ(form.list->QueryInterface(IID_IPersistStreamInit, stream.ReceiveVoid()), S_OK);
    EXPECT_EQ(stream->IsDirty(), S_FALSE);
    form.list->put_OLEDropMode(1);
    EXPECT_EQ(form.container->changed, std::vector<DISPID>{kDropModeId});
    EXPECT_EQ(stream->IsDirty(), S_OK);
    form.list->put_OLEDragMode(70000);
    EXPECT_EQ(persist->Save(bag.Get(), TRUE, FALSE), S_OK);
    EXPECT_EQ(stream->IsDirty(), S_FALSE);

    // The same through a stream, cut at every length.
    ComPtr<IStream> memory;
    CreateStreamOnHGlobal(nullptr, TRUE, memory.Receive());
    EXPECT_EQ(stream->Save(memory.Get(), TRUE), S_OK);
    ULARGE_INTEGER size = {};
    stream->GetSizeMax(&size);
    for (;; --size.QuadPart) {
      memory->SetSize(size);
      memory->Seek({}, STREAM_SEEK_SET, nullptr);
      form.list->put_OLEDropMode(9);
      const HRESULT loaded = stream->Load(memory.Get());
      SHORT mode = 0;
      form.list->get_OLEDropMode(&mode);
      EXPECT_EQ(SUCCEEDED(loaded) ? 1 : 9, mode) << size.QuadPart;
      if (size.QuadPart == 0) break;
    }
    persist = {};
    stream = {};
  }
  Form form(ControlContainer::WayIn::kSteps, bag.Get());
  SHORT dropMode = 0;
  LONG dragMode = 0;
  form.list->get_OLEDropMode(&dropMode);
  form.list->get_OLEDragMode(&dragMode);
  EXPECT_EQ(dropMode, 1);
  EXPECT_EQ(dragMode, 70000);
}

TEST(ListControl, WorksWithoutAWindow) {
  ComPtr<_ctrlListImage> list;
  ASSERT_EQ(CoCreateInstance(CLSID_ctrlListImage, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_ctrlListImage),
                             list.ReceiveVoid()),
            S_OK);
  Bstr all(L"*");
  BSTR filter = all;
  VARIANT_BOOL done = VARIANT_FALSE;
  list->putref_mobjFileupload(nullptr);
  EXPECT_EQ(static_cast<unsigned>(list->Init(&filter, &done)), 0x800A005BU);
  ComPtr<IErrorInfo> info;
  ASSERT_EQ(GetErrorInfo(0, info.Receive()), S_OK);
  Bstr description;
  info->GetDescription(description.Receive());
  EXPECT_EQ(description.Text(), L"The control has no service client");

  const ComPtr<_CFileUpload> client = LoggedOnClient();
  EXPECT_EQ(list->putref_mobjFileupload(client.Get()), S_OK);
  ComPtr<_CFileUpload> same;
  list->get_mobjFileupload(same.Receive());
  EXPECT_EQ(same.Get(), client.Get());
  EXPECT_EQ(list->Init(&filter, &done), S_OK);
  EXPECT_TRUE(done);
  VARIANT names = {};
  EXPECT_EQ(list->GetFileNames(&names), S_OK);
  ASSERT_EQ(V_VT(&names), VT_ARRAY | VT_VARIANT);
  LONG last = 0;
  SafeArrayGetUBound(V_ARRAY(&names), 1, &last);
  EXPECT_EQ(last, -1);
  VariantClear(&names);

  // Drawn for a form that is not running.
  ComPtr<IViewObject2> view;
  ASSERT_EQ(list->QueryInterface(IID_IViewObject2, view.ReceiveVoid()), S_OK);
  const HDC screen = GetDC(nullptr);
  const HDC dc = CreateCompatibleDC(screen);
  const HBITMAP bitmap = CreateCompatibleBitmap(screen, 320, 240);
  const HGDIOBJ old = SelectObject(dc, bitmap);
  const RECTL bounds = {0, 0, 320, 240};
  EXPECT_EQ(view->Draw(DVASPECT_CONTENT, -1, nullptr, nullptr, nullptr, dc, &bounds, nullptr, nullptr, 0),
            S_OK);
  int inked = 0;
  for (int x = 0; x < 320; x += 2)
    for (int y = 30; y < 240; y += 2) inked += GetPixel(dc, x, y) != GetSysColor(COLOR_WINDOW);
  EXPECT_GT(inked, 100);
  SelectObject(dc, old);
  DeleteObject(bitmap);
  DeleteDC(dc);
  ReleaseDC(nullptr, screen);
}

TEST(ListControl, ShowsTheAccountInItsContainer) {
  Form form;
  form.LogOn(TheServer().name);
  ASSERT_TRUE(form.Init(L"*"));
  form.Show();
  EXPECT_EQ(GetParent(form.Window()), form.frame);
  form.container->SetBounds({5, 6, 205, 106});
  RECT client = {};
  GetClientRect(form.ListWindow(), &client);
  EXPECT_LE(client.right, 200);
  EXPECT_GT(client.right, 150);
  const auto count = SendMessageW(form.ListWindow(), LVM_GETITEMCOUNT, 0, 0);
  EXPECT_GT(count, 2);

  EXPECT_EQ(form.Select(L"coffee.jpg"), L"coffee.jpg");
  form.events.clear();
  form.Press(VK_DOWN);
  form.Press(VK_RETURN);
  const std::wstring base = L"http://" + TheServer().name + L"/users/anna.berg@example-org/";
  EXPECT_EQ(form.events, (std::vector<std::wstring>{L"1015 " + base + L"deep-field.png", L"1024 "}));

  Bstr gif(L"GIF");
  form.list->ChangeFileFilter(gif);
  EXPECT_LT(SendMessageW(form.ListWindow(), LVM_GETITEMCOUNT, 0, 0), count);
  EXPECT_FALSE(form.Init(L"GIF") && SendMessageW(form.ListWindow(), LVM_GETITEMCOUNT, 0, 0) > 0);
  EXPECT_TRUE(form.container->IsUiActive());
}

TEST(ListControl, UploadsDownloadsRenamesAndDeletes) {
  Form form;
  form.LogOn(TheServer().name);
  ASSERT_TRUE(form.Init(L"*"));
  const std::string bytes(300'000, '\x7F');
  std::ofstream("control test.jpg", std::ios::binary) << bytes;
  VARIANT_BOOL done = VARIANT_FALSE;
  form.list->UploadImage(Bstr(L".\\control test.jpg"), &done);
  EXPECT_TRUE(done);
  DeleteFileW(L"control test.jpg");

  ASSERT_EQ(form.Select(L"control test.jpg"), L"control test.jpg");
  Bstr oldName(L"control test.jpg");
  Bstr newName(L" renamed test.jpg ");
  BSTR from = oldName;
  BSTR to = newName;
  form.events.clear();
  form.list->RenameFile(&from, &to, &done);
  EXPECT_EQ(form.events, std::vector<std::wstring>{L"1031 renamed test.jpg"});

  ASSERT_EQ(form.Select(L"renamed test.jpg"), L"renamed test.jpg");
  Bstr local;
  form.list->DownLoadFileFromServer(Bstr(L".\\"), local.Receive());
  EXPECT_EQ(local.Text(), L".\\renamed test.jpg");
  EXPECT_EQ(Contents(local.Text()), bytes);
  DeleteFileW(local);

  form.events.clear();
  form.list->DeleteFile();
  EXPECT_NE(std::find(form.events.begin(), form.events.end(), L"1001 "), form.events.end());
  EXPECT_NE(form.Select(L"renamed test.jpg"), L"renamed test.jpg");
}

TEST(ListControl, EndsADownloadThatFails) {
  // On that server each of these pictures has a fault of its own; the listing is whole.
  Form form;
  form.LogOn(TheServer().faulty);
  ASSERT_TRUE(form.Init(L"*"));
  const struct {
    const wchar_t* name;
    bool told;
    const char* left;                               // in the local file; null when it is gone
  } rows[] = {{L"rose.jpg", true, nullptr},         // closed without a word
              {L"coffee.jpg", true, nullptr},       // reset before the answer
              {L"horse.png", false, "\x89P"},       // 404, which nobody looks at
              {L"rocket.jpg", false, "\xFF\xD8"}};  // cut in the middle, in an orderly way
  for (const auto& row : rows) {
    ASSERT_EQ(form.Select(row.name), row.name);
    std::ofstream(std::string(row.name, row.name + wcslen(row.name)), std::ios::binary)
        << "of an earlier download";
    form.events.clear();
    Bstr local;
    form.list->DownLoadFileFromServer(Bstr(L"."), local.Receive());
    EXPECT_EQ(local.Text(), std::wstring(L".\\") + row.name);
    EXPECT_EQ(form.events.size(), row.told ? 1U : 0U) << row.name;
    EXPECT_TRUE(form.events.empty() || form.events[0] == L"5555 ") << row.name;
    EXPECT_EQ(GetFileAttributesW(row.name) == INVALID_FILE_ATTRIBUTES, row.left == nullptr) << row.name;
    if (row.left) {
      EXPECT_EQ(Contents(row.name).substr(0, 2), row.left) << row.name;
    }
    DeleteFileW(row.name);
  }
}

TEST(ListControl, MayBeReleasedInAnEventOfItsWait) {
  auto form = std::make_unique<Form>();
  form->LogOn(TheServer().name);
  ASSERT_TRUE(form->Init(L"*"));
  form->Show();
  ASSERT_EQ(form->Select(L"rose.jpg"), L"rose.jpg");
  _ctrlListImage* list = form->list.Get();
  list->AddRef();
  bool released = false;
  form->onEvent = [&](int) {
    if (!std::exchange(released, true)) list->Release();
  };
  Bstr local;
  form->list->DownLoadFileFromServer(Bstr(L"."), local.Receive());
  EXPECT_TRUE(released);
  DeleteFileW(L"rose.jpg");
}

TEST(ListControl, LivesInTheSystemsContainer) {
  const HMODULE atl = LoadLibraryW(L"atl.dll");
  const auto init =
      reinterpret_cast<BOOL(WINAPI*)()>(reinterpret_cast<void*>(GetProcAddress(atl, "AtlAxWinInit")));
  const auto get = reinterpret_cast<HRESULT(WINAPI*)(HWND, IUnknown**)>(
      reinterpret_cast<void*>(GetProcAddress(atl, "AtlAxGetControl")));
  ASSERT_TRUE(init && get && init());
  const HWND window = CreateWindowExW(0, L"AtlAxWin", L"Tarnwick.ctrlListImage", WS_POPUP | WS_VISIBLE, 0, 0,
                                      300, 200, nullptr, nullptr, nullptr, nullptr);
  ASSERT_NE(window, nullptr);
  ComPtr<IUnknown> control;
  ASSERT_EQ(get(window, control.Receive()), S_OK);
  ComPtr<_ctrlListImage> list;
  EXPECT_EQ(control->QueryInterface(__uuidof(_ctrlListImage), list.ReceiveVoid()), S_OK);
  ComPtr<IOleWindow> oleWindow;
  HWND inner = nullptr;
  EXPECT_EQ(control->QueryInterface(IID_IOleWindow, oleWindow.ReceiveVoid()), S_OK);
  EXPECT_EQ(oleWindow->GetWindow(&inner), S_OK);
  EXPECT_TRUE(IsChild(window, inner));
  list = {};
  oleWindow = {};
  control = {};
  DestroyWindow(window);
}

}  // namespace
}  // namespace tarnwick::test
