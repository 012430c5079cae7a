// What all our COM objects share: counting, their interfaces, and the hold on the library.
#pragma once

#include <atomic>

#include "platform/windows/ComPtr.h"
#include "surface/Module.h"

namespace tarnwick {

// An object with these interfaces, of which the first one is its identity. It begins with one reference,
// which its creator owns, and keeps the library loaded until all of it is gone.
template <typename First, typename... Rest>
class ComObject : public First, public Rest... {
 public:
  ComObject() { module::Hold(); }
  ComObject(const ComObject&) = delete;
  ComObject& operator=(const ComObject&) = delete;

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
    if (left != 0) return left;
    // Whoever references the object once more while it is destroyed must not destroy it again.
    references_ = kDestroying;
    delete this;
    return 0;
  }

 protected:
  // Runs after the members of the object are gone.
  virtual ~ComObject() { module::LetGo(); }

  // The part of the object that is the interface, without a reference of its own; null when it has none.
  virtual void* FindInterface(REFIID interfaceId) {
    if (interfaceId == IID_IUnknown || interfaceId == __uuidof(First)) return static_cast<First*>(this);
    void* found = nullptr;
    ((found = found || interfaceId != __uuidof(Rest) ? found : static_cast<Rest*>(this)), ...);
    return found;
  }

 private:
  static constexpr ULONG kDestroying = 1UL << 30;
  std::atomic<ULONG> references_{1};
};

}  // namespace tarnwick
