// What all our objects with a dual interface share: counting, and late-bound calls through the type library.
#pragma once

#include <atomic>

#include "support/surface/Automation.h"
#include "support/surface/ComPtr.h"
#include "support/surface/Dispatch.h"
#include "support/surface/Module.h"

namespace tarnwick {

// `Interface` is a dual interface of our type library. An object begins with one reference, which its creator
// owns, and keeps the library loaded.
template <typename Interface>
class DualObject : public Interface {
 public:
  DualObject() { module::Hold(); }
  DualObject(const DualObject&) = delete;
  DualObject& operator=(const DualObject&) = delete;

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override {
    if (!object) return E_POINTER;
    *object = FindInterface(interfaceId);
    if (!*object) return E_NOINTERFACE;
    AddRef();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return ++references_; }
  STDMETHODIMP_(ULONG) Release() override {
    const ULONG left = --references_;
    if (left == 0) delete this;
    return left;
  }

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
    return InvokeMember(*Description(), static_cast<Interface*>(this), member, flags, arguments, result,
                        exception, argumentError);
  }

 protected:
  virtual ~DualObject() {
    description_ = {};
    module::LetGo();
  }

  // The part of the object that is the interface, without a reference of its own; null when it has none.
  virtual void* FindInterface(REFIID interfaceId) {
    if (interfaceId == IID_IUnknown || interfaceId == IID_IDispatch || interfaceId == __uuidof(Interface))
      return static_cast<Interface*>(this);
    return nullptr;
  }

 private:
  // Read when the first late-bound call asks for it; most records are only read early-bound, or not at all.
  ITypeInfo* Description() {
    if (!description_) description_ = module::TypeInfo(__uuidof(Interface));
    return description_.Get();
  }

  std::atomic<ULONG> references_{1};
  ComPtr<ITypeInfo> description_;
};

}  // namespace tarnwick
