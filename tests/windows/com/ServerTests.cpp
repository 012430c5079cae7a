// The in-process server itself: class objects, life times, type library.
#include <gtest/gtest.h>

#include <vector>

#include "Host.h"

namespace tarnwick::test {
namespace {

using GetClassObject = HRESULT(STDAPICALLTYPE*)(REFCLSID, REFIID, void**);
using CanUnloadNow = HRESULT(STDAPICALLTYPE*)();

// The registered file, loaded without the component runtime, which would keep references of its own.
class Library {
 public:
  Library() {
    wchar_t id[39] = L"";
    StringFromGUID2(CLSID_CFileUpload, id, 39);
    const std::wstring key = std::wstring(L"CLSID\\") + id + L"\\InprocServer32";
    wchar_t path[MAX_PATH] = L"";
    LONG size = sizeof path;
    RegQueryValueW(HKEY_CLASSES_ROOT, key.c_str(), path, &size);
    module_ = LoadLibraryW(path);
  }
  ~Library() { FreeLibrary(module_); }
  Library(const Library&) = delete;
  Library& operator=(const Library&) = delete;

  template <typename Function>
  Function Export(const char* name) const {
    return reinterpret_cast<Function>(reinterpret_cast<void*>(GetProcAddress(module_, name)));
  }

 private:
  HMODULE module_ = nullptr;
};

TEST(Server, ClassObjects) {
  const Library library;
  const auto getClassObject = library.Export<GetClassObject>("DllGetClassObject");
  const auto canUnloadNow = library.Export<CanUnloadNow>("DllCanUnloadNow");
  ASSERT_TRUE(getClassObject && canUnloadNow);
  // The window of a control that ended inside one of its messages goes with the next one.
  for (MSG message; PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE);) DispatchMessageW(&message);
  EXPECT_EQ(canUnloadNow(), S_OK);

  auto* poison = reinterpret_cast<void*>(1);
  for (const CLSID& refused : {CLSID_CUpload, CLSID_CRegistry, IID_IUnknown}) {
    void* factory = poison;
    EXPECT_EQ(getClassObject(refused, IID_IClassFactory, &factory), CLASS_E_CLASSNOTAVAILABLE);
    EXPECT_EQ(factory, nullptr);
  }
  EXPECT_EQ(getClassObject(CLSID_CFileUpload, IID_IClassFactory, nullptr), E_POINTER);

  ComPtr<IClassFactory> factory;
  ASSERT_EQ(getClassObject(CLSID_CFileUpload, IID_IClassFactory, factory.ReceiveVoid()), S_OK);
  EXPECT_EQ(canUnloadNow(), S_FALSE);
  void* object = poison;
  EXPECT_EQ(factory->CreateInstance(factory.Get(), IID_IUnknown, &object), CLASS_E_NOAGGREGATION);
  EXPECT_EQ(object, nullptr);
  object = poison;
  EXPECT_EQ(factory->CreateInstance(nullptr, IID_IPersist, &object), E_NOINTERFACE);
  EXPECT_EQ(object, nullptr);

  ComPtr<_CFileUpload> client;
  ASSERT_EQ(factory->CreateInstance(nullptr, __uuidof(_CFileUpload), client.ReceiveVoid()), S_OK);
  factory->LockServer(TRUE);
  factory = {};
  ComPtr<_CUpload> record;
  EXPECT_EQ(client->get_UploadObject(record.Receive()), S_OK);
  client = {};
  EXPECT_EQ(canUnloadNow(), S_FALSE);
  // A record outlives the client that made it.
  EXPECT_EQ(record->put_FileSize(5), S_OK);
  record = {};
  EXPECT_EQ(canUnloadNow(), S_FALSE);
  ASSERT_EQ(getClassObject(CLSID_CBVAccount, IID_IClassFactory, factory.ReceiveVoid()), S_OK);
  factory->LockServer(FALSE);
  factory = {};
  EXPECT_EQ(canUnloadNow(), S_OK);
}

TEST(Server, ClassesThatOnlyTheLibraryMakes) {
  for (const CLSID& refused : {CLSID_CUpload, CLSID_CRegistry}) {
    ComPtr<IUnknown> object;
    EXPECT_EQ(CoCreateInstance(refused, nullptr, CLSCTX_INPROC_SERVER, IID_IUnknown, object.ReceiveVoid()),
              REGDB_E_CLASSNOTREG);
  }
}

TEST(Server, TypeLibraryIsRegisteredForEveryLocale) {
  for (const LCID locale : {0x409U, 0x407U, 0U}) {
    ComPtr<ITypeLib> library;
    EXPECT_EQ(LoadRegTypeLib(LIBID_Tarnwick, 1, 1, locale, library.Receive()), S_OK) << locale;
  }
}

TEST(Server, NullPointersAreRefused) {
  const ComPtr<_CFileUpload> client = NewClient();
  ASSERT_TRUE(client);
  EXPECT_EQ(client->QueryInterface(IID_IUnknown, nullptr), E_POINTER);
  EXPECT_EQ(client->get_HTTPServer(nullptr), E_POINTER);
  EXPECT_EQ(client->get_UploadObject(nullptr), E_POINTER);
  EXPECT_EQ(client->CanUploadFile(nullptr), E_POINTER);
  EXPECT_EQ(client->EnCodeString(nullptr, nullptr), E_POINTER);
  Bstr text(L"poison");
  EXPECT_EQ(client->EnCodeString(nullptr, text.Receive()), S_OK);
  EXPECT_EQ(text.Text(), L"");
  VARIANT_BOOL answer = 77;
  EXPECT_EQ(client->FileExists(nullptr, &answer), S_OK);
  EXPECT_EQ(answer, VARIANT_FALSE);
  EXPECT_EQ(client->ListFilesForUser(nullptr, &answer), S_OK);
  EXPECT_EQ(answer, VARIANT_FALSE);
}

DWORD WINAPI AskOnThread(void* result) {
  CoInitialize(nullptr);
  {
    const ComPtr<_CFileUpload> client = NewClient();
    Bstr base;
    if (client && SUCCEEDED(client->GetUserBasePath(base.Receive())))
      *static_cast<std::wstring*>(result) = base.Text();
  }
  CoUninitialize();
  return 0;
}

TEST(Server, EachThreadHasItsOwnSession) {
  const ComPtr<_CFileUpload> client = NewClient();
  ASSERT_TRUE(client);
  client->put_HTTPServer(Bstr(L"127.0.0.1:9"));
  const ComPtr<_CFileUpload> sister = NewClient();
  Bstr base;
  sister->GetUserBasePath(base.Receive());
  EXPECT_EQ(base.Text(), L"http://127.0.0.1:9");
  // Twice, because the second thread may get the identifier of the first one, but must not get its session.
  for (int i = 0; i < 2; ++i) {
    std::wstring seen;
    const HANDLE thread = CreateThread(nullptr, 0, AskOnThread, &seen, 0, nullptr);
    ASSERT_NE(thread, nullptr);
    WaitForSingleObject(thread, INFINITE);
    CloseHandle(thread);
    EXPECT_EQ(seen, L"http://");
  }
}

}  // namespace
}  // namespace tarnwick::test
