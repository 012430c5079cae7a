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

std::wstring NameOf(ITypeInfo& info, MEMBERID member) {
  Bstr name;
  info.GetDocumentation(member, name.Receive(), nullptr, nullptr, nullptr);
  return name.Text();
}

// Names of an interface's members in its order, a property once; `ids` receives their identifiers.
std::wstring Members(ITypeInfo& info, std::vector<DISPID>& ids) {
  std::wstring names;
  FUNCDESC* function = nullptr;
  for (UINT i = 0; SUCCEEDED(info.GetFuncDesc(i, &function)); ++i) {
    const DISPID id = function->memid;
    const bool isOurs = id > 0 && id < 0x10000;
    info.ReleaseFuncDesc(function);
    if (!isOurs || (!ids.empty() && ids.back() == id)) continue;
    ids.push_back(id);
    names += NameOf(info, id) + L" ";
  }
  return names;
}

WORD FlagsOf(ITypeInfo& info) {
  TYPEATTR* attributes = nullptr;
  if (FAILED(info.GetTypeAttr(&attributes))) return 0;
  const WORD flags = attributes->wTypeFlags;
  info.ReleaseTypeAttr(attributes);
  return flags;
}

// "NAME=VALUE" of the last of an enumeration's names, and how many there are.
std::wstring LastOf(ITypeInfo& info) {
  std::wstring last;
  VARDESC* variable = nullptr;
  UINT i = 0;
  for (; SUCCEEDED(info.GetVarDesc(i, &variable)); ++i) {
    last = NameOf(info, variable->memid) + L"=" +
           std::to_wstring(static_cast<unsigned long>(V_I4(variable->lpvarValue)));
    info.ReleaseVarDesc(variable);
  }
  return std::to_wstring(i) + L" " + last;
}

TEST(Server, TypeLibraryIsRegisteredWhole) {
  ComPtr<ITypeLib> library;
  ASSERT_EQ(LoadRegTypeLib(LIBID_Tarnwick, 1, 1, 0x409, library.Receive()), S_OK);
  Bstr name;
  Bstr help;
  library->GetDocumentation(-1, name.Receive(), help.Receive(), nullptr, nullptr);
  EXPECT_EQ(name.Text() + help.Text(), L"TarnwickTarnwick");
  TLIBATTR* attributes = nullptr;
  ASSERT_EQ(library->GetLibAttr(&attributes), S_OK);
  EXPECT_EQ(attributes->lcid, 0x409U);
  library->ReleaseTLibAttr(attributes);

  const auto find = [&](const wchar_t* wanted) {
    ComPtr<ITypeInfo> info;
    std::wstring text = wanted;
    MEMBERID member = 0;
    USHORT found = 1;
    library->FindName(text.data(), 0, info.Receive(), &member, &found);
    return info;
  };
  for (const wchar_t* creatable : {L"CFileUpload", L"CBVAccount"})
    EXPECT_TRUE(FlagsOf(*find(creatable)) & TYPEFLAG_FCANCREATE) << creatable;
  for (const wchar_t* made : {L"CUpload", L"CRegistry"})
    EXPECT_FALSE(FlagsOf(*find(made)) & TYPEFLAG_FCANCREATE) << made;

  const std::pair<const wchar_t*, const wchar_t*> interfaces[] = {
      {L"_CUpload", L"FileName FileDate FilePath FileSize "},
      {L"_CBVAccount", L"ServiceLevelName ExpiryPeriod CurrentDate StartDate UsedQuota Quota EmailAddress "},
      {L"_CRegistry", L"setBaseRegKey getRegSetting "},
      {L"_CFileUpload",
       L"HTTPServer UploadObject RenameFile UploadFile GetMaxQuota GetTotalUsedQuota CanUploadFile "
       L"CanDeleteFile "
       L"SetCUploadObject DeleteFileForUser GetFileDetails ListFilesForUser DisconnectFromServer "
       L"ConnectToServer "
       L"LogonAs OpenSession GetFileUploadPath GetKeyForUser AddUser DeleteUser IsValidUserID EmailKeyToUser "
       L"GetHardLimit GetSoftLimit GetMGUIDForUser GetCreationDateForMGUID GetCurrentDateTimeFromServer "
       L"CanDownLoadFile DownloadFile ManagePassword ActivateAccount AbortFileTransfer IsAccountEmpty "
       L"SaveUploadFile FileExists EnCodeString GetUserBasePath GetAccountDetailsForMGUID "
       L"HasUserAccountExpired "
       L"GetPremiumBaseAccountSize "},
  };
  for (const auto& [interfaceName, members] : interfaces) {
    const ComPtr<ITypeInfo> info = find(interfaceName);
    ASSERT_TRUE(info) << interfaceName;
    constexpr WORD kFlags = TYPEFLAG_FDUAL | TYPEFLAG_FHIDDEN;
    EXPECT_EQ(FlagsOf(*info) & kFlags, kFlags) << interfaceName;
    std::vector<DISPID> ids;
    EXPECT_EQ(Members(*info, ids), members);
  }

  const std::pair<const wchar_t*, const wchar_t*> enumerations[] = {
      {L"FTP_CONNECTION_STATES", L"11 FTP_TRANSFER_COMLETED=10"},
      {L"FtpTransferModes", L"2 FTP_IMAGE_MODE=1"},
      {L"FTP_RESPONSE_CODES", L"39 FTP_RESPONSE_REQUESTED_ACTION_NOT_TAKEN_FILE_NAME_NOT_ALLOWED=553"},
      {L"FtpErrors", L"60 ERROR_FTP_USER_TRANSFER_IN_PROGRESS=59"},
      {L"REG_KEYTYPE", L"4 REG_DWORD=4"},
      {L"REG_HIVES", L"6 HKEY_CURRENT_CONFIG=2147483653"},
  };
  for (const auto& [enumeration, last] : enumerations) {
    const ComPtr<ITypeInfo> info = find(enumeration);
    ASSERT_TRUE(info) << enumeration;
    EXPECT_EQ(LastOf(*info), last);
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
