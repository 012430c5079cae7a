// The OLE side of a control: embedding, activation in place, drawing, persistence, events, ambient
// properties. The control itself holds one of these as a part and gives it its own identity.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>
#include <olectl.h>

#include <optional>
#include <span>
#include <string>

#include "platform/windows/ComPtr.h"
#include "surface/ConnectionPoints.h"
#include "surface/Embedding.h"

namespace tarnwick {

// OLEMISC values of our controls: they live inside their container's window and are shown without a frame of
// their own.
inline constexpr DWORD kControlMiscStatus = OLEMISC_RECOMPOSEONRESIZE | OLEMISC_CANTLINKINSIDE |
                                            OLEMISC_INSIDEOUT | OLEMISC_ACTIVATEWHENVISIBLE |
                                            OLEMISC_SETCLIENTSITEFIRST;

// What the container says about itself. A container that does not say leaves the defaults.
struct AmbientValues {
  ComPtr<IFont> font;
  COLORREF backColor = 0;
  COLORREF foreColor = 0;
  bool hasBackColor = false;
  bool hasForeColor = false;
  bool userMode = true;
};

// A property that is kept with the host's form.
struct PersistedProperty {
  const wchar_t* name;
  DISPID id;
  VARTYPE type;
};

// What OleControl needs of the control that it belongs to. None of these is called once the control ends.
class OleControlHooks {
 public:
  virtual ~OleControlHooks() = default;

  // The control as its container sees it; not counted.
  virtual IUnknown& Identity() = 0;
  virtual const CLSID& ClassId() const = 0;

  // The window of the control, created on the first call without a container as its parent; null on failure.
  virtual HWND Window() = 0;
  // Takes the window out of its container and hides it.
  virtual void Park() = 0;
  // Client size of the window in its own pixels, which Draw uses, when its screen has another DPI than the
  // system.
  virtual std::optional<SIZE> SizeOnOtherScreen() = 0;
  // Draws the control as it looks without a window, into `bounds` in pixels of `dc`.
  virtual void Draw(HDC dc, const RECT& bounds) = 0;
  // The container's values have changed, or the control came into another container.
  virtual void AmbientChanged(const AmbientValues& values) = 0;
  // Gives the control's window the keyboard focus.
  virtual void GiveFocus() = 0;
  // Moves the focus to the next stop inside the control, or to the one before; false at the end.
  virtual bool MoveFocus(bool backward) = 0;
  // The container closes the control: what runs ends.
  virtual void Closing() = 0;
  // The container has let go of the control.
  virtual void SiteGone() = 0;

