// What our objects share that are reached late-bound only: they stand in no type library and name their
// members themselves.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleauto.h>

#include <span>
#include <utility>

#include "base/RuntimeError.h"
#include "surface/Automation.h"
#include "surface/ComObject.h"
#include "surface/Guard.h"

namespace tarnwick {

struct LateBoundMember {
  const OLECHAR* name;
  DISPID id;
  // Parameters that a caller may name, by position.
  std::span<const OLECHAR* const> parameters = {};
};

// The arguments of one call, by the position of their parameters.
class LateBoundArguments {
 public:
  explicit LateBoundArguments(const DISPPARAMS& arguments) : arguments_(arguments) {}

  // How many the caller gives, of which some may stand for omitted ones.
  UINT Count() const { return arguments_.cArgs; }
  // Null when the argument was omitted.
  const VARIANT* At(UINT parameter) const;

 private:
  const DISPPARAMS& arguments_;
};

// IDispatch::GetIDsOfNames for these members. Names are the same in any letter case.
HRESULT IdsOfNames(std::span<const LateBoundMember> members, LPOLESTR* names, UINT count, DISPID* ids);

// Makes `exception` a run-time error with a description, as scripts show it.
void Describe(const RuntimeError& failure, const OLECHAR* description, EXCEPINFO& exception);

// `Interfaces` have IDispatch among them.
template <typename... Interfaces>
class LateBoundObject : public ComObject<Interfaces...> {
 public:
  STDMETHODIMP GetTypeInfoCount(UINT* count) override {
    if (!count) return E_POINTER;
    *count = 0;
    return S_OK;
  }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo** info) override {
    if (info) *info = nullptr;
    return DISP_E_BADINDEX;
  }
  STDMETHODIMP GetIDsOfNames(REFIID reserved, LPOLESTR* names, UINT count, LCID, DISPID* ids) override {
    if (reserved != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
    return IdsOfNames(Members(), names, count, ids);
  }
  STDMETHODIMP Invoke(DISPID member, REFIID reserved, LCID, WORD flags, DISPPARAMS* arguments,
                      VARIANT* result, EXCEPINFO* exception, UINT*) override {
    if (reserved != IID_NULL) return DISP_E_UNKNOWNINTERFACE;
    if (!arguments) return E_INVALIDARG;
    if (result) VariantInit(result);
    // Script hosts ask for a value as a method or as a property.
    if (!(flags & (DISPATCH_METHOD | DISPATCH_PROPERTYGET))) return DISP_E_MEMBERNOTFOUND;
    // An argument or an item may be an object of the host's, whose code may release this one.
    const ComPtr<IDispatch> alive(this);
    return Guarded([&] {
      try {
        Variant value;
        const HRESULT called = Call(member, LateBoundArguments(*arguments), value);
        if (SUCCEEDED(called) && result) *result = value.Detach();
        return called;
      } catch (const RuntimeError& failure) {
        if (!exception) throw;
        Describe(failure, DescriptionOf(failure.Number()), *exception);
        return DISP_E_EXCEPTION;
      }
    });
  }

 private:
  virtual std::span<const LateBoundMember> Members() const = 0;
  // Calls a member; `result` is empty at first. Throws run-time errors. May run the host's code.
  virtual HRESULT Call(DISPID member, const LateBoundArguments& arguments, Variant& result) = 0;
  // What a script shows for a run-time error that Call throws.
  virtual const OLECHAR* DescriptionOf(std::int32_t number) const = 0;
};

}  // namespace tarnwick
