// What a control's container listens to: the control's own events, and changes of its properties.
#pragma once

#include <olectl.h>

#include <span>
#include <vector>

#include "platform/windows/ComPtr.h"
#include "surface/ControlPart.h"

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

// The connection points of a control.
class ConnectionPoints final : public ControlPart<IConnectionPointContainer, IProvideClassInfo2> {
 public:
  // `events` is the interface of the control's events.
  ConnectionPoints(OleControlHooks& hooks, REFIID events)
      : ControlPart(hooks), eventInterface_(events), events_(*this, events) {}

  ConnectionPoint& Events() { return events_; }
  ConnectionPoint& PropertyListeners() { return propertyListeners_; }

  // Raises event `id` at all sinks, whose code may release the control inside. `arguments` are in the order
  // of the declaration; the caller keeps owning them, and sees what the sinks changed through references. A
  // sink's failure does not keep the others from being called. Throws std::bad_alloc.
  void Raise(DISPID id, std::span<VARIANT> arguments) const;

  // Notifies the listeners, whose code may release the control inside, that `property` has changed. Throws
  // std::bad_alloc.
  void NotifyChanged(DISPID property) const;

  // IConnectionPointContainer
  STDMETHODIMP EnumConnectionPoints(IEnumConnectionPoints** enumerator) override;
  STDMETHODIMP FindConnectionPoint(REFIID interfaceId, IConnectionPoint** point) override;

  // IProvideClassInfo2
  STDMETHODIMP GetClassInfo(ITypeInfo** info) override;
  STDMETHODIMP GetGUID(DWORD kind, GUID* guid) override;

 private:
  const IID eventInterface_;
  ConnectionPoint events_;
  ConnectionPoint propertyListeners_{*this, IID_IPropertyNotifySink};
};

}  // namespace tarnwick
