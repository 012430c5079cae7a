#include "ControlContainer.h"

#include <algorithm>
#include <atomic>

namespace tarnwick::demo {
namespace {

constexpr int kHimetricPerInch = 2540;

SIZEL HimetricOf(HWND window, const RECT& pixels) {
  const HDC dc = GetDC(window);
  const SIZEL size = {MulDiv(pixels.right - pixels.left, kHimetricPerInch, GetDeviceCaps(dc, LOGPIXELSX)),
                      MulDiv(pixels.bottom - pixels.top, kHimetricPerInch, GetDeviceCaps(dc, LOGPIXELSY))};
  ReleaseDC(window, dc);
  return size;
}

}  // namespace

// --- PropertyBag ---

STDMETHODIMP PropertyBag::QueryInterface(REFIID interfaceId, void** object) {
  *object = interfaceId == IID_IUnknown || interfaceId == IID_IPropertyBag ? this : nullptr;
  if (!*object) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

STDMETHODIMP_(ULONG) PropertyBag::Release() {
  const ULONG left = --references_;
  if (left == 0) delete this;
  return left;
}

STDMETHODIMP PropertyBag::Read(LPCOLESTR name, VARIANT* value, IErrorLog*) {
  const auto found = values.find(name);
  if (found == values.end()) return E_INVALIDARG;
  const VARTYPE wanted = V_VT(value);
  VariantInit(value);
  VARIANT source = found->second.Get();
  return wanted == VT_EMPTY ? VariantCopy(value, &source) : VariantChangeType(value, &source, 0, wanted);
}

STDMETHODIMP PropertyBag::Write(LPCOLESTR name, VARIANT* value) {
  values[name] = Variant(*value);
  return S_OK;
}

// --- Events ---

class ControlContainer::EventSink final : public IDispatch {
 public:
  EventSink(ControlContainer& owner, REFIID events) : owner_(&owner), events_(events) {}

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override {
    *object = interfaceId == IID_IUnknown || interfaceId == IID_IDispatch || interfaceId == events_ ? this
                                                                                                    : nullptr;
    if (!*object) return E_NOINTERFACE;
    AddRef();
    return S_OK;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return ++references_; }
  STDMETHODIMP_(ULONG) Release() override {
    const ULONG left = --references_;
    if (left == 0) delete this;
    return left;
  }
  STDMETHODIMP GetTypeInfoCount(UINT* count) override {
    *count = 0;
    return S_OK;
  }
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID*) override { return E_NOTIMPL; }
  STDMETHODIMP Invoke(DISPID event, REFIID, LCID, WORD, DISPPARAMS* parameters, VARIANT*, EXCEPINFO*,
                      UINT*) override {
    if (!owner_->onEvent) return S_OK;
    std::vector<VARIANT> arguments(parameters->rgvarg, parameters->rgvarg + parameters->cArgs);
    std::reverse(arguments.begin(), arguments.end());
    owner_->onEvent(event, arguments);
    return S_OK;
  }

 private:
  // Events keep the container alive: a handler may close it.
  const ComPtr<ControlContainer> owner_;
  const IID events_;
  std::atomic<ULONG> references_{1};
};

HRESULT ControlContainer::Connect(IUnknown* sink, REFIID interfaceId, DWORD& cookie) const {
  ComPtr<IConnectionPointContainer> points;
  ComPtr<IConnectionPoint> point;
  HRESULT result = control_->QueryInterface(IID_IConnectionPointContainer, points.ReceiveVoid());
  if (SUCCEEDED(result)) result = points->FindConnectionPoint(interfaceId, point.Receive());
  return SUCCEEDED(result) ? point->Advise(sink, &cookie) : result;
}

void ControlContainer::Disconnect(REFIID interfaceId, DWORD cookie) const {
  ComPtr<IConnectionPointContainer> points;
  ComPtr<IConnectionPoint> point;
  if (cookie && SUCCEEDED(control_->QueryInterface(IID_IConnectionPointContainer, points.ReceiveVoid())) &&
      SUCCEEDED(points->FindConnectionPoint(interfaceId, point.Receive())))
    point->Unadvise(cookie);
}

// --- The control's life ---

HRESULT ControlContainer::Create(REFCLSID classId, WayIn wayIn, IPropertyBag* bag) {
  HRESULT result =
      CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, IID_IUnknown, control_.ReceiveVoid());
  if (SUCCEEDED(result)) result = Site(wayIn);
  if (FAILED(result)) return result;

