// What the tests of this folder share: the server that they were started for, and values of automation.
#pragma once

#include "platform/windows/ComPtr.h"
#include "surface/TypeLibrary.h"

#include <gtest/gtest.h>
#include <oleauto.h>

#include <initializer_list>
#include <string>
#include <utility>

namespace tarnwick::test {

// An environment variable; empty when it is not set.
std::wstring Variable(const wchar_t* name);

// Named by environment variables, which scripts/test sets.
struct Server {
  // TARNWICK_SERVER, "host:port" with an FTP server on port 21 of the host, or the same behind "https://".
  std::wstring name;
  std::wstring faulty;    // TARNWICK_FAULTY_SERVER
  std::wstring user;      // TARNWICK_USER
  std::wstring password;  // TARNWICK_PASSWORD
  std::wstring product;   // TARNWICK_PRODUCT
  bool IsSecure() const { return name.starts_with(L"https://"); }
};
const Server& TheServer();

// An owned BSTR.
class Bstr {
 public:
  Bstr() = default;
  explicit Bstr(const std::wstring& text)
      : text_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}
  ~Bstr() { SysFreeString(text_); }
  Bstr(const Bstr&) = delete;
  Bstr& operator=(const Bstr&) = delete;

  operator BSTR() const { return text_; }  // NOLINT(google-explicit-constructor): stands for an argument
  BSTR* Receive() {
    SysFreeString(std::exchange(text_, nullptr));
    return &text_;
  }
  std::wstring Text() const { return {text_ ? text_ : L"", SysStringLen(text_)}; }

 private:
  BSTR text_ = nullptr;
};

inline VARIANT VariantOf(BSTR text) {
  VARIANT value;
  V_VT(&value) = VT_BSTR;
  V_BSTR(&value) = text;
  return value;
}

inline VARIANT VariantOf(LONG number) {
  VARIANT value;
  V_VT(&value) = VT_I4;
  V_I4(&value) = number;
  return value;
}

// Of a variable of that type.
inline VARIANT ReferenceTo(VARTYPE type, void* variable) {
  VARIANT value;
  V_VT(&value) = static_cast<VARTYPE>(VT_BYREF | type);
  V_BYREF(&value) = variable;
  return value;
}

// A further interface of the object.
template <typename Interface>
ComPtr<Interface> As(IUnknown& object) {
  ComPtr<Interface> found;
  EXPECT_EQ(object.QueryInterface(__uuidof(Interface), found.ReceiveVoid()), S_OK);
  return found;
}

// An object of the host's, whose members a test may want to do something.
struct HostObject : IDispatch {
  ULONG references = 1;
  STDMETHODIMP QueryInterface(REFIID id, void** object) override {
    *object = id == IID_IUnknown || id == IID_IDispatch ? this : nullptr;
    if (!*object) return E_NOINTERFACE;
    AddRef();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return ++references; }
  STDMETHODIMP_(ULONG) Release() override { return --references; }
  STDMETHODIMP GetTypeInfoCount(UINT*) override { return E_NOTIMPL; }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID* ids) override {
    *ids = 7;
    return S_OK;
  }
  STDMETHODIMP Invoke(DISPID, REFIID, LCID, WORD, DISPPARAMS*, VARIANT*, EXCEPINFO*, UINT*) override = 0;
};

using GetClassObject = HRESULT(STDAPICALLTYPE*)(REFCLSID, REFIID, void**);
using CanUnloadNow = HRESULT(STDAPICALLTYPE*)();

// The registered library, when something has loaded it.
inline HMODULE LoadedLibrary() {
  return GetModuleHandleW(L"Tarnwick.ocx");
}
template <typename Function>
Function Exported(const char* name) {
  return reinterpret_cast<Function>(reinterpret_cast<void*>(GetProcAddress(LoadedLibrary(), name)));
}

// Names of the windows of both controls.
inline constexpr const wchar_t* kWindowClasses[] = {L"TarnwickListImage", L"TarnwickThumbNailView"};

// A new client; null when the library is not registered.
inline ComPtr<_CFileUpload> NewClient() {
  ComPtr<_CFileUpload> client;
  CoCreateInstance(CLSID_CFileUpload, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_CFileUpload),
                   client.ReceiveVoid());
  return client;
}

// Logs the client on to the account at that server.
bool LogOn(_CFileUpload& client, const std::wstring& serverName);
// A client that is logged on to the account.
ComPtr<_CFileUpload> LoggedOnClient();

// Late-bound call of a member, with the last argument first; when it fails, the description of the error, or
// VT_ERROR.
VARIANT Call(IDispatch* object, const wchar_t* member, std::initializer_list<VARIANT> arguments = {});
// The same for a member whose result is an object, and as text.
ComPtr<IDispatch> Object(IDispatch* object, const wchar_t* member,
                         std::initializer_list<VARIANT> arguments = {});
std::wstring Told(IDispatch* object, const wchar_t* member, std::initializer_list<VARIANT> arguments = {});

// "object", "nothing" and "array" for what has no text, "error" for VT_ERROR.
std::wstring TextOf(const VARIANT& value);

}  // namespace tarnwick::test
