#include "surface/LateBoundObject.h"

#include <algorithm>

namespace tarnwick {
namespace {

bool SameName(const OLECHAR* left, const OLECHAR* right) {
  return lstrcmpiW(left, right) == 0;
}

}  // namespace

const VARIANT* LateBoundArguments::At(UINT parameter) const {
  const VARIANT* found = nullptr;
  // The named ones come first, the others in reverse order.
  for (UINT i = 0; i < arguments_.cNamedArgs; ++i)
    if (arguments_.rgdispidNamedArgs[i] == static_cast<DISPID>(parameter)) found = &arguments_.rgvarg[i];
  if (!found && parameter < arguments_.cArgs - arguments_.cNamedArgs)
    found = &arguments_.rgvarg[arguments_.cArgs - 1 - parameter];
  return found && V_VT(found) == VT_ERROR && V_ERROR(found) == DISP_E_PARAMNOTFOUND ? nullptr : found;
}

HRESULT IdsOfNames(std::span<const LateBoundMember> members, LPOLESTR* names, UINT count, DISPID* ids) {
  if (!names || !ids || count == 0) return E_INVALIDARG;
  std::fill_n(ids, count, DISPID_UNKNOWN);
  const auto member = std::find_if(members.begin(), members.end(), [&](const LateBoundMember& known) {
    return SameName(known.name, names[0]);
  });
  if (member == members.end()) return DISP_E_UNKNOWNNAME;
  ids[0] = member->id;
  HRESULT result = S_OK;
  for (UINT i = 1; i < count; ++i) {
    const auto parameter = std::find_if(member->parameters.begin(), member->parameters.end(),
                                        [&](const OLECHAR* known) { return SameName(known, names[i]); });
    if (parameter == member->parameters.end())
      result = DISP_E_UNKNOWNNAME;
    else
      ids[i] = static_cast<DISPID>(parameter - member->parameters.begin());
  }
  return result;
}

void Describe(const RuntimeError& failure, const OLECHAR* description, EXCEPINFO& exception) {
  exception = {};
  exception.scode = ResultFromErrorNumber(failure.Number());
  exception.bstrSource = SysAllocString(L"Tarnwick");
  exception.bstrDescription = SysAllocString(description);
}

}  // namespace tarnwick