  if (bag) {
    ComPtr<IPersistPropertyBag> persist;
    result = control_->QueryInterface(IID_IPersistPropertyBag, persist.ReceiveVoid());
    if (SUCCEEDED(result)) result = persist->Load(bag, nullptr);
  } else {
    ComPtr<IPersistStreamInit> persist;
    result = control_->QueryInterface(IID_IPersistStreamInit, persist.ReceiveVoid());
    if (SUCCEEDED(result)) result = persist->InitNew();
  }
  if (SUCCEEDED(result)) SetBounds(bounds_);
  return result;
}

HRESULT ControlContainer::TakeUp(IUnknown& control, WayIn wayIn) {
  control_ = ComPtr<IUnknown>(&control);
  const HRESULT result = Site(wayIn);
  if (SUCCEEDED(result)) SetBounds(bounds_);
  return result;
}

HRESULT ControlContainer::Site(WayIn wayIn) {
  ComPtr<IProvideClassInfo2> classInfo;
  HRESULT result = control_->QueryInterface(IID_IOleObject, object_.ReceiveVoid());
  if (SUCCEEDED(result)) result = control_->QueryInterface(IID_IProvideClassInfo2, classInfo.ReceiveVoid());
  if (SUCCEEDED(result)) result = classInfo->GetGUID(GUIDKIND_DEFAULT_SOURCE_DISP_IID, &events_);
  if (FAILED(result)) return result;
  const auto sink = ComPtr<EventSink>::Adopt(new EventSink(*this, events_));

  if (wayIn == WayIn::kQuickActivate) {
    ComPtr<IQuickActivate> quick;
    result = control_->QueryInterface(IID_IQuickActivate, quick.ReceiveVoid());
    if (FAILED(result)) return result;
    QACONTAINER container = {};
    container.cbSize = sizeof container;
    container.pClientSite = this;
    container.pPropertyNotifySink = this;
    container.pUnkEventSink = sink.Get();
    QACONTROL answer = {};
    answer.cbSize = sizeof answer;
    result = quick->QuickActivate(&container, &answer);
    eventCookie_ = answer.dwEventCookie;
    notifyCookie_ = answer.dwPropNotifyCookie;
  } else {
    result = object_->SetClientSite(this);
    if (SUCCEEDED(result)) result = Connect(sink.Get(), events_, eventCookie_);
    if (SUCCEEDED(result))
      result = Connect(static_cast<IPropertyNotifySink*>(this), IID_IPropertyNotifySink, notifyCookie_);
  }
  return result;
}

void ControlContainer::SetBounds(const RECT& bounds) {
  bounds_ = bounds;
  if (!object_) return;
  SIZEL size = HimetricOf(window_, bounds);
  object_->SetExtent(DVASPECT_CONTENT, &size);
  ComPtr<IOleInPlaceObject> inPlace;
  if (inPlace_ && SUCCEEDED(control_->QueryInterface(IID_IOleInPlaceObject, inPlace.ReceiveVoid())))
    inPlace->SetObjectRects(&bounds_, &bounds_);
}

HRESULT ControlContainer::Do(LONG verb) {
  return object_->DoVerb(verb, nullptr, this, 0, window_, &bounds_);
}

bool ControlContainer::TranslateKey(MSG& message) {
  const ComPtr<IOleInPlaceActiveObject> active = active_;
  return active && message.message >= WM_KEYFIRST && message.message <= WM_KEYLAST &&
         active->TranslateAccelerator(&message) == S_OK;
}

void ControlContainer::AmbientChanged(DISPID property) {
  ComPtr<IOleControl> control;
  if (control_ && SUCCEEDED(control_->QueryInterface(IID_IOleControl, control.ReceiveVoid())))
    control->OnAmbientPropertyChange(property);
}

void ControlContainer::Abandon() {
  active_ = {};
  object_ = {};
  control_ = {};
}

