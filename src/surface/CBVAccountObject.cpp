#include "surface/CBVAccountObject.h"

#include "surface/Guard.h"

namespace tarnwick {
namespace {

HRESULT GetVariant(const Variant& variant, VARIANT* value) noexcept {
  if (!value) return E_POINTER;
  VariantInit(value);
  return Guarded([&] {
    *value = Variant(variant.Get()).Detach();
    return S_OK;
  });
}

HRESULT PutVariant(Variant& variant, const VARIANT& value) noexcept {
  return Guarded([&] {
    variant = Variant(value);
    return S_OK;
  });
}

}  // namespace

CBVAccountObject::CBVAccountObject(const CBVAccount& account) : account_(account) {
  usedQuota_.Get() = VariantFromText(account.UsedQuota);
  quota_.Get() = VariantFromText(account.Quota);
}

STDMETHODIMP CBVAccountObject::get_ServiceLevelName(BSTR* value) {
  return GetText(account_.ServiceLevelName, value);
}
STDMETHODIMP CBVAccountObject::put_ServiceLevelName(BSTR value) {
  return PutText(account_.ServiceLevelName, value);
}
STDMETHODIMP CBVAccountObject::get_ExpiryPeriod(LONG* value) {
  return GetNumber<LONG>(account_.ExpiryPeriod, value);
}

STDMETHODIMP CBVAccountObject::put_ExpiryPeriod(LONG value) {
  account_.ExpiryPeriod = value;
  return S_OK;
}

STDMETHODIMP CBVAccountObject::get_CurrentDate(BSTR* value) {
  return GetText(account_.CurrentDate, value);
}
STDMETHODIMP CBVAccountObject::put_CurrentDate(BSTR value) {
  return PutText(account_.CurrentDate, value);
}
STDMETHODIMP CBVAccountObject::get_StartDate(BSTR* value) {
  return GetText(account_.StartDate, value);
}
STDMETHODIMP CBVAccountObject::put_StartDate(BSTR value) {
  return PutText(account_.StartDate, value);
}
STDMETHODIMP CBVAccountObject::get_UsedQuota(VARIANT* value) {
  return GetVariant(usedQuota_, value);
}
STDMETHODIMP CBVAccountObject::put_UsedQuota(VARIANT value) {
  return PutVariant(usedQuota_, value);
}
STDMETHODIMP CBVAccountObject::get_Quota(VARIANT* value) {
  return GetVariant(quota_, value);
}
STDMETHODIMP CBVAccountObject::put_Quota(VARIANT value) {
  return PutVariant(quota_, value);
}
STDMETHODIMP CBVAccountObject::get_EmailAddress(BSTR* value) {
  return GetText(account_.EmailAddress, value);
}
STDMETHODIMP CBVAccountObject::put_EmailAddress(BSTR value) {
  return PutText(account_.EmailAddress, value);
}

}  // namespace tarnwick
