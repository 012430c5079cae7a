#include "Members.h"

namespace tarnwick::test {
namespace {

void SetType(ITypeInfo& type, const TYPEDESC& described, Parameter& parameter) {
  parameter.type = described.vt == VT_PTR ? VARTYPE{VT_DISPATCH} : described.vt;
  const TYPEDESC& inner = described.vt == VT_PTR ? *described.lptdesc : described;
  if (inner.vt != VT_USERDEFINED) return;
  ComPtr<ITypeInfo> other;
  TYPEATTR* attributes = nullptr;
  type.GetRefTypeInfo(inner.hreftype, other.Receive());
  other->GetTypeAttr(&attributes);
  const bool isNumber = attributes->typekind == TKIND_ENUM || attributes->typekind == TKIND_ALIAS;
  other->ReleaseTypeAttr(attributes);
  if (described.vt != VT_PTR) parameter.type = isNumber ? VARTYPE{VT_I4} : VARTYPE{VT_DISPATCH};
  parameter.declared = NameOf(*other);
}

}  // namespace

std::wstring NameOf(ITypeInfo& type) {
  Bstr name;
  type.GetDocumentation(MEMBERID_NIL, name.Receive(), nullptr, nullptr, nullptr);
  return name.Text();
}

std::vector<Member> MembersOf(ITypeInfo& shown) {
  ComPtr<ITypeInfo> type(&shown);
  HREFTYPE slots = 0;
  if (SUCCEEDED(shown.GetRefTypeOfImplType(static_cast<UINT>(-1), &slots)))
    shown.GetRefTypeInfo(slots, type.Receive());
  std::vector<Member> members;
  FUNCDESC* function = nullptr;
  for (UINT i = 0; SUCCEEDED(type->GetFuncDesc(i, &function)); ++i) {
    Member member = {{}, {}, function->memid, function->invkind, function->oVft, {}};
    BSTR names[20] = {};
    UINT count = 0;
    Bstr help;
    type->GetNames(function->memid, names, 20, &count);
    type->GetDocumentation(function->memid, nullptr, help.Receive(), nullptr, nullptr);
    member.name = names[0];
    member.help = help.Text();
    for (int k = 0; k < function->cParams; ++k) {
      const ELEMDESC& described = function->lprgelemdescParam[k];
      Parameter parameter;
      parameter.flags = described.paramdesc.wParamFlags;
      if (names[k + 1]) parameter.name = names[k + 1];
      SetType(*type, parameter.Is(PARAMFLAG_FOUT) ? *described.tdesc.lptdesc : described.tdesc, parameter);
      member.parameters.push_back(std::move(parameter));
    }
    // Those of IUnknown and IDispatch come first in an interface of events.
    if ((function->wFuncFlags & FUNCFLAG_FRESTRICTED) == 0) members.push_back(std::move(member));
    for (const BSTR name : names) SysFreeString(name);
    type->ReleaseFuncDesc(function);
  }
  return members;
}

}  // namespace tarnwick::test
