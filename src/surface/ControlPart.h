// What the parts of a control's OLE side share.
#pragma once

#include <utility>

#include "platform/windows/ComPtr.h"
#include "surface/Guard.h"
#include "surface/OleControlHooks.h"

namespace tarnwick {

// Some interfaces of a control. The part has the identity of the control's controlling unknown, and shares
// its life.
template <typename... Interfaces>
class ControlPart : public Interfaces... {
 public:
  explicit ControlPart(OleControlHooks& hooks) : hooks_(hooks) {}
  ControlPart(const ControlPart&) = delete;
  ControlPart& operator=(const ControlPart&) = delete;

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) final {
    return hooks_.Identity().QueryInterface(interfaceId, object);
  }
  STDMETHODIMP_(ULONG) AddRef() final { return hooks_.Identity().AddRef(); }
  STDMETHODIMP_(ULONG) Release() final { return hooks_.Identity().Release(); }

 protected:
  ~ControlPart() = default;

  // For what runs the host's code, which may release the control inside.
  ComPtr<IUnknown> KeptAlive() const { return ComPtr<IUnknown>(&hooks_.Identity()); }

  // Runs body() as an entry of an interface: guarded, and with the control kept alive.
  template <typename Body>
  HRESULT Entered(Body&& body) const noexcept {
    const ComPtr<IUnknown> alive = KeptAlive();
    return Guarded(std::forward<Body>(body));
  }

  OleControlHooks& hooks_;
};

}  // namespace tarnwick
