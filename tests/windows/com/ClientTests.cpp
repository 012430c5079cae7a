// The service client as an early-bound host uses it, where a server or a collection of the host's own has a
// part in it.
#include "Form.h"

namespace tarnwick::test {
namespace {

TEST(Client, FetchesFilesInASession) {
  const ComPtr<_CFileUpload> client = LoggedOnClient();
  const Bstr local(L"fetched.bin");
  Bstr result;
  const auto fetch = [&](const wchar_t* remote) {
    client->DownloadFile(Bstr(remote), local, result.Receive());
    return result.Text();
  };
  EXPECT_EQ(fetch(L"rose.jpg"), L"") << "without a session";
  VARIANT_BOOL open = VARIANT_FALSE;
  client->OpenSession(&open);
  ASSERT_TRUE(open);
  client->OpenSession(&open);  // closes the first one
  ASSERT_TRUE(open);
  EXPECT_EQ(fetch(L"rose.jpg"), local.Text());
  EXPECT_TRUE(Contents(local.Text()) == Contents(L"demo\\pictures\\rose.jpg"));
  // What a failed fetch would overwrite stays.
  EXPECT_EQ(fetch(L"not there.jpg"), L"");
  EXPECT_TRUE(Contents(local.Text()) == Contents(L"demo\\pictures\\rose.jpg"));
  client->DisconnectFromServer();
  EXPECT_EQ(fetch(L"rose.jpg"), L"");
  DeleteFileW(local);
}

TEST(Client, AddsAndDeletesAUser) {
  const ComPtr<_CFileUpload> client = LoggedOnClient();
  const Bstr user(L"com.test@example.org");
  const Bstr product(TheServer().product);
  const Bstr empty(L"");
  Bstr mguid;
  client->AddUser(product, user, VariantOf(empty), mguid.Receive());
  EXPECT_GT(mguid.Text().size(), 4U);

  ComPtr<IDispatch> details;
  LONG status = 0;
  client->GetAccountDetailsForMGUID(mguid, user, product, details.Receive(), &status);
  EXPECT_EQ(status, 1001);
  EXPECT_EQ(Told(details.Get(), L"Count"), L"1");
  EXPECT_EQ(Told(Object(details.Get(), L"Item", {VariantOf(LONG{1})}).Get(), L"EmailAddress"), user.Text());

  // The new user is logged on, and the key that the service mails is the password.
  Bstr key;
  client->GetKeyForUser(product, user, key.Receive());
  client->DeleteUser(product, user, VariantOf(key), VARIANT_TRUE, &status);
  EXPECT_EQ(status, 1001);
  client->DeleteUser(product, user, VariantOf(key), VARIANT_TRUE, &status);
  EXPECT_EQ(status, 1003);
}

// A collection of the host's that refuses its second item, and takes items without a key only.
struct RefusingCollection final : HostObject {
  int added = 0;
  STDMETHODIMP Invoke(DISPID member, REFIID, LCID, WORD, DISPPARAMS* arguments, VARIANT*, EXCEPINFO*,
                      UINT*) override {
    EXPECT_EQ(member, 7);
    if (arguments->cArgs != 1) return DISP_E_BADPARAMCOUNT;
    EXPECT_EQ(V_VT(&arguments->rgvarg[0]), VT_DISPATCH);
    return ++added == 2 ? DISP_E_EXCEPTION : S_OK;
  }
};

TEST(Client, EndsWhenTheHostsCollectionRefuses) {
  RefusingCollection collection;
  IDispatch* handedIn = &collection;
  VARIANT_BOOL listed = VARIANT_TRUE;
  EXPECT_EQ(LoggedOnClient()->ListFilesForUser(&handedIn, &listed), S_OK);
  EXPECT_FALSE(listed);
  EXPECT_EQ(collection.added, 2);
  EXPECT_EQ(handedIn, &collection);
  EXPECT_EQ(collection.references, 1U);
}

}  // namespace
}  // namespace tarnwick::test