  virtual std::span<const PersistedProperty> Properties() const = 0;
  virtual std::int32_t GetProperty(DISPID id) const = 0;
  virtual void SetProperty(DISPID id, std::int32_t value) = 0;
};

class OleControl final : public IOleObject,
                         public IOleControl,
                         public IOleInPlaceObject,
                         public IOleInPlaceActiveObject,
                         public IViewObject2,
                         public IPersistStreamInit,
                         public IPersistPropertyBag,
                         public IQuickActivate,
                         public IConnectionPointContainer,
                         public IProvideClassInfo2 {
 public:
  // `hooks` is the control that holds this object. `events` is the interface of the control's events,
  // `extent` its size in HIMETRIC until a container gives it another one.
  OleControl(OleControlHooks& hooks, REFIID events, SIZEL extent);
  ~OleControl();
  OleControl(const OleControl&) = delete;
  OleControl& operator=(const OleControl&) = delete;

  // The part that is the interface, without a reference of its own; null when it is none of these.
  void* FindInterface(REFIID interfaceId);

  // Raises an event, unless the container has frozen them.
  void Raise(DISPID event, std::span<VARIANT> arguments);

  // Marks a persisted property as changed: the container saves it, and listeners hear of it.
  void PropertyChanged(DISPID property);

  // What the control looks like has changed; a container that draws it itself draws it anew.
  void ViewChanged();

  // The window got the focus, by a click or a key: the control becomes the active one of its container.
  void Activated();
  // The focus went to a window that is not the control's.
  void LostFocus();

  // IUnknown, of the control
  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;

  // IOleObject
  STDMETHODIMP SetClientSite(IOleClientSite* site) override;
  STDMETHODIMP GetClientSite(IOleClientSite** site) override;
  STDMETHODIMP SetHostNames(LPCOLESTR application, LPCOLESTR object) override;
  STDMETHODIMP Close(DWORD saveOption) override;
  STDMETHODIMP SetMoniker(DWORD which, IMoniker* moniker) override;
  STDMETHODIMP GetMoniker(DWORD assign, DWORD which, IMoniker** moniker) override;
  STDMETHODIMP InitFromData(IDataObject* data, BOOL creation, DWORD reserved) override;
  STDMETHODIMP GetClipboardData(DWORD reserved, IDataObject** data) override;
  STDMETHODIMP DoVerb(LONG verb, LPMSG message, IOleClientSite* site, LONG index, HWND parent,
                      LPCRECT position) override;
  STDMETHODIMP EnumVerbs(IEnumOLEVERB** enumerator) override;
  STDMETHODIMP Update() override;
  STDMETHODIMP IsUpToDate() override;
  STDMETHODIMP GetUserClassID(CLSID* classId) override;
  STDMETHODIMP GetUserType(DWORD form, LPOLESTR* type) override;
  STDMETHODIMP SetExtent(DWORD aspect, SIZEL* himetric) override;
  STDMETHODIMP GetExtent(DWORD aspect, SIZEL* himetric) override;
  STDMETHODIMP Advise(IAdviseSink* sink, DWORD* cookie) override;
  STDMETHODIMP Unadvise(DWORD cookie) override;
  STDMETHODIMP EnumAdvise(IEnumSTATDATA** enumerator) override;
  STDMETHODIMP GetMiscStatus(DWORD aspect, DWORD* status) override;
  STDMETHODIMP SetColorScheme(LOGPALETTE* palette) override;

  // IOleControl
  STDMETHODIMP GetControlInfo(CONTROLINFO* info) override;
  STDMETHODIMP OnMnemonic(MSG* message) override;
  STDMETHODIMP OnAmbientPropertyChange(DISPID property) override;
  STDMETHODIMP FreezeEvents(BOOL freeze) override;

  // IOleWindow, IOleInPlaceObject
  STDMETHODIMP GetWindow(HWND* window) override;
  STDMETHODIMP ContextSensitiveHelp(BOOL enter) override;
  STDMETHODIMP InPlaceDeactivate() override;
  STDMETHODIMP UIDeactivate() override;
  STDMETHODIMP SetObjectRects(LPCRECT position, LPCRECT clip) override;
  STDMETHODIMP ReactivateAndUndo() override;

  // IOleInPlaceActiveObject
  STDMETHODIMP TranslateAccelerator(LPMSG message) override;
  STDMETHODIMP OnFrameWindowActivate(BOOL activate) override;
  STDMETHODIMP OnDocWindowActivate(BOOL activate) override;
  STDMETHODIMP ResizeBorder(LPCRECT border, IOleInPlaceUIWindow* window, BOOL isFrame) override;
  STDMETHODIMP EnableModeless(BOOL enable) override;

  // IViewObject2
  STDMETHODIMP Draw(DWORD aspect, LONG index, void* aspectInfo, DVTARGETDEVICE* target, HDC targetDc, HDC dc,
                    LPCRECTL bounds, LPCRECTL windowBounds, BOOL(STDMETHODCALLTYPE* mayContinue)(ULONG_PTR),
                    ULONG_PTR continueArgument) override;
  STDMETHODIMP GetColorSet(DWORD aspect, LONG index, void* aspectInfo, DVTARGETDEVICE* target, HDC targetDc,
                           LOGPALETTE** colors) override;
  STDMETHODIMP Freeze(DWORD aspect, LONG index, void* aspectInfo, DWORD* freeze) override;
  STDMETHODIMP Unfreeze(DWORD freeze) override;
  STDMETHODIMP SetAdvise(DWORD aspects, DWORD flags, IAdviseSink* sink) override;
  STDMETHODIMP GetAdvise(DWORD* aspects, DWORD* flags, IAdviseSink** sink) override;
  STDMETHODIMP GetExtent(DWORD aspect, LONG index, DVTARGETDEVICE* target, SIZEL* himetric) override;

  // IPersist, IPersistStreamInit, IPersistPropertyBag
  STDMETHODIMP GetClassID(CLSID* classId) override;
  STDMETHODIMP IsDirty() override;
  STDMETHODIMP Load(IStream* stream) override;
  STDMETHODIMP Save(IStream* stream, BOOL clearDirty) override;
  STDMETHODIMP GetSizeMax(ULARGE_INTEGER* size) override;
  STDMETHODIMP InitNew() override;
  STDMETHODIMP Load(IPropertyBag* bag, IErrorLog* log) override;
  STDMETHODIMP Save(IPropertyBag* bag, BOOL clearDirty, BOOL all) override;

  // IQuickActivate
  STDMETHODIMP QuickActivate(QACONTAINER* container, QACONTROL* control) override;
  STDMETHODIMP SetContentExtent(LPSIZEL himetric) override;
  STDMETHODIMP GetContentExtent(LPSIZEL himetric) override;

  // IConnectionPointContainer
  STDMETHODIMP EnumConnectionPoints(IEnumConnectionPoints** enumerator) override;
  STDMETHODIMP FindConnectionPoint(REFIID interfaceId, IConnectionPoint** point) override;

  // IProvideClassInfo2
  STDMETHODIMP GetClassInfo(ITypeInfo** info) override;
  STDMETHODIMP GetGUID(DWORD kind, GUID* guid) override;

 private:
  // For what runs code of the container's or of a listener's: it may release the control inside.
  ComPtr<IUnknown> KeptAlive() const { return ComPtr<IUnknown>(&hooks_.Identity()); }
  // Another interface of the container's site; null when it has none, or when there is no site.
  template <typename Interface>
  ComPtr<Interface> SiteAs() const;

  HRESULT Activate(bool withUi);
  HRESULT ActivateInPlace();
  HRESULT ActivateUi();
  void TakeFocus();
  void Place(const RECT& position, const RECT& clip);
  void ReadAmbientValues();
  bool Ambient(DISPID property, Variant& value) const;
  // The container's own handling of a key that the control does not want.
  HRESULT OfferToSite(MSG& message) const;
  // Tells the container whether the control has the focus.
  void TellFocus(bool focus);

  OleControlHooks& hooks_;
  ConnectionPoint events_;
  ConnectionPoint propertyListeners_;
  Embedding embedding_{*this};
  const IID eventInterface_;

  ComPtr<IOleClientSite> site_;
  ComPtr<IOleInPlaceSite> inPlaceSite_;
  ComPtr<IOleInPlaceFrame> frame_;
  ComPtr<IOleInPlaceUIWindow> document_;
  ComPtr<IOleAdviseHolder> adviseHolder_;
  ComPtr<IAdviseSink> viewSink_;
  DWORD viewAspects_ = 0;
  DWORD viewFlags_ = 0;
  SIZEL extent_;
  bool inPlace_ = false;
  bool uiActive_ = false;
  // False while the form is designed.
  bool userMode_ = true;
  bool hasFocus_ = false;
  bool dirty_ = false;
  int eventsFrozen_ = 0;
};

}  // namespace tarnwick
