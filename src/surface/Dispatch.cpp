#include "surface/Dispatch.h"

#include <vector>

#include "platform/windows/ComPtr.h"
#include "surface/Automation.h"

namespace tarnwick {
namespace {

// The description of one member; freed with its owner.
class MemberDescription {
 public:
  MemberDescription(ITypeInfo& owner, DISPID member, WORD flags) : owner_(owner) {
    for (UINT i = 0; SUCCEEDED(owner_.GetFuncDesc(i, &function_)); ++i) {
      if (function_->memid == member && (function_->invkind & flags)) return;
      Free();
    }
    function_ = nullptr;
  }
  ~MemberDescription() { Free(); }
  MemberDescription(const MemberDescription&) = delete;
  MemberDescription& operator=(const MemberDescription&) = delete;

  // Arguments that a caller may give; the result is none.
  UINT ParameterCount() const {
    UINT count = 0;
    for (int i = 0; function_ && i < function_->cParams; ++i)
      if ((Flags(i) & PARAMFLAG_FRETVAL) == 0) ++count;
    return count;
  }

  bool IsOptional(UINT index) const {
    return index < ParameterCount() && (Flags(static_cast<int>(index)) & PARAMFLAG_FOPT) != 0;
  }

  // What an omitted argument stands for, in `value`, which has the parameter's type without VT_BYREF and is
  // zero.
  HRESULT Default(UINT index, VARIANT& value) const {
    if ((Flags(static_cast<int>(index)) & PARAMFLAG_FHASDEFAULT) == 0) return S_OK;
    VARIANT& known = function_->lprgelemdescParam[index].paramdesc.pparamdescex->varDefaultValue;
    return VariantChangeTypeEx(&value, &known, kConversionLocale, 0, V_VT(&value));
  }

  bool IsKnown() const { return function_ != nullptr; }

  // Type that automation passes for the parameter, VT_BYREF included; VT_EMPTY when there is no such
  // parameter or it is of no interest here.
  VARTYPE ParameterType(UINT index) const {
    if (!function_ || index >= static_cast<UINT>(function_->cParams)) return VT_EMPTY;
    return TypeOf(function_->lprgelemdescParam[index].tdesc);
  }

 private:
  void Free() {
    if (function_) owner_.ReleaseFuncDesc(function_);
    function_ = nullptr;
  }

  USHORT Flags(int index) const { return function_->lprgelemdescParam[index].paramdesc.wParamFlags; }

  VARTYPE TypeOf(const TYPEDESC& type) const {
    if (type.vt == VT_USERDEFINED) return UserDefinedType(type.hreftype);
    if (type.vt != VT_PTR) return type.vt;
    const VARTYPE target = TypeOf(*type.lptdesc);
    // A pointer to an interface is a plain value.
    if (type.lptdesc->vt == VT_USERDEFINED && target == VT_DISPATCH) return VT_DISPATCH;
    return static_cast<VARTYPE>(target | VT_BYREF);
  }

  VARTYPE UserDefinedType(HREFTYPE reference) const {
    ComPtr<ITypeInfo> info;
    TYPEATTR* attributes = nullptr;
    if (FAILED(owner_.GetRefTypeInfo(reference, info.Receive())) || FAILED(info->GetTypeAttr(&attributes)))
      return VT_EMPTY;
    const TYPEKIND kind = attributes->typekind;
    info->ReleaseTypeAttr(attributes);
    // Other kinds do not occur in our interfaces.
    return kind == TKIND_ENUM ? VT_I4 : VT_DISPATCH;
  }

