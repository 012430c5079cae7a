#include "surface/OleControl.h"

#include <utility>

#include "platform/windows/SystemDpi.h"
#include "surface/ComEnumerator.h"
#include "surface/Guard.h"
#include "surface/Module.h"
#include "surface/TypeLibrary.h"

namespace tarnwick {
namespace {

constexpr int kHimetricPerInch = 2540;
constexpr std::uint32_t kStreamVersion = 1;

bool IsContent(DWORD aspect) {
  return aspect == DVASPECT_CONTENT;
}

// Calls a method of what the call itself may replace or release, which stays until it returns. Null is not
// called.
template <typename Interface, typename Method, typename... Arguments>
HRESULT CallHeld(ComPtr<Interface> called, Method method, Arguments... arguments) {
  return called ? (called.Get()->*method)(arguments...) : S_OK;
}

// What a property becomes whose kept value is `number`: the default, if it cannot hold that.
std::int32_t HeldBy(const PersistedProperty& property, std::int32_t number) {
  return property.type == VT_I2 && number != static_cast<SHORT>(number) ? 0 : number;
}

// Whether a key that was pressed in a window of the control is the control's, although containers have uses
// for it as a dialog key or an accelerator.
bool Wants(const MSG& key) {
  switch (key.wParam) {
    case VK_TAB:
      return false;
    case VK_UP:
    case VK_DOWN:
    case VK_LEFT:
    case VK_RIGHT:
    case VK_PRIOR:
    case VK_NEXT:
    case VK_HOME:
    case VK_END:
    case VK_RETURN:
      return true;
    default: {
      // While a label is edited, Escape ends that and Delete deletes a letter.
      const LRESULT wanted =
          SendMessageW(key.hwnd, WM_GETDLGCODE, key.wParam, reinterpret_cast<LPARAM>(&key));
      return (wanted & DLGC_WANTALLKEYS) != 0;
    }
  }
}

}  // namespace

OleControl::OleControl(OleControlHooks& hooks, REFIID events, SIZEL extent)
    : hooks_(hooks),
      events_(*this, events),
      propertyListeners_(*this, IID_IPropertyNotifySink),
      eventInterface_(events),
      extent_(extent) {}

OleControl::~OleControl() = default;

template <typename Interface>
ComPtr<Interface> OleControl::SiteAs() const {
  const ComPtr<IOleClientSite> site = site_;
  ComPtr<Interface> found;
  if (site) site->QueryInterface(__uuidof(Interface), found.ReceiveVoid());
  return found;
}

void* OleControl::FindInterface(REFIID id) {
  if (id == IID_IOleObject) return static_cast<IOleObject*>(this);
  if (id == IID_IOleControl) return static_cast<IOleControl*>(this);
  if (id == IID_IOleWindow || id == IID_IOleInPlaceObject) return static_cast<IOleInPlaceObject*>(this);
  if (id == IID_IOleInPlaceActiveObject) return static_cast<IOleInPlaceActiveObject*>(this);
  if (id == IID_IViewObject || id == IID_IViewObject2) return static_cast<IViewObject2*>(this);
  // Begins with all of IPersistStream.
  if (id == IID_IPersist || id == IID_IPersistStream || id == IID_IPersistStreamInit)
    return static_cast<IPersistStreamInit*>(this);
  if (id == IID_IPersistStorage) return static_cast<IPersistStorage*>(&embedding_);
  if (id == IID_IDataObject) return static_cast<IDataObject*>(&embedding_);
  if (id == IID_IPersistPropertyBag) return static_cast<IPersistPropertyBag*>(this);
  if (id == IID_IQuickActivate) return static_cast<IQuickActivate*>(this);
  if (id == IID_IConnectionPointContainer) return static_cast<IConnectionPointContainer*>(this);
  if (id == IID_IProvideClassInfo || id == IID_IProvideClassInfo2)
    return static_cast<IProvideClassInfo2*>(this);
  return nullptr;
}

void OleControl::Raise(DISPID event, std::span<VARIANT> arguments) {
  if (eventsFrozen_ > 0) return;
  ResultAsItStood(0, [&](int&) { RaiseEvent(events_, event, arguments); });
}

void OleControl::PropertyChanged(DISPID property) {
  dirty_ = true;
  ResultAsItStood(0, [&](int&) { NotifyChanged(propertyListeners_, property); });
}

void OleControl::ViewChanged() {
  const ComPtr<IUnknown> alive = KeptAlive();
  embedding_.ViewChanged();
  const ComPtr<IAdviseSink> sink = viewSink_;
  if (sink && (viewAspects_ & DVASPECT_CONTENT)) {
    if (viewFlags_ & ADVF_ONLYONCE) viewSink_ = {};
    sink->OnViewChange(DVASPECT_CONTENT, -1);
  }
}

void OleControl::Activated() {
  if (!userMode_) return;
  if (inPlace_ && !uiActive_) ActivateUi();
  TellFocus(true);
}

void OleControl::LostFocus() {
  TellFocus(false);
}

void OleControl::TellFocus(bool focus) {
  if (std::exchange(hasFocus_, focus) != focus)
    CallHeld(SiteAs<IOleControlSite>(), &IOleControlSite::OnFocus, focus);
}

STDMETHODIMP OleControl::QueryInterface(REFIID interfaceId, void** object) {
  return hooks_.Identity().QueryInterface(interfaceId, object);
}
STDMETHODIMP_(ULONG) OleControl::AddRef() {
  return hooks_.Identity().AddRef();
}
STDMETHODIMP_(ULONG) OleControl::Release() {
  return hooks_.Identity().Release();
}

// --- IOleObject ---

STDMETHODIMP OleControl::SetClientSite(IOleClientSite* site) {
  const ComPtr<IUnknown> alive = KeptAlive();
  if (!site) InPlaceDeactivate();
  site_ = ComPtr<IOleClientSite>(site);
  if (site_)
    ReadAmbientValues();
  else
    hooks_.SiteGone();
  return S_OK;
}

STDMETHODIMP OleControl::GetClientSite(IOleClientSite** site) {
  if (!site) return E_POINTER;
  *site = ComPtr<IOleClientSite>(site_).Detach();
  return S_OK;
}

STDMETHODIMP OleControl::SetHostNames(LPCOLESTR, LPCOLESTR) {
  return S_OK;
}

STDMETHODIMP OleControl::Close(DWORD saveOption) {
  const ComPtr<IUnknown> alive = KeptAlive();
  hooks_.Closing();
  InPlaceDeactivate();
  if (saveOption != OLECLOSE_NOSAVE && dirty_) CallHeld(site_, &IOleClientSite::SaveObject);
  CallHeld(adviseHolder_, &IOleAdviseHolder::SendOnClose);
  return S_OK;
}

STDMETHODIMP OleControl::SetMoniker(DWORD, IMoniker*) {
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::GetMoniker(DWORD, DWORD, IMoniker** moniker) {
  if (moniker) *moniker = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::InitFromData(IDataObject*, BOOL, DWORD) {
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::GetClipboardData(DWORD, IDataObject** data) {
  if (data) *data = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::DoVerb(LONG verb, LPMSG, IOleClientSite* site, LONG, HWND, LPCRECT) {
  const ComPtr<IUnknown> alive = KeptAlive();
  if (!site_ && site) SetClientSite(site);
  switch (verb) {
    case OLEIVERB_PRIMARY:
    case OLEIVERB_SHOW:
      // While a form is designed, the control takes no keyboard for being shown.
      return Activate(userMode_);
    case OLEIVERB_UIACTIVATE:
      return Activate(true);
    case OLEIVERB_INPLACEACTIVATE:
      return Activate(false);
    case OLEIVERB_HIDE:
      UIDeactivate();
      if (inPlace_) ShowWindow(hooks_.Window(), SW_HIDE);
      return S_OK;
    default:
      return verb > 0 ? OLEOBJ_S_INVALIDVERB : E_NOTIMPL;
  }
}

STDMETHODIMP OleControl::EnumVerbs(IEnumOLEVERB** enumerator) {
  return OleRegEnumVerbs(hooks_.ClassId(), enumerator);
}

STDMETHODIMP OleControl::Update() {
  return S_OK;
}
STDMETHODIMP OleControl::IsUpToDate() {
  return S_OK;
}

STDMETHODIMP OleControl::GetUserClassID(CLSID* classId) {
  return GetClassID(classId);
}

STDMETHODIMP OleControl::GetUserType(DWORD form, LPOLESTR* type) {
  return OleRegGetUserType(hooks_.ClassId(), form, type);
}

STDMETHODIMP OleControl::SetExtent(DWORD aspect, SIZEL* himetric) {
  if (!himetric) return E_POINTER;
  if (!IsContent(aspect)) return DV_E_DVASPECT;
  extent_ = *himetric;
  ViewChanged();
  return S_OK;
}

STDMETHODIMP OleControl::GetExtent(DWORD aspect, SIZEL* himetric) {
  if (!himetric) return E_POINTER;
  if (!IsContent(aspect)) return DV_E_DVASPECT;
  *himetric = extent_;
  return S_OK;
}

STDMETHODIMP OleControl::Advise(IAdviseSink* sink, DWORD* cookie) {
  if (!adviseHolder_) {
    const HRESULT made = CreateOleAdviseHolder(adviseHolder_.Receive());
    if (FAILED(made)) return made;
  }
  return CallHeld(adviseHolder_, &IOleAdviseHolder::Advise, sink, cookie);
}

STDMETHODIMP OleControl::Unadvise(DWORD cookie) {
  return adviseHolder_ ? CallHeld(adviseHolder_, &IOleAdviseHolder::Unadvise, cookie) : OLE_E_NOCONNECTION;
}

STDMETHODIMP OleControl::EnumAdvise(IEnumSTATDATA** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return adviseHolder_ ? adviseHolder_->EnumAdvise(enumerator) : S_OK;
}

STDMETHODIMP OleControl::GetMiscStatus(DWORD aspect, DWORD* status) {
  if (!status) return E_POINTER;
  *status = IsContent(aspect) ? kControlMiscStatus : 0;
  return S_OK;
}

STDMETHODIMP OleControl::SetColorScheme(LOGPALETTE*) {
  return E_NOTIMPL;
}

// --- IOleControl ---

STDMETHODIMP OleControl::GetControlInfo(CONTROLINFO* info) {
  if (!info) return E_POINTER;
  // Enter opens the selected item.
  *info = {sizeof(CONTROLINFO), nullptr, 0, CTRLINFO_EATS_RETURN};
  return S_OK;
}

STDMETHODIMP OleControl::OnMnemonic(MSG*) {
  return S_OK;
}

STDMETHODIMP OleControl::OnAmbientPropertyChange(DISPID) {
  const ComPtr<IUnknown> alive = KeptAlive();
  // Of a container that is gone there are none, and the control stays closed.
  if (site_) ReadAmbientValues();
  return S_OK;
}

STDMETHODIMP OleControl::FreezeEvents(BOOL freeze) {
  if (freeze)
    ++eventsFrozen_;
  else if (eventsFrozen_ > 0)
    --eventsFrozen_;
  return S_OK;
}

bool OleControl::Ambient(DISPID property, Variant& value) const {
  const ComPtr<IDispatch> ambient = SiteAs<IDispatch>();
  DISPPARAMS none = {};
  return ambient && SUCCEEDED(ambient->Invoke(property, IID_NULL, LOCALE_USER_DEFAULT, DISPATCH_PROPERTYGET,
                                              &none, &value.Get(), nullptr, nullptr));
}

void OleControl::ReadAmbientValues() {
  const ComPtr<IOleClientSite> site = site_;
  AmbientValues values;
  const auto color = [&](DISPID property, COLORREF& result) {
    Variant value;
    return Ambient(property, value) && (V_VT(&value.Get()) == VT_I4 || V_VT(&value.Get()) == VT_UI4) &&
           SUCCEEDED(OleTranslateColor(static_cast<OLE_COLOR>(V_I4(&value.Get())), nullptr, &result));
  };
  values.hasBackColor = color(DISPID_AMBIENT_BACKCOLOR, values.backColor);
  values.hasForeColor = color(DISPID_AMBIENT_FORECOLOR, values.foreColor);
  Variant font;
  if (Ambient(DISPID_AMBIENT_FONT, font) &&
      (V_VT(&font.Get()) == VT_DISPATCH || V_VT(&font.Get()) == VT_UNKNOWN) && V_UNKNOWN(&font.Get()))
    V_UNKNOWN(&font.Get())->QueryInterface(IID_IFont, values.font.ReceiveVoid());
  Variant mode;
  if (Ambient(DISPID_AMBIENT_USERMODE, mode) && V_VT(&mode.Get()) == VT_BOOL)
    values.userMode = V_BOOL(&mode.Get()) != VARIANT_FALSE;
  // The container may have let go of the control while it answered, or another one may have taken it up.
  if (site_.Get() != site.Get()) return;
  userMode_ = values.userMode;
  hooks_.AmbientChanged(values);
  ViewChanged();
}

// --- Activation ---

HRESULT OleControl::Activate(bool withUi) {
  const HRESULT inPlace = ActivateInPlace();
  if (FAILED(inPlace)) return inPlace;
  ShowWindow(hooks_.Window(), SW_SHOW);
  if (withUi) {
    const HRESULT ui = ActivateUi();
    if (FAILED(ui)) return ui;
  }
  CallHeld(site_, &IOleClientSite::ShowObject);
  return S_OK;
}

HRESULT OleControl::ActivateInPlace() {
  if (inPlace_) return S_OK;
  if (!site_) return E_UNEXPECTED;
  const ComPtr<IOleInPlaceSite> inPlaceSite = SiteAs<IOleInPlaceSite>();
  if (!inPlaceSite) return E_NOINTERFACE;
  if (inPlaceSite->CanInPlaceActivate() != S_OK) return E_FAIL;

  ComPtr<IOleInPlaceFrame> frame;
  ComPtr<IOleInPlaceUIWindow> document;
  HWND parent = nullptr;
  RECT position = {};
  RECT clip = {};
  OLEINPLACEFRAMEINFO frameInfo = {};
  frameInfo.cb = sizeof frameInfo;
  HRESULT result = inPlaceSite->GetWindow(&parent);
  if (SUCCEEDED(result))
    result = inPlaceSite->GetWindowContext(frame.Receive(), document.Receive(), &position, &clip, &frameInfo);
  if (FAILED(result)) return result;
  const HWND window = hooks_.Window();
  if (!window) return E_OUTOFMEMORY;
  inPlaceSite_ = inPlaceSite;
  frame_ = std::move(frame);
  document_ = std::move(document);
  inPlace_ = true;
  const HRESULT agreed = inPlaceSite->OnInPlaceActivate();
  if (FAILED(agreed)) {
    inPlace_ = false;
    inPlaceSite_ = {};
    frame_ = {};
    document_ = {};
    return agreed;
  }
  // The container's code may have closed the form.
  if (!inPlace_) return E_FAIL;
  SetParent(window, parent);
  Place(position, clip);
  return S_OK;
}

HRESULT OleControl::ActivateUi() {
  if (uiActive_) {
    TakeFocus();
    return S_OK;
  }
  if (!inPlace_) return E_FAIL;
  uiActive_ = true;
  const HRESULT agreed = CallHeld(inPlaceSite_, &IOleInPlaceSite::OnUIActivate);
  if (FAILED(agreed)) uiActive_ = false;
  // The container's code may have deactivated the control at once.
  if (!uiActive_) return FAILED(agreed) ? agreed : E_FAIL;
  TakeFocus();
  // So may the code of what had the focus.
  if (!uiActive_) return E_FAIL;
  CallHeld(frame_, &IOleInPlaceFrame::SetActiveObject, this, nullptr);
  if (uiActive_) CallHeld(document_, &IOleInPlaceUIWindow::SetActiveObject, this, nullptr);
  if (!uiActive_) return E_FAIL;
  // The control has no tool bars of its own.
  CallHeld(frame_, &IOleInPlaceFrame::SetBorderSpace, nullptr);
  CallHeld(document_, &IOleInPlaceUIWindow::SetBorderSpace, nullptr);
  return S_OK;
}

// A window inside that has the focus, such as the editor of a name, keeps it.
void OleControl::TakeFocus() {
  const HWND window = hooks_.Window();
  const HWND focus = GetFocus();
  if (focus != window && !IsChild(window, focus)) hooks_.GiveFocus();
}

void OleControl::Place(const RECT& position, const RECT& clip) {
  const HWND window = hooks_.Window();
  RECT visible = {};
  HRGN region = nullptr;
  if (!IntersectRect(&visible, &position, &clip)) visible = position;
  if (!EqualRect(&visible, &position)) {
    OffsetRect(&visible, -position.left, -position.top);
    region = CreateRectRgnIndirect(&visible);
  }
  // The window owns the region from here on.
  SetWindowRgn(window, region, TRUE);
  SetWindowPos(window, nullptr, position.left, position.top, position.right - position.left,
               position.bottom - position.top, SWP_NOZORDER | SWP_NOACTIVATE);
}

STDMETHODIMP OleControl::GetWindow(HWND* window) {
  if (!window) return E_POINTER;
  *window = inPlace_ ? hooks_.Window() : nullptr;
  return *window ? S_OK : E_FAIL;
}

STDMETHODIMP OleControl::ContextSensitiveHelp(BOOL) {
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::InPlaceDeactivate() {
  if (!inPlace_) return S_OK;
  const ComPtr<IUnknown> alive = KeptAlive();
  UIDeactivate();
  // The container's code may have done the rest.
  if (!std::exchange(inPlace_, false)) return S_OK;
  // Before more of its code runs, which may activate the control anew.
  const ComPtr<IOleInPlaceSite> site = std::move(inPlaceSite_);
  frame_ = {};
  document_ = {};
  // The window keeps what it shows, away from the container.
  hooks_.Park();
  TellFocus(false);
  // From here on the container draws what is shown now.
  ViewChanged();
  site->OnInPlaceDeactivate();
  return S_OK;
}

STDMETHODIMP OleControl::UIDeactivate() {
  if (!uiActive_) return S_OK;
  const ComPtr<IUnknown> alive = KeptAlive();
  uiActive_ = false;
  CallHeld(document_, &IOleInPlaceUIWindow::SetActiveObject, nullptr, nullptr);
  CallHeld(frame_, &IOleInPlaceFrame::SetActiveObject, nullptr, nullptr);
  CallHeld(inPlaceSite_, &IOleInPlaceSite::OnUIDeactivate, FALSE);
  return S_OK;
}

STDMETHODIMP OleControl::SetObjectRects(LPCRECT position, LPCRECT clip) {
  if (!position || !clip) return E_POINTER;
  if (inPlace_) Place(*position, *clip);
  return S_OK;
}

STDMETHODIMP OleControl::ReactivateAndUndo() {
  return E_NOTIMPL;
}

// --- IOleInPlaceActiveObject ---

HRESULT OleControl::OfferToSite(MSG& message) const {
  const ComPtr<IOleControlSite> site = SiteAs<IOleControlSite>();
  if (!site) return S_FALSE;
  DWORD modifiers = 0;
  if (GetKeyState(VK_SHIFT) < 0) modifiers |= 1;
  if (GetKeyState(VK_CONTROL) < 0) modifiers |= 2;
  if (GetKeyState(VK_MENU) < 0) modifiers |= 4;
  // Containers that have no use for keys say so in many ways; theirs expect this one.
  return site->TranslateAccelerator(&message, modifiers) == S_OK ? S_OK : S_FALSE;
}

STDMETHODIMP OleControl::TranslateAccelerator(LPMSG message) {
  if (!message) return E_POINTER;
  const ComPtr<IUnknown> alive = KeptAlive();
  const HWND window = inPlace_ ? hooks_.Window() : nullptr;
  if (window && message->message == WM_KEYDOWN && IsChild(window, message->hwnd)) {
    if (message->wParam == VK_TAB && GetKeyState(VK_CONTROL) >= 0 &&
        hooks_.MoveFocus(GetKeyState(VK_SHIFT) < 0))
      return S_OK;
    if (Wants(*message)) {
      TranslateMessage(message);
      DispatchMessageW(message);
      return S_OK;
    }
  }
  return OfferToSite(*message);
}

STDMETHODIMP OleControl::OnFrameWindowActivate(BOOL) {
  return S_OK;
}
STDMETHODIMP OleControl::OnDocWindowActivate(BOOL activate) {
  if (activate && uiActive_) CallHeld(frame_, &IOleInPlaceFrame::SetActiveObject, this, nullptr);
  return S_OK;
}
STDMETHODIMP OleControl::ResizeBorder(LPCRECT, IOleInPlaceUIWindow*, BOOL) {
  return S_OK;
}
STDMETHODIMP OleControl::EnableModeless(BOOL) {
  return S_OK;
}

// --- IViewObject2 ---

STDMETHODIMP OleControl::Draw(DWORD aspect, LONG, void*, DVTARGETDEVICE*, HDC, HDC dc, LPCRECTL bounds,
                              LPCRECTL, BOOL(STDMETHODCALLTYPE*)(ULONG_PTR), ULONG_PTR) {
  if (!bounds || !dc) return E_INVALIDARG;
  if (!IsContent(aspect)) return DV_E_DVASPECT;
  // Drawn in pixels whatever the target counts in: the picture is laid out as it looks on the screen.
  const int dpi = SystemDpi();
  const SIZE size = hooks_.SizeOnOtherScreen().value_or(
      SIZE{MulDiv(extent_.cx, dpi, kHimetricPerInch), MulDiv(extent_.cy, dpi, kHimetricPerInch)});
  POINT corners[2] = {{bounds->left, bounds->top}, {bounds->right, bounds->bottom}};
  LPtoDP(dc, corners, 2);
  const int saved = SaveDC(dc);
  SetMapMode(dc, MM_ANISOTROPIC);
  SetWindowOrgEx(dc, 0, 0, nullptr);
  SetWindowExtEx(dc, size.cx, size.cy, nullptr);
  SetViewportOrgEx(dc, corners[0].x, corners[0].y, nullptr);
  SetViewportExtEx(dc, corners[1].x - corners[0].x, corners[1].y - corners[0].y, nullptr);
  const HRESULT result = Guarded([&] {
    hooks_.Draw(dc, {0, 0, size.cx, size.cy});
    return S_OK;
  });
  RestoreDC(dc, saved);
  return result;
}

STDMETHODIMP OleControl::GetColorSet(DWORD, LONG, void*, DVTARGETDEVICE*, HDC, LOGPALETTE** colors) {
  if (!colors) return E_POINTER;
  *colors = nullptr;
  return S_FALSE;
}

STDMETHODIMP OleControl::Freeze(DWORD, LONG, void*, DWORD*) {
  return E_NOTIMPL;
}
STDMETHODIMP OleControl::Unfreeze(DWORD) {
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::SetAdvise(DWORD aspects, DWORD flags, IAdviseSink* sink) {
  const ComPtr<IUnknown> alive = KeptAlive();
  viewSink_ = ComPtr<IAdviseSink>(sink);
  viewAspects_ = aspects;
  viewFlags_ = flags;
  if (flags & ADVF_PRIMEFIRST) ViewChanged();
  return S_OK;
}

STDMETHODIMP OleControl::GetAdvise(DWORD* aspects, DWORD* flags, IAdviseSink** sink) {
  if (aspects) *aspects = viewAspects_;
  if (flags) *flags = viewFlags_;
  if (sink) *sink = ComPtr<IAdviseSink>(viewSink_).Detach();
  return S_OK;
}

STDMETHODIMP OleControl::GetExtent(DWORD aspect, LONG, DVTARGETDEVICE*, SIZEL* himetric) {
  return GetExtent(aspect, himetric);
}

// --- Persistence ---

STDMETHODIMP OleControl::GetClassID(CLSID* classId) {
  if (!classId) return E_POINTER;
  *classId = hooks_.ClassId();
  return S_OK;
}

STDMETHODIMP OleControl::IsDirty() {
  return dirty_ ? S_OK : S_FALSE;
}

STDMETHODIMP OleControl::InitNew() {
  for (const PersistedProperty& property : hooks_.Properties()) hooks_.SetProperty(property.id, 0);
  dirty_ = false;
  return S_OK;
}

// A version, then 32 bits for each property, little-endian.
STDMETHODIMP OleControl::Load(IStream* stream) {
  if (!stream) return E_POINTER;
  const ComPtr<IUnknown> alive = KeptAlive();
  const auto read = [&](auto& value) {
    ULONG count = 0;
    const HRESULT result = stream->Read(&value, sizeof value, &count);
    return FAILED(result) ? result : count == sizeof value ? S_OK : STG_E_READFAULT;
  };
  return Guarded([&]() -> HRESULT {
    std::uint32_t version = 0;
    HRESULT result = read(version);
    if (SUCCEEDED(result) && version != kStreamVersion) result = STG_E_OLDFORMAT;
    std::vector<std::int32_t> values(hooks_.Properties().size());
    for (std::int32_t& value : values)
      if (SUCCEEDED(result)) result = read(value);
    if (FAILED(result)) return result;
    for (std::size_t i = 0; i < values.size(); ++i) {
      const PersistedProperty& property = hooks_.Properties()[i];
      hooks_.SetProperty(property.id, HeldBy(property, values[i]));
    }
    dirty_ = false;
    return S_OK;
  });
}

STDMETHODIMP OleControl::Save(IStream* stream, BOOL clearDirty) {
  if (!stream) return E_POINTER;
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&]() -> HRESULT {
    std::vector<std::uint32_t> values = {kStreamVersion};
    for (const PersistedProperty& property : hooks_.Properties())
      values.push_back(static_cast<std::uint32_t>(hooks_.GetProperty(property.id)));
    const HRESULT result =
        stream->Write(values.data(), static_cast<ULONG>(values.size() * sizeof(std::uint32_t)), nullptr);
    if (SUCCEEDED(result) && clearDirty) dirty_ = false;
    return result;
  });
}

STDMETHODIMP OleControl::GetSizeMax(ULARGE_INTEGER* size) {
  if (!size) return E_POINTER;
  size->QuadPart = (1 + hooks_.Properties().size()) * sizeof(std::uint32_t);
  return S_OK;
}

STDMETHODIMP OleControl::Load(IPropertyBag* bag, IErrorLog* log) {
  if (!bag) return E_POINTER;
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&] {
    for (const PersistedProperty& property : hooks_.Properties()) {
      Variant value;
      // Bags read the value as the type that they are asked for.
      V_VT(&value.Get()) = property.type;
      // A value that is no number does not keep the form from loading.
      const std::int32_t number = ResultAsItStood(0, [&](std::int32_t& kept) {
        if (SUCCEEDED(bag->Read(property.name, &value.Get(), log))) kept = NumberFromVariant(value.Get());
      });
      hooks_.SetProperty(property.id, HeldBy(property, number));
    }
    dirty_ = false;
    return S_OK;
  });
}

STDMETHODIMP OleControl::Save(IPropertyBag* bag, BOOL clearDirty, BOOL all) {
  if (!bag) return E_POINTER;
  const ComPtr<IUnknown> alive = KeptAlive();
  for (const PersistedProperty& property : hooks_.Properties()) {
    const std::int32_t number = hooks_.GetProperty(property.id);
    // 0 is what a bag without the value means.
    if (number == 0 && !all) continue;
    Variant value(VariantFromNumber(number));
    if (property.type == VT_I2) {
      V_VT(&value.Get()) = VT_I2;
      V_I2(&value.Get()) = static_cast<SHORT>(number);
    }
    const HRESULT result = bag->Write(property.name, &value.Get());
    if (FAILED(result)) return result;
  }
  if (clearDirty) dirty_ = false;
  return S_OK;
}

// --- IQuickActivate ---

STDMETHODIMP OleControl::QuickActivate(QACONTAINER* container, QACONTROL* control) {
  if (!container || !control) return E_POINTER;
  const ComPtr<IUnknown> alive = KeptAlive();
  const ULONG size = control->cbSize;
  *control = {};
  control->cbSize = size;
  if (container->pClientSite) SetClientSite(container->pClientSite);
  if (container->pAdviseSink) SetAdvise(DVASPECT_CONTENT, 0, container->pAdviseSink);
  if (container->pUnkEventSink) events_.Advise(container->pUnkEventSink, &control->dwEventCookie);
  if (container->pPropertyNotifySink)
    propertyListeners_.Advise(container->pPropertyNotifySink, &control->dwPropNotifyCookie);
  control->dwMiscStatus = kControlMiscStatus;
  control->dwViewStatus = VIEWSTATUS_OPAQUE;
  return S_OK;
}

STDMETHODIMP OleControl::SetContentExtent(LPSIZEL himetric) {
  return SetExtent(DVASPECT_CONTENT, himetric);
}
STDMETHODIMP OleControl::GetContentExtent(LPSIZEL himetric) {
  return GetExtent(DVASPECT_CONTENT, himetric);
}

// --- Connection points, class information ---

STDMETHODIMP OleControl::EnumConnectionPoints(IEnumConnectionPoints** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return Guarded([&] {
    *enumerator =
        new ComEnumerator<IEnumConnectionPoints, IConnectionPoint*>({&events_, &propertyListeners_});
    return S_OK;
  });
}

STDMETHODIMP OleControl::FindConnectionPoint(REFIID interfaceId, IConnectionPoint** point) {
  if (!point) return E_POINTER;
  *point = nullptr;
  if (interfaceId == eventInterface_) *point = &events_;
  if (interfaceId == IID_IPropertyNotifySink) *point = &propertyListeners_;
  if (!*point) return CONNECT_E_NOCONNECTION;
  AddRef();
  return S_OK;
}

STDMETHODIMP OleControl::GetClassInfo(ITypeInfo** info) {
  if (!info) return E_POINTER;
  *info = module::TypeInfo(hooks_.ClassId()).Detach();
  return *info ? S_OK : TYPE_E_CANTLOADLIBRARY;
}

STDMETHODIMP OleControl::GetGUID(DWORD kind, GUID* guid) {
  if (!guid) return E_POINTER;
  if (kind != GUIDKIND_DEFAULT_SOURCE_DISP_IID) return E_INVALIDARG;
  *guid = eventInterface_;
  return S_OK;
}

}  // namespace tarnwick
