// The members of an interface, as the type library describes them.
#pragma once

#include <string>
#include <vector>

#include "Host.h"

namespace tarnwick::test {

struct Parameter {
  std::wstring name;
  VARTYPE type = VT_EMPTY;  // of an interface VT_DISPATCH, of an enumeration VT_I4
  USHORT flags = 0;
  std::wstring declared;  // the interface or the enumeration

  bool Is(USHORT flag) const { return (flags & flag) != 0; }
};

struct Member {
  std::wstring name;
  std::wstring help;
  DISPID id = 0;
  INVOKEKIND kind = INVOKE_FUNC;
  short offset = 0;  // of its slot
  std::vector<Parameter> parameters;

  bool IsPut() const { return (kind & (INVOKE_PROPERTYPUT | INVOKE_PROPERTYPUTREF)) != 0; }
};

// Of a dual interface, its slots in their order; of one of events, what it tells.
std::vector<Member> MembersOf(ITypeInfo& shown);

std::wstring NameOf(ITypeInfo& type);

}  // namespace tarnwick::test
