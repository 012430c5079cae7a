// A form with both controls, in the container that Windows brings along (atl.dll). It works where the library
// is not registered: Tarnwick.ocx and Tarnwick.manifest stand beside the program, whose own manifest names
// them.
//
//   form SERVER USER PASSWORD PRODUCT [once]
//
// With "once" it says what the controls told and which picture is selected, and ends.
#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <string>
#include <vector>

#include <ole2.h>

#include <Tarnwick.h>

namespace {

// Receives the events of a control; the numbers stand in the reference.
class EventSink final : public IDispatch {
 public:
  STDMETHODIMP QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == IID_IDispatch || id == __uuidof(__ctrlListImage) ||
                       id == __uuidof(__ctrlThumbNailView);
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  // It lives as long as the program.
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP GetTypeInfoCount(UINT* count) override {
    *count = 0;
    return S_OK;
  }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID*) override { return E_NOTIMPL; }
  STDMETHODIMP Invoke(DISPID event, REFIID, LCID, WORD, DISPPARAMS* arguments, VARIANT*, EXCEPINFO*,
                      UINT*) override {
    if (event != DISPID_FileManagerEvent || arguments->cArgs != 2) return S_OK;
    // Arguments come last first: the description, then the code.
    const BSTR description = *V_BSTRREF(&arguments->rgvarg[0]);
    std::wprintf(L"event %d %ls\n", V_I2(V_VARIANTREF(&arguments->rgvarg[1])),
                 description ? description : L"");
    return S_OK;
  }
};

// A text for the time of a call.
class Text {
 public:
  explicit Text(const wchar_t* text = nullptr) : text_(SysAllocString(text)) {}
  ~Text() { SysFreeString(text_); }
  Text(const Text&) = delete;
  Text& operator=(const Text&) = delete;
  operator BSTR() const { return text_; }
  BSTR* operator&() { return &text_; }

 private:
  BSTR text_;
};

using GetControl = HRESULT(WINAPI*)(HWND window, IUnknown** control);

// Puts the control of that name on the form, and connects its events.
template <typename Control>
Control* Place(HWND form, GetControl getControl, const wchar_t* name, int left, REFIID events,
               EventSink& sink) {
  const HWND window = CreateWindowExW(0, L"AtlAxWin", name, WS_CHILD | WS_VISIBLE, left, 0, 400, 400, form,
                                      nullptr, nullptr, nullptr);
  IUnknown* unknown = nullptr;
  if (!window || FAILED(getControl(window, &unknown))) return nullptr;
  Control* control = nullptr;
  unknown->QueryInterface(__uuidof(Control), reinterpret_cast<void**>(&control));
  IConnectionPointContainer* points = nullptr;
  unknown->QueryInterface(IID_IConnectionPointContainer, reinterpret_cast<void**>(&points));
  IConnectionPoint* point = nullptr;
  DWORD cookie = 0;
  if (points && SUCCEEDED(points->FindConnectionPoint(events, &point))) {
    point->Advise(&sink, &cookie);
    point->Release();
  }
  if (points) points->Release();
  unknown->Release();
  return control;
}

template <typename Control>
bool List(Control& control) {
  Text all(L"*");
  VARIANT_BOOL done = VARIANT_FALSE;
  return SUCCEEDED(control.Init(&all, &done)) && done;
}

int Run(const std::vector<std::wstring>& arguments) {
  const HMODULE atl = LoadLibraryW(L"atl.dll");
  const auto init =
      reinterpret_cast<BOOL(WINAPI*)()>(reinterpret_cast<void*>(GetProcAddress(atl, "AtlAxWinInit")));
  const auto getControl =
      reinterpret_cast<GetControl>(reinterpret_cast<void*>(GetProcAddress(atl, "AtlAxGetControl")));
  if (!init || !getControl || !init()) return 2;

  static EventSink sink;
  const HWND form = CreateWindowExW(0, L"STATIC", L"Pictures", WS_OVERLAPPEDWINDOW | WS_CLIPCHILDREN, 0, 0,
                                    820, 440, nullptr, nullptr, nullptr, nullptr);
  auto* list =
      Place<_ctrlListImage>(form, getControl, L"Tarnwick.ctrlListImage", 0, __uuidof(__ctrlListImage), sink);
  auto* thumbnails = Place<_ctrlThumbNailView>(form, getControl, L"Tarnwick.ctrlThumbNailView", 400,
                                               __uuidof(__ctrlThumbNailView), sink);
  if (!list || !thumbnails) return 3;

  // Each control has a service client of its own; both of a thread share the session. One log-on is enough.
  _CFileUpload* client = nullptr;
  list->get_mobjFileupload(&client);
  VARIANT_BOOL done = VARIANT_FALSE;
  client->ConnectToServer(Text(arguments[1].c_str()), &done);
  client->LogonAs(Text(arguments[4].c_str()), Text(arguments[2].c_str()), Text(arguments[3].c_str()),
                  Text(L""), &done);
  client->Release();
  if (!done || !List(*list) || !List(*thumbnails)) return 4;

  if (arguments.size() > 5 && arguments[5] == L"once") {
    // The list selects the picture that the thumbnails begin with.
    Text name;
    thumbnails->SelectedFileName(&name);
    VARIANT ignored = {};
    list->UploadedFileSetFocus(&name, &ignored);
    Text selected;
    list->SelectedFileName(&selected);
    std::wprintf(L"selected %ls\n", static_cast<BSTR>(selected));
  } else {
    ShowWindow(form, SW_SHOW);
    for (MSG message; IsWindow(form) && GetMessageW(&message, nullptr, 0, 0) > 0;) {
      TranslateMessage(&message);
      DispatchMessageW(&message);
    }
  }
  list->Release();
  thumbnails->Release();
  if (IsWindow(form)) DestroyWindow(form);
  return 0;
}

}  // namespace

int wmain(int count, wchar_t** words) {
  const std::vector<std::wstring> arguments(words, words + count);
  if (arguments.size() < 5) {
    std::fwprintf(stderr, L"usage: form SERVER USER PASSWORD PRODUCT [once]\n");
    return 1;
  }
  OleInitialize(nullptr);
  const int result = Run(arguments);
  OleUninitialize();
  if (result != 0) std::fwprintf(stderr, L"failed at step %d\n", result);
  return result;
}
