// The list of an account: showing it, listing it, and selecting in it, beside bare owner-data lists and a
// plain loop over WinINet, all in windows on the display.
#include "Bench.h"

#include <wininet.h>

#include <cstdio>

#include "platform/windows/AnsiText.h"
#include "platform/windows/CommonControls.h"
#include "service/CFileUpload.h"
#include "service/modEnctyption.h"

namespace tarnwick::bench {
namespace {

constexpr SIZE kSize = {600, 400};

void Paint(HWND window) {
  RedrawWindow(window, nullptr, nullptr, RDW_UPDATENOW | RDW_ALLCHILDREN);
}

// --- The peers ---

LRESULT CALLBACK FrameProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  const auto* const header = reinterpret_cast<const NMHDR*>(lParam);
  if (message == WM_NOTIFY && header->code == static_cast<UINT>(LVN_GETDISPINFOW)) {
    auto& info = *reinterpret_cast<NMLVDISPINFOW*>(lParam);
    if (info.item.mask & LVIF_TEXT)
      std::swprintf(info.item.pszText, static_cast<std::size_t>(info.item.cchTextMax), L"picture-%06d.jpg",
                    info.item.iItem);
    return 0;
  }
  return DefWindowProcW(window, message, wParam, lParam);
}

HWND MakeFrame() {
  const INITCOMMONCONTROLSEX classes = {sizeof classes, ICC_LISTVIEW_CLASSES};
  InitCommonControlsEx(&classes);
  WNDCLASSW frameClass = {};
  frameClass.lpfnWndProc = FrameProc;
  frameClass.lpszClassName = L"ListBenchFrame";
  RegisterClassW(&frameClass);
  return CreateWindowExW(0, frameClass.lpszClassName, L"", WS_POPUP | WS_VISIBLE, kSize.cx, 0, kSize.cx,
                         kSize.cy, nullptr, nullptr, nullptr, nullptr);
}

// Makes a bare list, fills and paints it.
HWND MakeBareList(HWND frame, int items) {
  const HWND view = CreateWindowExW(0, WC_LISTVIEWW, L"", WS_CHILD | WS_VISIBLE | LVS_REPORT | LVS_OWNERDATA,
                                    0, 0, kSize.cx, kSize.cy, frame, nullptr, nullptr, nullptr);
  wchar_t title[] = L"Column";
  for (int i = 0; i < 3; ++i) {
    LVCOLUMNW column = {};
    column.mask = LVCF_TEXT | LVCF_WIDTH;
    column.cx = 96;
    column.pszText = title;
    ListView_InsertColumn(view, i, &column);
  }
  ListView_SetItemCountEx(view, items, 0);
  Paint(view);
  return view;
}

// Posts the request for the account's listing and reads what comes.
void FetchListing(const Account& account) {
  const auto escaped = [](const std::wstring& text) {
    const Text value = CFileUpload::EnCodeString(TextFromWide(text));
    return std::string(value.begin(), value.end());
  };
  const Text action = CFileUpload::EnCodeString(EncryptParameter(u"ListFiles"));
  std::string body = "ClientAction=" + std::string(action.begin(), action.end()) +
                     "&Username=" + escaped(account.user) + "&ProductID=" + escaped(account.product);
  const std::size_t colon = account.server.find(L':');
  const HINTERNET session = InternetOpenW(L"bench", INTERNET_OPEN_TYPE_DIRECT, nullptr, nullptr, 0);
  const HINTERNET connection =
      InternetConnectW(session, account.server.substr(0, colon).c_str(),
                       static_cast<INTERNET_PORT>(_wtoi(account.server.c_str() + colon + 1)), nullptr,
                       nullptr, INTERNET_SERVICE_HTTP, 0, 0);
  const HINTERNET request =
      HttpOpenRequestW(connection, L"POST", L"/bv/bin/BVServicePage.asp?Request=ListFilesRequest&Flag=1",
                       nullptr, nullptr, nullptr, INTERNET_FLAG_RELOAD, 0);
  HttpSendRequestW(request, L"Content-Type: application/x-www-form-urlencoded\r\n", DWORD(-1), body.data(),
                   static_cast<DWORD>(body.size()));
  std::vector<char> answer;
  std::vector<char> block(64 * 1024);
  DWORD count = 0;
  while (InternetReadFile(request, block.data(), static_cast<DWORD>(block.size()), &count) && count > 0)
    answer.insert(answer.end(), block.begin(), block.begin() + count);
  if (answer.size() < 50'000) Stop("the listing loop got no listing");
  InternetCloseHandle(request);
  InternetCloseHandle(connection);
  InternetCloseHandle(session);
}

// --- The library ---

// A collection of a host's own: what is added is kept.
class HostItems final : public IDispatch {
 public:
  std::vector<ComPtr<IUnknown>> items;

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override {
    if (interfaceId != IID_IUnknown && interfaceId != IID_IDispatch) return E_NOINTERFACE;
    *object = this;
    AddRef();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return ++references_; }
  STDMETHODIMP_(ULONG) Release() override { return --references_; }
  STDMETHODIMP GetTypeInfoCount(UINT*) override { return E_NOTIMPL; }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID* id) override {
    *id = 1;
    return S_OK;
  }
  STDMETHODIMP Invoke(DISPID, REFIID, LCID, WORD, DISPPARAMS* arguments, VARIANT*, EXCEPINFO*,
                      UINT*) override {
    // Arguments come in reverse order.
    items.emplace_back(arguments->rgvarg[arguments->cArgs - 1].punkVal);
    return S_OK;
  }

 private:
  // Lives on the stack.
  ULONG references_ = 1;
};

BOOL CALLBACK FindList(HWND child, LPARAM found) {
  wchar_t name[32] = {};
  GetClassNameW(child, name, 32);
  if (wcscmp(name, WC_LISTVIEWW) == 0) *reinterpret_cast<HWND*>(found) = child;
  return TRUE;
}

HWND ListIn(const Form& form) {
  HWND list = nullptr;
  EnumChildWindows(form.Window(), FindList, reinterpret_cast<LPARAM>(&list));
  return list;
}

// Seconds from the beginning of an `Init` to the painted list, after a new log-on.
double Init(const Form& form, const Account& account, int files) {
  const ComPtr<_ctrlListImage> list = form.Control<_ctrlListImage>();
  ComPtr<_CFileUpload> client;
  list->get_mobjFileupload(client.Receive());
  // As in a new control: the records of the run before are freed first.
  list->ChangeFileFilter(Bstr(L"gif"));
  LogOn(*client, account);
  Bstr all(L"*");
  VARIANT_BOOL done = VARIANT_FALSE;
  const double seconds = Seconds([&] {
    list->Init(all.Reference(), &done);
    Paint(form.Window());
  });
  if (ListView_GetItemCount(ListIn(form)) != files) Stop("the list does not show all files");
  return seconds;
}

// Seconds of a listing by a late-bound call, as scripts make it, into a host's collection or, without one,
// into one that the library makes.
double ListLate(_CFileUpload& client, const Account& account, HostItems* host) {
  LogOn(client, account);
  IDispatch* collection = host;
  VARIANT value = {};
  value.vt = VT_BYREF | VT_DISPATCH;
  value.ppdispVal = &collection;
  DISPPARAMS arguments = {&value, nullptr, 1, 0};
  Variant done;
  const double seconds = Seconds([&] {
    wchar_t text[] = L"ListFilesForUser";
    wchar_t* name = text;
    DISPID id = 0;
    client.GetIDsOfNames(IID_NULL, &name, 1, LOCALE_USER_DEFAULT, &id);
    client.Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &arguments, &done.Get(), nullptr,
                  nullptr);
  });
  if (!host && collection) collection->Release();
  if (done.Get().vt != VT_BOOL || !done.Get().boolVal) Stop("the late-bound listing failed");
  return seconds;
}