  ITypeInfo& owner_;
  FUNCDESC* function_ = nullptr;
};

// Position in the parameter list of argument `i` (arguments come in reverse order, the named ones first).
UINT ParameterIndex(const DISPPARAMS& arguments, UINT i) {
  if (i >= arguments.cNamedArgs) return arguments.cArgs - 1 - i;
  const DISPID name = arguments.rgdispidNamedArgs[i];
  return name == DISPID_PROPERTYPUT ? 0 : static_cast<UINT>(name);
}

// What scripts pass for an object that is none.
bool MeansNoObject(const VARIANT& argument) {
  return V_VT(&argument) == VT_EMPTY || V_VT(&argument) == VT_NULL;
}

void MakeNoObject(VARIANT& value) {
  V_VT(&value) = VT_DISPATCH;
  V_DISPATCH(&value) = nullptr;
}

bool IsOmitted(const VARIANT& argument) {
  return V_VT(&argument) == VT_ERROR && V_ERROR(&argument) == DISP_E_PARAMNOTFOUND;
}

// A value of a parameter's type that stands in for an argument of another type during a call.
struct StandIn {
  // Where the changed value goes; null when nobody receives it.
  VARIANT* receiver = nullptr;
  Variant value;
  VARIANT before = {};
};

// Fills `standIn` from an argument for a by-reference parameter of `type` (without VT_BYREF).
HRESULT Convert(const VARIANT& argument, VARTYPE type, StandIn& standIn) {
  const bool isVariantReference = V_VT(&argument) == (VT_VARIANT | VT_BYREF);
  const VARIANT& source = isVariantReference ? *V_VARIANTREF(&argument) : argument;
  if (isVariantReference) standIn.receiver = V_VARIANTREF(&argument);
  VARIANT& value = standIn.value.Get();
  if (type == VT_DISPATCH && MeansNoObject(source)) {
    MakeNoObject(value);
  } else {
    const HRESULT result =
        VariantChangeTypeEx(&value, const_cast<VARIANT*>(&source), kConversionLocale, 0, type);
    if (FAILED(result)) return result == E_OUTOFMEMORY ? result : DISP_E_TYPEMISMATCH;
  }
  standIn.before = value;
  return S_OK;
}

// Makes `standIn` what an omitted argument for an optional by-reference parameter of `type` stands for.
HRESULT TakeDefault(const MemberDescription& known, UINT index, VARTYPE type, StandIn& standIn) {
  VARIANT& value = standIn.value.Get();
  V_I8(&value) = 0;
  V_VT(&value) = type;
  return known.Default(index, value);
}

// Address of the value inside a VARIANT, for use as a typed reference.
void MakeReference(VARIANT& reference, VARIANT& target) {
  V_VT(&reference) = static_cast<VARTYPE>(V_VT(&target) | VT_BYREF);
  V_BYREF(&reference) = &V_NONE(&target);
}

// Hands a value that the member changed to the caller's variable; the type of a stand-in never changes. What
// stayed as it was is not written, so that the variable keeps its own type.
void HandBack(StandIn& standIn) {
  if (!standIn.receiver || V_I8(&standIn.before) == V_I8(&standIn.value.Get())) return;
  VariantClear(standIn.receiver);
  *standIn.receiver = standIn.value.Detach();
}

}  // namespace

HRESULT InvokeMember(ITypeInfo& description, void* object, DISPID member, WORD flags, DISPPARAMS* arguments,
                     VARIANT* result, EXCEPINFO* exception, UINT* argumentError) {
  if (!arguments) return E_INVALIDARG;
  // Most calls of a script read a property: there is nothing to prepare.
  if (arguments->cArgs == 0)
    return description.Invoke(object, member, flags, arguments, result, exception, argumentError);
  const MemberDescription known(description, member, flags);
  // Wine: the type information does not find all of the errors that are found here and below.
  if (known.IsKnown() && arguments->cArgs > known.ParameterCount()) return DISP_E_BADPARAMCOUNT;
  const auto refuse = [&](UINT argument, HRESULT error) {
    if (argumentError) *argumentError = argument;
    return error;
  };
  std::vector<VARIANT> values(arguments->rgvarg, arguments->rgvarg + arguments->cArgs);
  std::vector<StandIn> standIns;
  // References into it are taken below, so it must not move.
  standIns.reserve(values.size());
  for (UINT i = 0; i < values.size(); ++i) {
    const UINT index = ParameterIndex(*arguments, i);
    const VARTYPE type = known.ParameterType(index);
    if ((V_VT(&values[i]) & VT_BYREF) != 0 && !V_BYREF(&values[i])) return refuse(i, E_POINTER);
    if (type == VT_DISPATCH && MeansNoObject(values[i])) MakeNoObject(values[i]);
    const bool omitted = IsOmitted(values[i]);
    if (omitted && type != VT_EMPTY && type != VT_VARIANT && !known.IsOptional(index))
      return refuse(i, DISP_E_PARAMNOTOPTIONAL);
    if (!(type & VT_BYREF) || V_VT(&values[i]) == type) continue;
    if (type == (VT_VARIANT | VT_BYREF)) {
      V_VT(&values[i]) = type;
      V_VARIANTREF(&values[i]) = &arguments->rgvarg[i];
      continue;
    }
    StandIn& standIn = standIns.emplace_back();
    const VARTYPE target = type & ~VT_BYREF;
    const HRESULT converted =
        omitted ? TakeDefault(known, index, target, standIn) : Convert(values[i], target, standIn);
    if (FAILED(converted)) return refuse(i, converted);
    MakeReference(values[i], standIn.value.Get());
  }
  DISPPARAMS prepared = *arguments;
  prepared.rgvarg = values.data();
  const HRESULT called =
      description.Invoke(object, member, flags, &prepared, result, exception, argumentError);
  if (SUCCEEDED(called))
    for (StandIn& standIn : standIns) HandBack(standIn);
  return called;
}

}  // namespace tarnwick
