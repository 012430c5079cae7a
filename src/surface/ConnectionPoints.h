// The two things that a control's container listens to: the control's own events, and changes of its
// properties.
#pragma once

#include <olectl.h>

#include <array>
#include <memory>
#include <span>
#include <vector>

#include "platform/windows/ComPtr.h"
#include "surface/Automation.h"

namespace tarnwick {

// One connection point. It belongs to its control and shares the control's life.
class ConnectionPoint final : public IConnectionPoint {
 public:
  // `container` is the control. `interfaceId` names its events' dispinterface, or IPropertyNotifySink.
  ConnectionPoint(IConnectionPointContainer& container, REFIID interfaceId)
      : container_(container), interfaceId_(interfaceId) {}
  ConnectionPoint(const ConnectionPoint&) = delete;
  ConnectionPoint& operator=(const ConnectionPoint&) = delete;

  // The sinks that listen now, each as the interface of the point; a copy, because a sink may go while it is
  // called.
  std::vector<ComPtr<IUnknown>> Sinks() const;

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return container_.AddRef(); }
  STDMETHODIMP_(ULONG) Release() override { return container_.Release(); }
  STDMETHODIMP GetConnectionInterface(IID* interfaceId) override;
  STDMETHODIMP GetConnectionPointContainer(IConnectionPointContainer** container) override;
  STDMETHODIMP Advise(IUnknown* sink, DWORD* cookie) override;
  STDMETHODIMP Unadvise(DWORD cookie) override;
  STDMETHODIMP EnumConnections(IEnumConnections** enumerator) override;

 private:
  struct Connection {
    DWORD cookie;
    ComPtr<IUnknown> sink;
  };

  IConnectionPointContainer& container_;
  const IID interfaceId_;
  std::vector<Connection> connections_;
  DWORD lastCookie_ = 0;
};

// Raises event `id` at all sinks. `arguments` are in the order of the declaration; the caller keeps owning
// them, and sees what the sinks changed through references. A sink's failure does not keep the others from
// being called.
void RaiseEvent(const ConnectionPoint& events, DISPID id, std::span<VARIANT> arguments);

// Tells the listeners of property changes that `property` has changed.
void NotifyChanged(const ConnectionPoint& listeners, DISPID property);

}  // namespace tarnwick