// Seconds of a listing into a collection of the library's own by an early-bound call.
double ListEarly(_CFileUpload& client, const Account& account) {
  LogOn(client, account);
  ComPtr<IDispatch> collection;
  VARIANT_BOOL done = VARIANT_FALSE;
  const double seconds = Seconds([&] { client.ListFilesForUser(collection.Receive(), &done); });
  if (!done || !collection) Stop("the early-bound listing failed");
  return seconds;
}

constexpr int kSelections = 20;
constexpr UINT kState = LVIS_SELECTED | LVIS_FOCUSED;

// Seconds of selecting files one after another; each is painted, if there is a window.
double Select(_ctrlListImage& list, HWND window) {
  std::vector<std::wstring> names;
  for (int i = 0; i < kSelections; ++i) {
    wchar_t name[32] = {};
    std::swprintf(name, 32, L"picture-%06d.jpg", 1 + i * 7 % 15);
    names.emplace_back(name);
  }
  const double seconds = Seconds([&] {
    for (const std::wstring& name : names) {
      Bstr text(name);
      VARIANT ignored = {};
      list.UploadedFileSetFocus(text.Reference(), &ignored);
      if (window) Paint(window);
    }
  });
  // What was left to be painted is no part of the next run.
  Pump();
  return seconds;
}

double SelectBare(HWND view) {
  return Seconds([view] {
    for (int i = 0; i < kSelections; ++i) {
      ListView_SetItemState(view, -1, 0, kState);
      ListView_SetItemState(view, i * 7 % 15, kState, kState);
      ListView_EnsureVisible(view, i * 7 % 15, FALSE);
      Paint(view);
    }
  });
}

