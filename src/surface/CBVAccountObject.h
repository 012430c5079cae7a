// CBVAccount as hosts see it.
#pragma once

#include "service/CBVAccount.h"
#include "surface/DualObject.h"
#include "surface/TypeLibrary.h"

namespace tarnwick {

class CBVAccountObject final : public DualObject<_CBVAccount> {
 public:
  CBVAccountObject() = default;
  // A copy of the details; the quotas carry the service's texts.
  explicit CBVAccountObject(const CBVAccount& account);

  STDMETHODIMP get_ServiceLevelName(BSTR* value) override;
  STDMETHODIMP put_ServiceLevelName(BSTR value) override;
  STDMETHODIMP get_ExpiryPeriod(LONG* value) override;
  STDMETHODIMP put_ExpiryPeriod(LONG value) override;
  STDMETHODIMP get_CurrentDate(BSTR* value) override;
  STDMETHODIMP put_CurrentDate(BSTR value) override;
  STDMETHODIMP get_StartDate(BSTR* value) override;
  STDMETHODIMP put_StartDate(BSTR value) override;
  STDMETHODIMP get_UsedQuota(VARIANT* value) override;
  STDMETHODIMP put_UsedQuota(VARIANT value) override;
  STDMETHODIMP get_Quota(VARIANT* value) override;
  STDMETHODIMP put_Quota(VARIANT value) override;
  STDMETHODIMP get_EmailAddress(BSTR* value) override;
  STDMETHODIMP put_EmailAddress(BSTR value) override;

 private:
  CBVAccount account_;
  // Hosts may put any value here.
  Variant usedQuota_;
  Variant quota_;
};

}  // namespace tarnwick
