// What all our objects with a dual interface share: late-bound calls through the type library.
#pragma once

#include "platform/windows/ComPtr.h"
#include "surface/Automation.h"
#include "surface/ComObject.h"
#include "surface/Dispatch.h"
#include "surface/Guard.h"
#include "surface/Module.h"

namespace tarnwick {

// `Interface` is a dual interface of our type library.
template <typename Interface>
class DualObject : public ComObject<Interface> {
 public:
  STDMETHODIMP GetTypeInfoCount(UINT* count) override {
    if (!count) return E_POINTER;
    *count = 1;
    return S_OK;
  }
  STDMETHODIMP GetTypeInfo(UINT index, LCID, ITypeInfo** info) override {
    if (!info) return E_POINTER;
    *info = nullptr;
    if (index != 0) return DISP_E_BADINDEX;
    *info = ComPtr<ITypeInfo>(Description()).Detach();
    return *info ? S_OK : TYPE_E_CANTLOADLIBRARY;
  }
  STDMETHODIMP GetIDsOfNames(REFIID reserved, LPOLESTR* names, UINT count, LCID, DISPID* ids) override {
    if (reserved != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
    if (!Description()) return TYPE_E_CANTLOADLIBRARY;
    return Description()->GetIDsOfNames(names, count, ids);
  }
  STDMETHODIMP Invoke(DISPID member, REFIID reserved, LCID, WORD flags, DISPPARAMS* arguments,
                      VARIANT* result, EXCEPINFO* exception, UINT* argumentError) override {
    if (reserved != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
    if (!Description()) return TYPE_E_CANTLOADLIBRARY;
    // The host's code may run inside and release its last reference.
    const ComPtr<Interface> alive(this);
    return Guarded([&] {
      return InvokeMember(*Description(), static_cast<Interface*>(this), member, flags, arguments, result,
                          exception, argumentError);
    });
  }

 protected:
  void* FindInterface(REFIID interfaceId) override {
    if (interfaceId == IID_IDispatch) return static_cast<Interface*>(this);
    return ComObject<Interface>::FindInterface(interfaceId);
  }

 private:
  // Read when the first late-bound call asks for it; most records are only read early-bound, or not at all.
  ITypeInfo* Description() {
    if (!description_) description_ = module::TypeInfo(__uuidof(Interface));
    return description_.Get();
  }

  ComPtr<ITypeInfo> description_;
};

}  // namespace tarnwick
