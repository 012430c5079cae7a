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

TEST(Server, UnregisteringLeavesWhatTheOtherKindOfProgramsNeeds) {
  if (sizeof(void*) != 8) GTEST_SKIP() << "a 32-bit system has no other kind of programs";
  const Library library;
  const auto install = library.Export<HRESULT(STDAPICALLTYPE*)()>("DllRegisterServer");
  const auto remove = library.Export<HRESULT(STDAPICALLTYPE*)()>("DllUnregisterServer");
  ASSERT_TRUE(install && remove);
  const auto key = [](const wchar_t* folder, const GUID& id) {
    wchar_t text[39] = L"";
    StringFromGUID2(id, text, 39);
    return L"Software\\Classes\\" + std::wstring(folder) + L"\\" + text;
  };
  const auto has = [](const std::wstring& path, REGSAM view = 0) {
    HKEY found = nullptr;
    if (RegOpenKeyExW(HKEY_LOCAL_MACHINE, path.c_str(), 0, KEY_QUERY_VALUE | view, &found) != ERROR_SUCCESS)
      return false;
    RegCloseKey(found);
    return true;
  };
  const std::wstring typeLibrary = key(L"TypeLib", LIBID_Tarnwick);
  const std::wstring client = key(L"CLSID", CLSID_CFileUpload);
  const std::wstring name = L"Software\\Classes\\Tarnwick.";
  // As a 32-bit library would have registered one of the classes.
  const std::pair<std::wstring, REGSAM> others[] = {{typeLibrary + L"\\1.1\\409\\win32", 0},
                                                    {client, KEY_WOW64_32KEY}};
  for (const auto& [path, view] : others) {
    HKEY made = nullptr;
    ASSERT_EQ(RegCreateKeyExW(HKEY_LOCAL_MACHINE, path.c_str(), 0, nullptr, 0, KEY_SET_VALUE | view, nullptr,
                              &made, nullptr),
              ERROR_SUCCESS);
    RegCloseKey(made);
  }
  EXPECT_TRUE(has(client) && has(typeLibrary + L"\\1.1\\0\\win64"));
  EXPECT_EQ(remove(), S_OK);
  for (const auto& [path, view] : others) EXPECT_TRUE(has(path, view));
  for (const REGSAM view : {0, KEY_WOW64_32KEY}) {
    EXPECT_TRUE(has(key(L"Interface", __uuidof(_CFileUpload)), view));
  }
  EXPECT_TRUE(has(name + L"CFileUpload\\CLSID") && has(name + L"CFileUpload.1"));
  EXPECT_FALSE(has(client) || has(name + L"CBVAccount"));
  for (const wchar_t* locale : {L"\\1.1\\409\\win64", L"\\1.1\\0\\win64"})
    EXPECT_FALSE(has(typeLibrary + locale));

  for (const auto& [path, view] : others) RegDeleteKeyExW(HKEY_LOCAL_MACHINE, path.c_str(), view, 0);
  EXPECT_EQ(install(), S_OK);
  EXPECT_EQ(remove(), S_OK);
  EXPECT_FALSE(has(typeLibrary) || has(name + L"CFileUpload") ||
               has(key(L"Interface", __uuidof(_CFileUpload)), KEY_WOW64_32KEY));
  EXPECT_EQ(install(), S_OK);
}

TEST(Server, NullPointersAreRefused) {
  const ComPtr<_CFileUpload> client = NewClient();
  ASSERT_TRUE(client);
  EXPECT_EQ(client->QueryInterface(IID_IUnknown, nullptr), E_POINTER);
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
