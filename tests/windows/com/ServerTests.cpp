// The in-process server itself: class objects, life times, type library.
#include <filesystem>
#include <string_view>
#include <thread>

#include "Form.h"

namespace tarnwick::test {
namespace {

TEST(Server, ClassObjects) {
  ASSERT_TRUE(NewClient());
  const auto getClassObject = Exported<GetClassObject>("DllGetClassObject");
  const auto canUnloadNow = Exported<CanUnloadNow>("DllCanUnloadNow");
  ASSERT_TRUE(getClassObject && canUnloadNow);

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
}

// Of the file as the system has loaded it.
TEST(Server, IsBuiltAgainstAbuseAndNeedsOnlyTheSystem) {
  const auto client = NewClient();
  ASSERT_TRUE(client);
  const auto* const image = reinterpret_cast<const char*>(LoadedLibrary());
  const auto& head = *reinterpret_cast<const IMAGE_NT_HEADERS*>(
      image + reinterpret_cast<const IMAGE_DOS_HEADER*>(image)->e_lfanew);
  constexpr WORD kWanted =
      IMAGE_DLLCHARACTERISTICS_DYNAMIC_BASE | IMAGE_DLLCHARACTERISTICS_NX_COMPAT |
      (sizeof(void*) == 8 ? IMAGE_DLLCHARACTERISTICS_HIGH_ENTROPY_VA : IMAGE_DLLCHARACTERISTICS_NO_SEH);
  EXPECT_EQ(head.OptionalHeader.DllCharacteristics & kWanted, kWanted);
  const auto directory = [&](int which) { return head.OptionalHeader.DataDirectory[which].VirtualAddress; };
  // Without it the system cannot choose another address.
  EXPECT_NE(directory(IMAGE_DIRECTORY_ENTRY_BASERELOC), 0U);

  const IMAGE_SECTION_HEADER* section = IMAGE_FIRST_SECTION(&head);
  bool stackIsChecked = false;
  for (int i = 0; i < head.FileHeader.NumberOfSections; ++i, ++section) {
    constexpr DWORD kBoth = IMAGE_SCN_MEM_WRITE | IMAGE_SCN_MEM_EXECUTE;
    EXPECT_NE(section->Characteristics & kBoth, kBoth) << i;
    const std::string_view bytes(image + section->VirtualAddress, section->Misc.VirtualSize);
    // What the run-time of the check says before it ends the process.
    stackIsChecked |= bytes.find("stack smashing detected") != std::string_view::npos;
  }
  EXPECT_TRUE(stackIsChecked);

  wchar_t folder[MAX_PATH] = {};
  GetSystemDirectoryW(folder, MAX_PATH);
  const auto* import =
      reinterpret_cast<const IMAGE_IMPORT_DESCRIPTOR*>(image + directory(IMAGE_DIRECTORY_ENTRY_IMPORT));
  ASSERT_NE(import->Name, 0U);
  for (; import->Name != 0; ++import)
    EXPECT_TRUE(std::filesystem::exists(std::filesystem::path(folder) / (image + import->Name)))
        << image + import->Name;
}

TEST(Server, TypeLibraryIsRegisteredForEveryLocale) {
  for (const LCID locale : {0x409U, 0x407U, 0U}) {
    ComPtr<ITypeLib> library;
    EXPECT_EQ(LoadRegTypeLib(LIBID_Tarnwick, 1, 1, locale, library.Receive()), S_OK) << locale;
  }
}

TEST(Server, UnregisteringLeavesWhatTheOtherKindOfProgramsNeeds) {
  if (sizeof(void*) != 8) GTEST_SKIP() << "a 32-bit system has no other kind of programs";
  ASSERT_TRUE(NewClient());
  const auto install = Exported<HRESULT(STDAPICALLTYPE*)()>("DllRegisterServer");
  const auto remove = Exported<HRESULT(STDAPICALLTYPE*)()>("DllUnregisterServer");
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
    std::thread([&seen] {
      CoInitialize(nullptr);
      Bstr its;
      NewClient()->GetUserBasePath(its.Receive());
      seen = its.Text();
      CoUninitialize();
    }).join();
    EXPECT_EQ(seen, L"http://");
  }
}

// Two threads with a control each, at the same time: each has a session, a listing and a filter of its own.
TEST(Server, ThreadsWorkAtOnce) {
  struct Apartment {
    const wchar_t* filter;
    const wchar_t* shown;
    const wchar_t* hidden;
    int right = 0;
  } apartments[] = {{L"gif", L"wizard.gif", L"rose.jpg"}, {L"jpg", L"rose.jpg", L"wizard.gif"}};
  std::vector<std::thread> threads;
  for (Apartment& apartment : apartments)
    threads.emplace_back([&apartment] {
      OleInitialize(nullptr);
      {
        const auto list = NewControl<_ctrlListImage>(CLSID_ctrlListImage);
        list->putref_mobjFileupload(LoggedOnClient().Get());
        const auto selects = [&](const wchar_t* name) {
          Select(*list, name);
          return Selected(*list) == name;
        };
        for (int i = 0; i < 20; ++i)
          if (Init(*list, apartment.filter) && selects(apartment.shown) && !selects(apartment.hidden))
            ++apartment.right;
      }
      OleUninitialize();
    });
  for (std::thread& thread : threads) thread.join();
  for (const Apartment& apartment : apartments) EXPECT_EQ(apartment.right, 20) << apartment.filter;
}

}  // namespace
}  // namespace tarnwick::test
