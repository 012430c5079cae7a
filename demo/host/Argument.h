// A text for the time of a call.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleauto.h>

#include <string>

namespace tarnwick::demo {

class Argument {
 public:
  explicit Argument(const std::wstring& text)
      : text_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}
  ~Argument() { SysFreeString(text_); }
  Argument(const Argument&) = delete;
  Argument& operator=(const Argument&) = delete;
  BSTR Get() const { return text_; }
  BSTR* Reference() { return &text_; }

 private:
  BSTR text_;
};

// A text that a call returned, which it frees.
inline std::wstring Taken(BSTR text) {
  std::wstring taken = text ? text : L"";
  SysFreeString(text);
  return taken;
}

}  // namespace tarnwick::demo
