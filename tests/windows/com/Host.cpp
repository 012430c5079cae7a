#include "Host.h"

#include <gtest/gtest.h>

#include <ole2.h>

#include <cstdio>

namespace tarnwick::test {
namespace {

std::wstring Needed(const wchar_t* name) {
  std::wstring value = Variable(name);
  if (value.empty()) {
    std::fprintf(stderr, "%ls is not set: these tests are started by scripts/test\n", name);
    ExitProcess(2);
  }
  return value;
}

// After each test the library holds no object and no window.
class NothingIsLeft : public testing::EmptyTestEventListener {
  void OnTestEnd(const testing::TestInfo&) override {
    if (!LoadedLibrary()) return;
    // The window of a control that ended inside one of its messages goes with the next one.
    for (MSG message; PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE);) DispatchMessageW(&message);
    EXPECT_EQ(Exported<CanUnloadNow>("DllCanUnloadNow")(), S_OK);
    // A class goes with its last window.
    WNDCLASSEXW left = {};
    left.cbSize = sizeof left;
    for (const wchar_t* name : kWindowClasses) EXPECT_FALSE(GetClassInfoExW(LoadedLibrary(), name, &left));
  }
};

}  // namespace

std::wstring Variable(const wchar_t* name) {
  wchar_t value[256] = L"";
  GetEnvironmentVariableW(name, value, 256);
  return value;
}

const Server& TheServer() {
  static const Server server = {Needed(L"TARNWICK_SERVER"), Needed(L"TARNWICK_FAULTY_SERVER"),
                                Needed(L"TARNWICK_USER"), Needed(L"TARNWICK_PASSWORD"),
                                Needed(L"TARNWICK_PRODUCT")};
  return server;
}

bool LogOn(_CFileUpload& client, const std::wstring& serverName) {
  const Server& server = TheServer();
  VARIANT_BOOL done = VARIANT_FALSE;
  client.ConnectToServer(Bstr(serverName), &done);
  EXPECT_TRUE(done);
  client.LogonAs(Bstr(server.product), Bstr(server.user), Bstr(server.password), Bstr(L""), &done);
  return done != VARIANT_FALSE;
}

ComPtr<_CFileUpload> LoggedOnClient() {
  ComPtr<_CFileUpload> client = NewClient();
  EXPECT_TRUE(client && LogOn(*client, TheServer().name));
  return client;
}

VARIANT Call(IDispatch* object, const wchar_t* member, std::initializer_list<VARIANT> arguments) {
  VARIANT result = {};
  std::wstring name = member;
  LPOLESTR names = name.data();
  DISPID id = 0;
  DISPPARAMS parameters = {const_cast<VARIANT*>(arguments.begin()), nullptr,
                           static_cast<UINT>(arguments.size()), 0};
  EXCEPINFO exception = {};
  if (FAILED(object->GetIDsOfNames(IID_NULL, &names, 1, LOCALE_USER_DEFAULT, &id)) ||
      FAILED(object->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD | DISPATCH_PROPERTYGET,
                            &parameters, &result, &exception, nullptr))) {
    V_VT(&result) = exception.bstrDescription ? VT_BSTR : VT_ERROR;
    V_BSTR(&result) = exception.bstrDescription;
    SysFreeString(exception.bstrSource);
  }
  return result;
}

ComPtr<IDispatch> Object(IDispatch* object, const wchar_t* member, std::initializer_list<VARIANT> arguments) {
  const VARIANT result = Call(object, member, arguments);
  return V_VT(&result) == VT_DISPATCH ? ComPtr<IDispatch>::Adopt(V_DISPATCH(&result)) : ComPtr<IDispatch>();
}

std::wstring Told(IDispatch* object, const wchar_t* member, std::initializer_list<VARIANT> arguments) {
  VARIANT result = Call(object, member, arguments);
  std::wstring text = TextOf(result);
  VariantClear(&result);
  return text;
}

std::wstring TextOf(const VARIANT& value) {
  if (V_VT(&value) == VT_ERROR) return L"error";
  if (V_VT(&value) == VT_DISPATCH) return V_DISPATCH(&value) ? L"object" : L"nothing";
  if ((V_VT(&value) & VT_ARRAY) != 0) return L"array";
  VARIANT text = {};
  if (FAILED(VariantChangeType(&text, const_cast<VARIANT*>(&value), 0, VT_BSTR))) return L"?";
  std::wstring shown = V_BSTR(&text) ? V_BSTR(&text) : L"";
  VariantClear(&text);
  return shown;
}

}  // namespace tarnwick::test

int main(int count, char** arguments) {
  testing::InitGoogleTest(&count, arguments);
  testing::UnitTest::GetInstance()->listeners().Append(new tarnwick::test::NothingIsLeft);
  // With OLE, so that controls can take drops.
  OleInitialize(nullptr);
  const int result = RUN_ALL_TESTS();
  OleUninitialize();
  return result;
}
