#include "Host.h"

#include <gtest/gtest.h>

#include <ole2.h>

#include <cstdio>

namespace tarnwick::test {
namespace {

std::wstring Variable(const wchar_t* name) {
  wchar_t value[256] = L"";
  if (GetEnvironmentVariableW(name, value, 256) == 0) {
    std::fprintf(stderr, "%ls is not set: these tests are started by scripts/test\n", name);
    ExitProcess(2);
  }
  return value;
}

}  // namespace

const Server& TheServer() {
  static const Server server = {Variable(L"TARNWICK_SERVER"), Variable(L"TARNWICK_FAULTY_SERVER"),
                                Variable(L"TARNWICK_USER"), Variable(L"TARNWICK_PASSWORD"),
                                Variable(L"TARNWICK_PRODUCT")};
  return server;
}

ComPtr<_CFileUpload> LoggedOnClient() {
  const Server& server = TheServer();
  ComPtr<_CFileUpload> client = NewClient();
  if (!client) return {};
  VARIANT_BOOL done = VARIANT_FALSE;
  client->ConnectToServer(Bstr(server.name), &done);
  EXPECT_TRUE(done);
  client->LogonAs(Bstr(server.product), Bstr(server.user), Bstr(server.password), Bstr(L""), &done);
  EXPECT_TRUE(done);
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

}  // namespace tarnwick::test

int main(int count, char** arguments) {
  testing::InitGoogleTest(&count, arguments);
  // With OLE, so that controls can take drops.
  OleInitialize(nullptr);
  const int result = RUN_ALL_TESTS();
  OleUninitialize();
  return result;
}
