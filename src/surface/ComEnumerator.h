// An enumerator over a copy of a list, for the enumerator interfaces of COM that all have the same four
// methods.
#pragma once

#include <ocidl.h>

#include <algorithm>
#include <utility>
#include <vector>

#include "surface/Automation.h"
#include "surface/ComObject.h"
#include "surface/Guard.h"

namespace tarnwick {

// How an enumerator keeps and hands out an element: Keep makes it the enumerator's own, Free releases it.
inline void Keep(VARIANT& value) {
  Variant copy(value);
  value = copy.Detach();
}
inline void Free(VARIANT& value) {
  VariantClear(&value);
}
inline void Keep(CONNECTDATA& connection) {
  connection.pUnk->AddRef();
}
inline void Free(CONNECTDATA& connection) {
  connection.pUnk->Release();
}
inline void Keep(IConnectionPoint* point) {
  point->AddRef();
}
inline void Free(IConnectionPoint* point) {
  point->Release();
}

// Ours have no target device, which would have to be copied.
inline void Keep(FORMATETC&) {}
inline void Free(FORMATETC&) {}

template <typename Interface, typename Element>
class ComEnumerator final : public ComObject<Interface> {
 public:
  // Takes references of its own to the elements. Throws what copying throws.
  explicit ComEnumerator(std::vector<Element> elements, std::size_t next = 0)
      : elements_(std::move(elements)), next_(next) {
    std::size_t kept = 0;
    try {
      for (; kept < elements_.size(); ++kept) Keep(elements_[kept]);
    } catch (...) {
      while (kept > 0) Free(elements_[--kept]);
      throw;
    }
  }

  STDMETHODIMP Next(ULONG count, Element* elements, ULONG* fetched) override {
    if (!elements || (!fetched && count != 1)) return E_POINTER;
    ULONG done = 0;
    const HRESULT result = Guarded([&] {
      for (; done < count && next_ < elements_.size(); ++done, ++next_) {
        Element copy = elements_[next_];
        Keep(copy);
        elements[done] = copy;
      }
      return done == count ? S_OK : S_FALSE;
    });
    if (fetched) *fetched = done;
    return result;
  }
  STDMETHODIMP Skip(ULONG count) override {
    const std::size_t step = std::min<std::size_t>(count, elements_.size() - next_);
    next_ += step;
    return step == count ? S_OK : S_FALSE;
  }
  STDMETHODIMP Reset() override {
    next_ = 0;
    return S_OK;
  }
  STDMETHODIMP Clone(Interface** clone) override {
    if (!clone) return E_POINTER;
    *clone = nullptr;
    return Guarded([&] {
      *clone = new ComEnumerator(elements_, next_);
      return S_OK;
    });
  }

 private:
  ~ComEnumerator() override {
    for (Element& element : elements_) Free(element);
  }

  std::vector<Element> elements_;
  std::size_t next_;
};

}  // namespace tarnwick
