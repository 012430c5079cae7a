#include "surface/Automation.h"

#include <new>

#include "base/RuntimeError.h"
#include "platform/windows/ComPtr.h"

namespace tarnwick {
namespace {

Variant Converted(const VARIANT& value, VARTYPE type) {
  Variant converted;
  const HRESULT result =
      VariantChangeTypeEx(&converted.Get(), const_cast<VARIANT*>(&value), kConversionLocale, 0, type);
  if (result == E_OUTOFMEMORY) throw std::bad_alloc();
  if (FAILED(result)) throw RuntimeError(error::kTypeMismatch);
  return converted;
}

}  // namespace

Variant::Variant(const VARIANT& source) {
  VariantInit(&value_);
  const HRESULT result = VariantCopyInd(&value_, const_cast<VARIANT*>(&source));
  if (result == E_OUTOFMEMORY) throw std::bad_alloc();
  if (FAILED(result)) throw RuntimeError(error::kTypeMismatch);
}

Variant::Variant(IUnknown* object) noexcept {
  VariantInit(&value_);
  ComPtr<IDispatch> dispatch;
  if (!object || FAILED(object->QueryInterface(IID_IDispatch, dispatch.ReceiveVoid()))) return;
  V_VT(&value_) = VT_DISPATCH;
  V_DISPATCH(&value_) = dispatch.Detach();
}

BSTR NewBstr(TextView text) {
  BSTR bstr =
      SysAllocStringLen(reinterpret_cast<const OLECHAR*>(text.data()), static_cast<UINT>(text.size()));
  if (!bstr) throw std::bad_alloc();
  return bstr;
}

void AssignChanged(BSTR* target, TextView text) {
  if (!target || ViewOf(*target) == text) return;
  const BSTR changed = NewBstr(text);
  SysFreeString(*target);
  *target = changed;
}

TextView ViewOf(BSTR text) {
  return {reinterpret_cast<const char16_t*>(text), SysStringLen(text)};
}

Text TextFromVariant(const VARIANT& value) {
  if (V_VT(&value) == VT_ERROR && V_ERROR(&value) == DISP_E_PARAMNOTFOUND) return {};
  return Text(ViewOf(V_BSTR(&Converted(value, VT_BSTR).Get())));
}

std::int32_t NumberFromVariant(const VARIANT& value) {
  return V_I4(&Converted(value, VT_I4).Get());
}

bool BooleanFromVariant(const VARIANT& value) {
  return V_BOOL(&Converted(value, VT_BOOL).Get()) != VARIANT_FALSE;
}

VARIANT VariantFromNumber(std::int32_t number) {
  VARIANT value;
  V_VT(&value) = VT_I4;
  V_I4(&value) = number;
  return value;
}

VARIANT VariantFromText(TextView text) {
  VARIANT value;
  V_VT(&value) = VT_BSTR;
  V_BSTR(&value) = NewBstr(text);
  return value;
}

}  // namespace tarnwick
