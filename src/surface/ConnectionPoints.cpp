#include "surface/ConnectionPoints.h"

#include <algorithm>

#include "surface/ComEnumerator.h"
#include "surface/Guard.h"
#include "surface/Module.h"

namespace tarnwick {

std::vector<ComPtr<IUnknown>> ConnectionPoint::Sinks() const {
  std::vector<ComPtr<IUnknown>> sinks;
  sinks.reserve(connections_.size());
  for (const Connection& connection : connections_) sinks.push_back(connection.sink);
  return sinks;
}

STDMETHODIMP ConnectionPoint::QueryInterface(REFIID interfaceId, void** object) {
  if (!object) return E_POINTER;
  *object = interfaceId == IID_IUnknown || interfaceId == IID_IConnectionPoint ? this : nullptr;
  if (!*object) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

STDMETHODIMP ConnectionPoint::GetConnectionInterface(IID* interfaceId) {
  if (!interfaceId) return E_POINTER;
  *interfaceId = interfaceId_;
  return S_OK;
}

STDMETHODIMP ConnectionPoint::GetConnectionPointContainer(IConnectionPointContainer** container) {
  if (!container) return E_POINTER;
  *container = ComPtr<IConnectionPointContainer>(&container_).Detach();
  return S_OK;
}

STDMETHODIMP ConnectionPoint::Advise(IUnknown* sink, DWORD* cookie) {
  if (!sink || !cookie) return E_POINTER;
  *cookie = 0;
  // The sink's code may release the control.
  const ComPtr<IConnectionPoint> alive(this);
  return Guarded([&]() -> HRESULT {
    // A host may offer its sink by the events' identifier or as a plain automation object.
    ComPtr<IUnknown> asked;
    HRESULT offered = sink->QueryInterface(interfaceId_, asked.ReceiveVoid());
    if (FAILED(offered) && interfaceId_ != IID_IPropertyNotifySink)
      offered = sink->QueryInterface(IID_IDispatch, asked.ReceiveVoid());
    if (FAILED(offered)) return CONNECT_E_CANNOTCONNECT;
    connections_.push_back({++lastCookie_, std::move(asked)});
    *cookie = lastCookie_;
    return S_OK;
  });
}

STDMETHODIMP ConnectionPoint::Unadvise(DWORD cookie) {
  const ComPtr<IConnectionPoint> alive(this);
  return Guarded([&] {
    const auto found = std::find_if(connections_.begin(), connections_.end(),
                                    [&](const Connection& known) { return known.cookie == cookie; });
    if (found == connections_.end()) return CONNECT_E_NOCONNECTION;
    // Released last: that may run code of the host's, which may re-enter here.
    const ComPtr<IUnknown> gone = std::move(found->sink);
    connections_.erase(found);
    return S_OK;
  });
}

STDMETHODIMP ConnectionPoint::EnumConnections(IEnumConnections** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return Guarded([&] {
    std::vector<CONNECTDATA> connections;
    connections.reserve(connections_.size());
    for (const Connection& connection : connections_)
      connections.push_back({connection.sink.Get(), connection.cookie});
    *enumerator = new ComEnumerator<IEnumConnections, CONNECTDATA>(std::move(connections));
    return S_OK;
  });
}

void ConnectionPoints::Raise(DISPID id, std::span<VARIANT> arguments) const {
  std::vector<VARIANT> reversed(arguments.rbegin(), arguments.rend());
  DISPPARAMS parameters = {reversed.data(), nullptr, static_cast<UINT>(reversed.size()), 0};
  for (const ComPtr<IUnknown>& sink : events_.Sinks()) {
    // Not asked for IDispatch: an object that listens to several controls has one for each.
    auto* const dispatch = static_cast<IDispatch*>(sink.Get());
    Variant ignored;
    dispatch->Invoke(id, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_METHOD, &parameters, &ignored.Get(), nullptr,
                     nullptr);
  }
}

void ConnectionPoints::NotifyChanged(DISPID property) const {
  for (const ComPtr<IUnknown>& sink : propertyListeners_.Sinks())
    static_cast<IPropertyNotifySink*>(sink.Get())->OnChanged(property);
}

STDMETHODIMP ConnectionPoints::EnumConnectionPoints(IEnumConnectionPoints** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return Entered([&] {
    *enumerator =
        new ComEnumerator<IEnumConnectionPoints, IConnectionPoint*>({&events_, &propertyListeners_});
    return S_OK;
  });
}

STDMETHODIMP ConnectionPoints::FindConnectionPoint(REFIID interfaceId, IConnectionPoint** point) {
  if (!point) return E_POINTER;
  *point = nullptr;
  if (interfaceId == eventInterface_) *point = &events_;
  if (interfaceId == IID_IPropertyNotifySink) *point = &propertyListeners_;
  if (!*point) return CONNECT_E_NOCONNECTION;
  AddRef();
  return S_OK;
}

STDMETHODIMP ConnectionPoints::GetClassInfo(ITypeInfo** info) {
  if (!info) return E_POINTER;
  *info = module::TypeInfo(hooks_.ClassId()).Detach();
  return *info ? S_OK : TYPE_E_CANTLOADLIBRARY;
}

STDMETHODIMP ConnectionPoints::GetGUID(DWORD kind, GUID* guid) {
  if (!guid) return E_POINTER;
  if (kind != GUIDKIND_DEFAULT_SOURCE_DISP_IID) return E_INVALIDARG;
  *guid = eventInterface_;
  return S_OK;
}

}  // namespace tarnwick
