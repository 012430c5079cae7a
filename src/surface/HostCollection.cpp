#include "surface/HostCollection.h"

#include <array>

#include "base/RuntimeError.h"
#include "surface/Automation.h"
#include "surface/CollectionObject.h"

namespace tarnwick {
namespace {

// An error that a call raised, freed of its texts.
struct Exception : EXCEPINFO {
  Exception() : EXCEPINFO{} {}
  ~Exception() {
    SysFreeString(bstrSource);
    SysFreeString(bstrDescription);
    SysFreeString(bstrHelpFile);
  }
  Exception(const Exception&) = delete;
  Exception& operator=(const Exception&) = delete;
};

}  // namespace

HostCollection::HostCollection(IDispatch** collection) {
  if (!*collection) *collection = new CollectionObject;
  collection_ = ComPtr<IDispatch>(*collection);
  OLECHAR name[] = L"Add";
  OLECHAR* names = name;
  const HRESULT found = collection_->GetIDsOfNames(IID_NULL, &names, 1, LOCALE_USER_DEFAULT, &add_);
  if (FAILED(found)) throw RuntimeError(error::kNoSuchMember);
}

void HostCollection::Add(IUnknown* item, TextView key) const {
  // In reverse order, as automation passes them.
  Variant keyArgument;
  if (!key.empty()) keyArgument.Get() = VariantFromText(key);
  const Variant itemArgument(item);
  std::array<VARIANT, 2> values = {keyArgument.Get(), itemArgument.Get()};
  DISPPARAMS arguments = {values.data(), nullptr, 2, 0};
  if (key.empty()) arguments = {&values[1], nullptr, 1, 0};

  Exception exception;
  const auto call = [&] {
    return collection_->Invoke(add_, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &arguments, nullptr,
                               &exception, nullptr);
  };
  HRESULT result = call();
  if (result == DISP_E_BADPARAMCOUNT && arguments.cArgs == 2) {
    arguments = {&values[1], nullptr, 1, 0};
    result = call();
  }
  if (FAILED(result)) throw RuntimeError(result);
}

}  // namespace tarnwick