ULONG ControlContainer::Close() {
  if (!control_) return 0;
  const ComPtr<ControlContainer> alive(this);
  if (object_) {
    object_->Close(OLECLOSE_NOSAVE);
    Disconnect(events_, std::exchange(eventCookie_, 0));
    Disconnect(IID_IPropertyNotifySink, std::exchange(notifyCookie_, 0));
    object_->SetClientSite(nullptr);
  }
  object_ = {};
  active_ = {};
  return control_.Detach()->Release();
}

STDMETHODIMP ControlContainer::QueryInterface(REFIID id, void** object) {
  *object = nullptr;
  if (id == IID_IUnknown || id == IID_IOleClientSite)
    *object = static_cast<IOleClientSite*>(this);
  else if (id == IID_IOleWindow || id == IID_IOleInPlaceSite)
    *object = static_cast<IOleInPlaceSite*>(this);
  else if (id == IID_IOleInPlaceUIWindow || id == IID_IOleInPlaceFrame)
    *object = static_cast<IOleInPlaceFrame*>(this);
  else if (id == IID_IOleControlSite)
    *object = static_cast<IOleControlSite*>(this);
  else if (id == IID_IPropertyNotifySink)
    *object = static_cast<IPropertyNotifySink*>(this);
  else if (id == IID_IDispatch)
    *object = static_cast<IDispatch*>(this);
  if (!*object) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

STDMETHODIMP_(ULONG) ControlContainer::Release() {
  const ULONG left = --references_;
  if (left == 0) delete this;
  return left;
}

// --- IOleClientSite ---

STDMETHODIMP ControlContainer::SaveObject() {
  Called("SaveObject");
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::GetMoniker(DWORD, DWORD, IMoniker** moniker) {
  *moniker = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::GetContainer(IOleContainer** container) {
  *container = nullptr;
  return E_NOINTERFACE;
}

STDMETHODIMP ControlContainer::ShowObject() {
  Called("ShowObject");
  return S_OK;
}

STDMETHODIMP ControlContainer::OnShowWindow(BOOL) {
  Violation("OnShowWindow: the control has no window of its own outside the container");
  return S_OK;
}

// --- IOleInPlaceSite ---

STDMETHODIMP ControlContainer::GetWindow(HWND* window) {
  *window = window_;
  return S_OK;
}

STDMETHODIMP ControlContainer::ContextSensitiveHelp(BOOL) {
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::OnInPlaceActivate() {
  if (inPlace_) Violation("OnInPlaceActivate twice");
  inPlace_ = true;
  Called("OnInPlaceActivate");
  const HRESULT agreed = onActivate ? onActivate(false) : S_OK;
  if (FAILED(agreed)) inPlace_ = false;
  return agreed;
}

STDMETHODIMP ControlContainer::OnUIActivate() {
  if (!inPlace_) Violation("OnUIActivate before OnInPlaceActivate");
  Called("OnUIActivate");
  return onActivate ? onActivate(true) : S_OK;
}

STDMETHODIMP ControlContainer::GetWindowContext(IOleInPlaceFrame** frame, IOleInPlaceUIWindow** document,
                                                LPRECT position, LPRECT clip, LPOLEINPLACEFRAMEINFO info) {
  *frame = ComPtr<IOleInPlaceFrame>(this).Detach();
  *document = nullptr;
  *position = bounds_;
  *clip = bounds_;
  info->fMDIApp = FALSE;
  info->hwndFrame = GetAncestor(window_, GA_ROOT);
  info->haccel = nullptr;
  info->cAccelEntries = 0;
  return S_OK;
}

STDMETHODIMP ControlContainer::Scroll(SIZE) {
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::OnUIDeactivate(BOOL) {
  Called("OnUIDeactivate");
  return S_OK;
}

STDMETHODIMP ControlContainer::OnInPlaceDeactivate() {
  Called("OnInPlaceDeactivate");
  if (!inPlace_) Violation("OnInPlaceDeactivate without OnInPlaceActivate");
  inPlace_ = false;
  return S_OK;
}

STDMETHODIMP ControlContainer::OnPosRectChange(LPCRECT position) {
  SetBounds(*position);
  return S_OK;
}

// --- IOleInPlaceFrame ---

STDMETHODIMP ControlContainer::GetBorder(LPRECT) {
  return INPLACE_E_NOTOOLSPACE;
}
STDMETHODIMP ControlContainer::RequestBorderSpace(LPCBORDERWIDTHS) {
  return INPLACE_E_NOTOOLSPACE;
}

STDMETHODIMP ControlContainer::SetBorderSpace(LPCBORDERWIDTHS widths) {
  if (widths) Violation("SetBorderSpace with room that was not granted");
  return S_OK;
}

STDMETHODIMP ControlContainer::SetActiveObject(IOleInPlaceActiveObject* object, LPCOLESTR) {
  active_ = ComPtr<IOleInPlaceActiveObject>(object);
  Called("SetActiveObject");
  return S_OK;
}

STDMETHODIMP ControlContainer::InsertMenus(HMENU, LPOLEMENUGROUPWIDTHS) {
  Violation("InsertMenus: a control has no menus");
  return E_NOTIMPL;
}
STDMETHODIMP ControlContainer::SetMenu(HMENU, HOLEMENU, HWND) {
  Violation("SetMenu: a control has no menus");
  return E_NOTIMPL;
}
STDMETHODIMP ControlContainer::RemoveMenus(HMENU) {
  return E_NOTIMPL;
}
STDMETHODIMP ControlContainer::SetStatusText(LPCOLESTR) {
  return S_OK;
}
STDMETHODIMP ControlContainer::EnableModeless(BOOL) {
  return S_OK;
}
STDMETHODIMP ControlContainer::TranslateAccelerator(LPMSG, WORD) {
  return S_FALSE;
}

// --- IOleControlSite ---

STDMETHODIMP ControlContainer::LockInPlaceActive(BOOL) {
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::GetExtendedControl(IDispatch** extended) {
  *extended = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::TransformCoords(POINTL*, POINTF*, DWORD) {
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::TranslateAccelerator(MSG* message, DWORD modifiers) {
  if (onKey && onKey(*message, modifiers)) return S_OK;
  // The dialog keys of the form that the control stands on.
  const HWND form = GetAncestor(window_, GA_ROOT);
  return IsDialogMessageW(form, message) ? S_OK : S_FALSE;
}

STDMETHODIMP ControlContainer::OnFocus(BOOL got) {
  Called("OnFocus");
  hasFocus_ = got != FALSE;
  return S_OK;
}

// --- IPropertyNotifySink ---

STDMETHODIMP ControlContainer::OnChanged(DISPID property) {
  changed.push_back(property);
  return S_OK;
}

STDMETHODIMP ControlContainer::OnRequestEdit(DISPID) {
  return S_OK;
}

// --- Ambient properties ---

STDMETHODIMP ControlContainer::GetTypeInfoCount(UINT* count) {
  *count = 0;
  return S_OK;
}
STDMETHODIMP ControlContainer::GetTypeInfo(UINT, LCID, ITypeInfo**) {
  return E_NOTIMPL;
}
STDMETHODIMP ControlContainer::GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID*) {
  return E_NOTIMPL;
}

STDMETHODIMP ControlContainer::Invoke(DISPID property, REFIID, LCID, WORD, DISPPARAMS*, VARIANT* result,
                                      EXCEPINFO*, UINT*) {
  if (!result) return E_POINTER;
  Called("Ambient");
  VariantInit(result);
  switch (property) {
    case DISPID_AMBIENT_FONT:
      if (!ambient.font) return DISP_E_MEMBERNOTFOUND;
      V_VT(result) = VT_DISPATCH;
      V_DISPATCH(result) = ComPtr<IDispatch>(ambient.font.Get()).Detach();
      return S_OK;
    case DISPID_AMBIENT_BACKCOLOR:
    case DISPID_AMBIENT_FORECOLOR:
      *result = VariantFromNumber(static_cast<std::int32_t>(
          property == DISPID_AMBIENT_BACKCOLOR ? ambient.backColor : ambient.foreColor));
      return S_OK;
    case DISPID_AMBIENT_USERMODE:
      V_VT(result) = VT_BOOL;
      V_BOOL(result) = AutomationBoolean(ambient.userMode);
      return S_OK;
    default:
      return DISP_E_MEMBERNOTFOUND;
  }
}

}  // namespace tarnwick::demo