// Seconds of going down a list of 500 in its window by the key; each line is painted, and scrolled to.
double GoDown(HWND view, HWND window) {
  constexpr int kFirst = 100;
  ListView_SetItemState(view, -1, 0, kState);
  ListView_SetItemState(view, kFirst, kState, kState);
  ListView_EnsureVisible(view, 0, FALSE);
  ListView_EnsureVisible(view, kFirst, FALSE);
  Paint(window);
  const double seconds = Seconds([&] {
    for (int i = 0; i < kSelections; ++i) {
      SendMessageW(view, WM_KEYDOWN, VK_DOWN, 0);
      Paint(window);
    }
  });
  Pump();
  if (ListView_GetNextItem(view, -1, LVNI_FOCUSED) != kFirst + kSelections) Stop("the key was not taken");
  return seconds;
}

}  // namespace

void ListBench(const Account& shown, const Account& all, const std::array<Account, 3>& replays) {
  const Account& few = replays[0];
  const Account& many = replays[1];
  const Account& allReplayed = replays[2];

  // Before a control of this thread has a listing, which the client would not fetch again.
  ComPtr<_CFileUpload> client;
  if (FAILED(CoCreateInstance(CLSID_CFileUpload, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_CFileUpload),
                              client.ReceiveVoid())))
    Stop("the library is not registered");
  constexpr int kFew = 2'000;
  constexpr int kMany = 20'000;
  std::vector<Side> listings = {{"library", [&] { return ListLate(*client, many, nullptr); }, kMany},
                                {"library",
                                 [&] {
                                   HostItems items;
                                   return ListLate(*client, many, &items);
                                 },
                                 kMany},
                                {"itself, of 2,000", [&] { return ListLate(*client, few, nullptr); }, kFew},
                                {"itself, early bound", [&] { return ListEarly(*client, many); }, kMany}};
  Measure(listings);
  const std::string what = "late-bound ListFilesForUser, a file of 20,000";
  Row(what, listings[0], listings[2], "<=1.2", "the connection, which fewer files share");
  Row(what, listings[0], listings[3], "<=2.0", "one look-up of the member, whatever the number of files");
  Row(what + ", host's collection", listings[1], listings[3], "<=2.0", "a late-bound Add for each file");

  const HWND frame = MakeFrame();
  const Form form(CLSID_ctrlListImage, kSize);
  const ComPtr<_ctrlListImage> list = form.Control<_ctrlListImage>();
  const auto init = [&form](const Account& account, int files) {
    return [&form, &account, files] { return Init(form, account, files); };
  };
  const auto fetch = [](const Account& account) {
    return [&account] { return Seconds([&account] { FetchListing(account); }); };
  };
  std::vector<Side> inits = {{"library", init(all, 100'000), 100'000},
                             {"bare WinINet fetch", fetch(all), 100'000},
                             {"library", init(allReplayed, 100'000), 100'000},
                             {"bare WinINet fetch", fetch(allReplayed), 100'000},
                             {"itself, of 20,000", init(many, 20'000), 20'000}};
  Measure(inits);
  Row("Init, a file of 100,000", inits[0], inits[1], "<=1.5",
      "the server's work is most of both; then records, their keys, the painting");
  Row("Init, a file of 100,000, replayed answer", inits[2], inits[3], "",
      "a record and its key for each file, and the painting");
  Row("Init, a file of 100,000, replayed answer", inits[2], inits[4], "<=1.2",
      "the painting, whatever the number of files");

  Init(form, all, 100'000);
  const Bstr filter(L"*");
  std::vector<Side> filters = {{"library",
                                [&] {
                                  return Seconds([&] {
                                    list->ChangeFileFilter(filter);
                                    Paint(form.Window());
                                  });
                                }},
                               {"bare owner-data list", [&] {
                                  HWND view = nullptr;
                                  const double seconds =
                                      Seconds([&] { view = MakeBareList(frame, 100'000); });
                                  DestroyWindow(view);
                                  return seconds;
                                }}};
  Measure(filters);
  Row("ChangeFileFilter over 100,000", filters[0], filters[1], "<=3.0",
      "an item for each file, which counts one more reference to its record");

  Init(form, shown, 500);
  const HWND view = MakeBareList(frame, 500);
  std::vector<Side> selections = {
      {"library", [&] { return Select(*list, nullptr); }, kSelections},
      {"library", [&] { return Select(*list, form.Window()); }, kSelections},
      {"bare owner-data list", [&] { return SelectBare(view); }, kSelections},
      {"library", [&] { return GoDown(ListIn(form), form.Window()); }, kSelections},
      {"bare owner-data list", [&] { return GoDown(view, view); }, kSelections}};
  Measure(selections);
  Row("selecting a file in a list of 500", selections[0], "s", "<=0.5e-3",
      "the list view's messages for focus, state and scrolling");
  Row("selecting a file in a list of 500, painted", selections[1], selections[2], "",
      "the search for the name, icons in the rows");
  Row("a line further down by the key, painted", selections[3], selections[4], "",
      "icons, and rows that are drawn in memory first");
  DestroyWindow(frame);
}

}  // namespace tarnwick::bench
