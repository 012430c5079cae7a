// The service client as an early-bound host uses it, against a running hosting server.
#include <gtest/gtest.h>

#include <chrono>
#include <fstream>
#include <iterator>

#include "Host.h"

namespace tarnwick::test {
namespace {

LONG CountOf(IDispatch* collection) {
  const VARIANT count = Get(collection, L"Count");
  return V_VT(&count) == VT_I4 ? V_I4(&count) : -1;
}

// The record of the collection's item at `position`.
ComPtr<_CUpload> RecordAt(IDispatch* collection, LONG position) {
  VARIANT index;
  V_VT(&index) = VT_I4;
  V_I4(&index) = position;
  VARIANT item = Get(collection, L"Item", &index);
  ComPtr<_CUpload> record;
  if (V_VT(&item) == VT_DISPATCH) V_DISPATCH(&item)->QueryInterface(__uuidof(_CUpload), record.ReceiveVoid());
  VariantClear(&item);
  return record;
}

std::wstring NameOf(_CUpload& record) {
  Bstr name;
  record.get_FileName(name.Receive());
  return name.Text();
}

std::wstring AddressOf(_CUpload& record) {
  Bstr address;
  record.get_FilePath(address.Receive());
  return address.Text();
}

std::string Contents(const std::wstring& path) {
  std::ifstream file(std::string(path.begin(), path.end()), std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

class Client : public testing::Test {
 protected:
  void SetUp() override {
    client = LoggedOnClient();
    ASSERT_TRUE(client);
    VARIANT_BOOL listed = VARIANT_FALSE;
    ASSERT_EQ(client->ListFilesForUser(files.Receive(), &listed), S_OK);
    ASSERT_TRUE(listed);
    ASSERT_GT(CountOf(files.Get()), 2);
  }

  const Server& server = TheServer();
  ComPtr<_CFileUpload> client;
  ComPtr<IDispatch> files;
};

TEST_F(Client, ListsTheAccountUnderAddresses) {
  Bstr base;
  client->GetUserBasePath(base.Receive());
  EXPECT_EQ(base.Text().rfind(L"http://" + server.name + L"/users/", 0), 0U);
  double total = 0;
  for (LONG i = 1; i <= CountOf(files.Get()); ++i) {
    const ComPtr<_CUpload> record = RecordAt(files.Get(), i);
    ASSERT_TRUE(record);
    EXPECT_EQ(AddressOf(*record), base.Text() + L"/" + NameOf(*record));
    const Bstr key(AddressOf(*record));
    const VARIANT keyArgument = VariantOf(key);
    VARIANT found = Get(files.Get(), L"Item", &keyArgument);
    EXPECT_EQ(V_VT(&found), VT_DISPATCH);
    VariantClear(&found);
    double size = 0;
    record->get_FileSize(&size);
    total += size;
  }
  VARIANT used;
  VariantInit(&used);
  client->GetTotalUsedQuota(Bstr(server.product), Bstr(server.user), &used);
  ASSERT_EQ(V_VT(&used), VT_R8);
  EXPECT_EQ(V_R8(&used), total);
}

TEST_F(Client, RenamesAndRegisters) {
  const std::wstring name = NameOf(*RecordAt(files.Get(), 1));
  const auto rename = [&](const std::wstring& from, const std::wstring& to) {
    VARIANT status;
    VariantInit(&status);
    client->RenameFile(Bstr(server.product), Bstr(server.user), Bstr(from), Bstr(to), &status);
    return V_VT(&status) == VT_I4 ? V_I4(&status) : 0;
  };
  EXPECT_EQ(rename(name, L"renamed & +100%23.jpg"), 1033);  // a name that the server refuses
  EXPECT_EQ(rename(name, L"renamed & +100.jpg"), 1001);
  EXPECT_EQ(rename(name, L"elsewhere.jpg"), 1033);
  EXPECT_EQ(rename(L"renamed & +100.jpg", name), 1001);

  LONG status = 0;
  client->DeleteFileForUser(Bstr(L"not there.jpg"), &status);
  EXPECT_EQ(status, 0);

  const std::wstring local = L"read only \u00e9.gif";
  HANDLE file = CreateFileW(local.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr);
  DWORD written = 0;
  WriteFile(file, "GIF89a", 6, &written, nullptr);
  CloseHandle(file);
  SetFileAttributesW(local.c_str(), FILE_ATTRIBUTE_READONLY);
  Bstr address;
  client->SaveUploadFile(Bstr(L".\\" + local), address.Receive());
  Bstr base;
  client->GetUserBasePath(base.Receive());
  EXPECT_EQ(address.Text(), base.Text() + L"/" + local);
  EXPECT_TRUE(GetFileAttributesW(local.c_str()) & FILE_ATTRIBUTE_READONLY);
  SetFileAttributesW(local.c_str(), FILE_ATTRIBUTE_NORMAL);
  DeleteFileW(local.c_str());

  ComPtr<_CUpload> record;
  client->get_UploadObject(record.Receive());
  EXPECT_EQ(NameOf(*record), local);
}

TEST_F(Client, FetchesOverFtp) {
  const ComPtr<_CUpload> record = RecordAt(files.Get(), 2);
  const Bstr remote(NameOf(*record));
  const Bstr local(L"fetched.bin");
  Bstr result;
  client->DownloadFile(remote, local, result.Receive());
  EXPECT_EQ(result.Text(), L"");  // no session yet

  VARIANT_BOOL open = VARIANT_FALSE;
  client->OpenSession(&open);
  ASSERT_TRUE(open);
  client->OpenSession(&open);  // closes the first one
  ASSERT_TRUE(open);
  client->DownloadFile(remote, local, result.Receive());
  EXPECT_EQ(result.Text(), local.Text());
  double size = 0;
  record->get_FileSize(&size);
  const std::string before = Contents(local.Text());
  EXPECT_EQ(static_cast<double>(before.size()), size);

  // What a failed fetch would overwrite stays.
  client->DownloadFile(Bstr(L"not there.jpg"), local, result.Receive());
  EXPECT_EQ(result.Text(), L"");
  EXPECT_EQ(Contents(local.Text()), before);
  client->DisconnectFromServer();
  client->DownloadFile(remote, local, result.Receive());
  EXPECT_EQ(result.Text(), L"");
  DeleteFileW(local);
}

TEST_F(Client, AddsAndDeletesAUser) {
  const Bstr user(L"com.test@example.org");
  const Bstr product(server.product);
  const Bstr empty(L"");
  Bstr mguid;
  client->AddUser(product, user, VariantOf(empty), mguid.Receive());
  EXPECT_GT(mguid.Text().size(), 4U);
  Bstr again;
  client->AddUser(product, user, VariantOf(empty), again.Receive());
  EXPECT_EQ(again.Text(), L"1003");

  ComPtr<IDispatch> details;
  LONG status = 0;
  client->GetAccountDetailsForMGUID(mguid, user, product, details.Receive(), &status);
  EXPECT_EQ(status, 1001);
  ASSERT_EQ(CountOf(details.Get()), 1);
  VARIANT one;
  V_VT(&one) = VT_I4;
  V_I4(&one) = 1;
  VARIANT item = Get(details.Get(), L"Item", &one);
  ASSERT_EQ(V_VT(&item), VT_DISPATCH);
  VARIANT address = Get(V_DISPATCH(&item), L"EmailAddress");
  EXPECT_EQ(std::wstring(V_BSTR(&address)), user.Text());
  VariantClear(&address);
  VariantClear(&item);

  const Bstr wrong(L"wrong");
  client->DeleteUser(product, user, VariantOf(wrong), VARIANT_TRUE, &status);
  EXPECT_EQ(status, 1002);
  // The new user is logged on, and the key that the service mails is the password.
  Bstr key;
  client->GetKeyForUser(product, user, key.Receive());
  client->DeleteUser(product, user, VariantOf(key), VARIANT_TRUE, &status);
  EXPECT_EQ(status, 1001);
  client->DeleteUser(product, user, VariantOf(key), VARIANT_TRUE, &status);
  EXPECT_EQ(status, 1003);
}

// A collection of the host's that refuses its second item.
class RefusingCollection final : public IDispatch {
 public:
  int added = 0;
  int references = 1;

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override {
    *object = interfaceId == IID_IUnknown || interfaceId == IID_IDispatch ? this : nullptr;
    if (!*object) return E_NOINTERFACE;
    AddRef();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return static_cast<ULONG>(++references); }
  STDMETHODIMP_(ULONG) Release() override { return static_cast<ULONG>(--references); }
  STDMETHODIMP GetTypeInfoCount(UINT*) override { return E_NOTIMPL; }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID* ids) override {
    *ids = 7;
    return S_OK;
  }
  STDMETHODIMP Invoke(DISPID member, REFIID, LCID, WORD, DISPPARAMS* arguments, VARIANT*, EXCEPINFO*,
                      UINT*) override {
    EXPECT_EQ(member, 7);
    // Takes items without a key only.
    if (arguments->cArgs != 1) return DISP_E_BADPARAMCOUNT;
    EXPECT_EQ(V_VT(&arguments->rgvarg[0]), VT_DISPATCH);
    return ++added == 2 ? DISP_E_EXCEPTION : S_OK;
  }
};

TEST_F(Client, EndsWhenTheHostsCollectionRefuses) {
  RefusingCollection collection;
  IDispatch* handedIn = &collection;
  VARIANT_BOOL listed = VARIANT_TRUE;
  EXPECT_EQ(client->ListFilesForUser(&handedIn, &listed), S_OK);
  EXPECT_FALSE(listed);
  EXPECT_EQ(collection.added, 2);
  EXPECT_EQ(handedIn, &collection);
  EXPECT_EQ(collection.references, 1);
}

TEST_F(Client, AnswersWithTheFailureValueWhateverTheServerDoes) {
  VARIANT_BOOL answer = VARIANT_TRUE;
  client->put_HTTPServer(Bstr(server.faulty));
  const Bstr product(server.product);
  const Bstr user(server.user);
  const auto begin = std::chrono::steady_clock::now();

  EXPECT_EQ(client->IsValidUserID(VariantOf(user), VariantOf(product), &answer), S_OK);  // cut
  EXPECT_FALSE(answer);
  LONG number = 1;
  EXPECT_EQ(client->CanUploadFile(&number), S_OK);  // status 500
  EXPECT_EQ(number, 1004);
  Bstr text;
  EXPECT_EQ(client->GetKeyForUser(product, user, text.Receive()), S_OK);  // garbage
  EXPECT_EQ(text.Text(), L"1004");
  number = 1;
  EXPECT_EQ(client->GetHardLimit(VariantOf(product), &number), S_OK);  // other variables
  EXPECT_EQ(number, 0);
  number = 1;
  EXPECT_EQ(client->GetSoftLimit(VariantOf(product), &number), S_OK);  // nothing
  EXPECT_EQ(number, 0);
  EXPECT_EQ(client->EmailKeyToUser(product, user, nullptr, &number), S_OK);  // reset
  EXPECT_EQ(number, 1004);
  double quota = 1;
  EXPECT_EQ(client->GetMaxQuota(product, user, &quota), S_OK);  // closed at once
  EXPECT_EQ(quota, 0);
  EXPECT_EQ(client->ActivateAccount(product, user, product, text.Receive()), S_OK);  // more than 64 MiB
  EXPECT_EQ(text.Text(), L"1004");
  // Nothing of this is a wait for a time-out.
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
}

}  // namespace
}  // namespace tarnwick::test
