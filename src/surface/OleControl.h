// The OLE side of a control: its place in a container, activation, keys, ambient values. The control itself
// holds one of these as a part and gives it its own identity; persistence, drawing and events are parts of
// this one.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>
#include <olectl.h>

#include <span>

#include "surface/ConnectionPoints.h"
#include "surface/ControlPart.h"
#include "surface/Persistence.h"
#include "surface/View.h"

namespace tarnwick {

// OLEMISC values of our controls: they live inside their container's window and are shown without a frame of
// their own.
inline constexpr DWORD kControlMiscStatus = OLEMISC_RECOMPOSEONRESIZE | OLEMISC_CANTLINKINSIDE |
                                            OLEMISC_INSIDEOUT | OLEMISC_ACTIVATEWHENVISIBLE |
                                            OLEMISC_SETCLIENTSITEFIRST;

class OleControl final : public ControlPart<IOleObject, IOleControl, IOleInPlaceObject,
                                            IOleInPlaceActiveObject, IQuickActivate> {
 public:
  // `hooks` is the control that holds this object. `events` is the interface of the control's events,
  // `extent` its size in HIMETRIC until a container gives it another one.
  OleControl(OleControlHooks& hooks, REFIID events, const SIZEL& extent)
      : ControlPart(hooks), points_(hooks, events), persistence_(hooks), view_(hooks, extent) {}

  // The part that is the interface, without a reference of its own; null when it is none of these.
  void* FindInterface(REFIID interfaceId);

  // Each of these runs the host's code, which may release the control inside. The caller keeps it alive.

  // Raises an event, unless the container has frozen them.
  void Raise(DISPID event, std::span<VARIANT> arguments);
  // Marks a persisted property as changed: the container saves it, and listeners are notified.
  void PropertyChanged(DISPID property);
  // Notifies a container that draws the control itself that it looks different.
  void ViewChanged() { view_.NotifyChanged(); }
  // The window got the focus, by a click or a key: the control becomes the active one of its container.
  void Activated();
  // The focus went to a window that is not the control's.
  void LostFocus() { NotifyFocus(false); }

  // The entries that set a site, activate, deactivate, close, translate a key or subscribe run the
  // container's code, and may pump messages through it. They keep the control alive.

  // IOleObject
  STDMETHODIMP SetClientSite(IOleClientSite* site) override;
  STDMETHODIMP GetClientSite(IOleClientSite** site) override;
  STDMETHODIMP SetHostNames(LPCOLESTR, LPCOLESTR) override { return S_OK; }
  STDMETHODIMP Close(DWORD saveOption) override;
  STDMETHODIMP SetMoniker(DWORD, IMoniker*) override { return E_NOTIMPL; }
  STDMETHODIMP GetMoniker(DWORD assign, DWORD which, IMoniker** moniker) override;
  STDMETHODIMP InitFromData(IDataObject*, BOOL, DWORD) override { return E_NOTIMPL; }
  STDMETHODIMP GetClipboardData(DWORD reserved, IDataObject** data) override;
  STDMETHODIMP DoVerb(LONG verb, LPMSG message, IOleClientSite* site, LONG index, HWND parent,
                      LPCRECT position) override;
  STDMETHODIMP EnumVerbs(IEnumOLEVERB** enumerator) override;
  STDMETHODIMP Update() override { return S_OK; }
  STDMETHODIMP IsUpToDate() override { return S_OK; }
  STDMETHODIMP GetUserClassID(CLSID* classId) override { return persistence_.GetClassID(classId); }
  STDMETHODIMP GetUserType(DWORD form, LPOLESTR* type) override;
  STDMETHODIMP SetExtent(DWORD aspect, SIZEL* himetric) override;
  STDMETHODIMP GetExtent(DWORD aspect, SIZEL* himetric) override {
    return view_.GetExtent(aspect, -1, nullptr, himetric);
  }
  STDMETHODIMP Advise(IAdviseSink* sink, DWORD* cookie) override;
  STDMETHODIMP Unadvise(DWORD cookie) override;
  STDMETHODIMP EnumAdvise(IEnumSTATDATA** enumerator) override;
  STDMETHODIMP GetMiscStatus(DWORD aspect, DWORD* status) override;
  STDMETHODIMP SetColorScheme(LOGPALETTE*) override { return E_NOTIMPL; }

  // IOleControl
  STDMETHODIMP GetControlInfo(CONTROLINFO* info) override;
  STDMETHODIMP OnMnemonic(MSG*) override { return S_OK; }
  STDMETHODIMP OnAmbientPropertyChange(DISPID property) override;
  STDMETHODIMP FreezeEvents(BOOL freeze) override;

  // IOleWindow, IOleInPlaceObject
  STDMETHODIMP GetWindow(HWND* window) override;
  STDMETHODIMP ContextSensitiveHelp(BOOL) override { return E_NOTIMPL; }
  STDMETHODIMP InPlaceDeactivate() override;
  STDMETHODIMP UIDeactivate() override;
  STDMETHODIMP SetObjectRects(LPCRECT position, LPCRECT clip) override;
  STDMETHODIMP ReactivateAndUndo() override { return E_NOTIMPL; }

  // IOleInPlaceActiveObject
  STDMETHODIMP TranslateAccelerator(LPMSG message) override;
  STDMETHODIMP OnFrameWindowActivate(BOOL) override { return S_OK; }
  STDMETHODIMP OnDocWindowActivate(BOOL activate) override;
  STDMETHODIMP ResizeBorder(LPCRECT, IOleInPlaceUIWindow*, BOOL) override { return S_OK; }
  STDMETHODIMP EnableModeless(BOOL) override { return S_OK; }

  // IQuickActivate
  STDMETHODIMP QuickActivate(QACONTAINER* container, QACONTROL* control) override;
  STDMETHODIMP SetContentExtent(LPSIZEL himetric) override { return SetExtent(DVASPECT_CONTENT, himetric); }
  STDMETHODIMP GetContentExtent(LPSIZEL himetric) override { return GetExtent(DVASPECT_CONTENT, himetric); }

 private:
  // Another interface of the container's site; null when it has none, or when there is no site.
  template <typename Interface>
  ComPtr<Interface> SiteAs() const;

  // All below run the container's code, and some change the focus or the place of the window, which runs the
  // code of whatever window notices. The control is kept alive by the entries that call them.
  HRESULT Activate(bool withUi);
  HRESULT ActivateInPlace();
  HRESULT ActivateUi();
  void TakeFocus();
  void Place(const RECT& position, const RECT& clip);
  void ReadAmbientValues();
  // The container's own handling of a key that the control does not want.
  HRESULT OfferToSite(MSG& message) const;
  // Notifies the container whether the control has the focus.
  void NotifyFocus(bool focus);

  ConnectionPoints points_;
  Persistence persistence_;
  View view_;

  ComPtr<IOleClientSite> site_;
  ComPtr<IOleInPlaceSite> inPlaceSite_;
  ComPtr<IOleInPlaceFrame> frame_;
  ComPtr<IOleInPlaceUIWindow> document_;
  ComPtr<IOleAdviseHolder> adviseHolder_;
  bool inPlace_ = false;
  bool uiActive_ = false;
  // False while the form is designed.
  bool userMode_ = true;
  bool hasFocus_ = false;
  int eventsFrozen_ = 0;
};

}  // namespace tarnwick
