// What the tests of this folder share: the server that they were started for, and values of automation.
#pragma once

#include "platform/windows/ComPtr.h"
#include "surface/TypeLibrary.h"

#include <oleauto.h>

#include <initializer_list>
#include <string>
#include <utility>

namespace tarnwick::test {

// Named by environment variables, which scripts/test sets.
struct Server {
  std::wstring name;      // TARNWICK_SERVER, "host:port", with an FTP server on port 21 of the host
  std::wstring faulty;    // TARNWICK_FAULTY_SERVER
  std::wstring user;      // TARNWICK_USER
  std::wstring password;  // TARNWICK_PASSWORD
  std::wstring product;   // TARNWICK_PRODUCT
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

// A new client; null when the library is not registered.
inline ComPtr<_CFileUpload> NewClient() {
  ComPtr<_CFileUpload> client;
  CoCreateInstance(CLSID_CFileUpload, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_CFileUpload),
                   client.ReceiveVoid());
  return client;
}

// A client that is logged on to the account.
ComPtr<_CFileUpload> LoggedOnClient();

// Late-bound call of a member, with the last argument first; when it fails, the description of the error, or
// VT_ERROR.
VARIANT Call(IDispatch* object, const wchar_t* member, std::initializer_list<VARIANT> arguments);
inline VARIANT Get(IDispatch* object, const wchar_t* member, const VARIANT* argument = nullptr) {
  return argument ? Call(object, member, {*argument}) : Call(object, member, {});
}

}  // namespace tarnwick::test
