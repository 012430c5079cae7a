#include "surface/OleControl.h"

#include <utility>

namespace tarnwick {
namespace {

bool IsContent(DWORD aspect) {
  return aspect == DVASPECT_CONTENT;
}

// Calls a method of what the call itself may replace or release, which stays until it returns. Null is not
// called.
template <typename Interface, typename Method, typename... Arguments>
HRESULT CallHeld(ComPtr<Interface> called, Method method, Arguments... arguments) {
  return called ? (called.Get()->*method)(arguments...) : S_OK;
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
  if (id == IID_IQuickActivate) return static_cast<IQuickActivate*>(this);
  if (id == IID_IViewObject || id == IID_IViewObject2) return static_cast<IViewObject2*>(&view_);
  if (id == IID_IDataObject) return static_cast<IDataObject*>(&view_);
  // Begins with all of IPersistStream.
  if (id == IID_IPersist || id == IID_IPersistStream || id == IID_IPersistStreamInit)
    return static_cast<IPersistStreamInit*>(&persistence_);
  if (id == IID_IPersistStorage) return static_cast<IPersistStorage*>(&persistence_);
  if (id == IID_IPersistPropertyBag) return static_cast<IPersistPropertyBag*>(&persistence_);
  if (id == IID_IConnectionPointContainer) return static_cast<IConnectionPointContainer*>(&points_);
  if (id == IID_IProvideClassInfo || id == IID_IProvideClassInfo2)
    return static_cast<IProvideClassInfo2*>(&points_);
  return nullptr;
}

void OleControl::Raise(DISPID event, std::span<VARIANT> arguments) {
  if (eventsFrozen_ > 0) return;
  ResultAsItStood(0, [&](int&) { points_.Raise(event, arguments); });
}

void OleControl::PropertyChanged(DISPID property) {
  persistence_.NoteChange();
  ResultAsItStood(0, [&](int&) { points_.NotifyChanged(property); });
}

void OleControl::Activated() {
  if (!userMode_) return;
  if (inPlace_ && !uiActive_) ActivateUi();
  NotifyFocus(true);
}

void OleControl::NotifyFocus(bool focus) {
  if (std::exchange(hasFocus_, focus) != focus)
    CallHeld(SiteAs<IOleControlSite>(), &IOleControlSite::OnFocus, focus);
}

// --- IOleObject ---

STDMETHODIMP OleControl::SetClientSite(IOleClientSite* site) {
  return Entered([&] {
    if (!site) InPlaceDeactivate();
    site_ = ComPtr<IOleClientSite>(site);
    if (site_)
      ReadAmbientValues();
    else
      hooks_.SiteGone();
    return S_OK;
  });
}

STDMETHODIMP OleControl::GetClientSite(IOleClientSite** site) {
  if (!site) return E_POINTER;
  *site = ComPtr<IOleClientSite>(site_).Detach();
  return S_OK;
}

STDMETHODIMP OleControl::Close(DWORD saveOption) {
  return Entered([&] {
    hooks_.Closing();
    InPlaceDeactivate();
    if (saveOption != OLECLOSE_NOSAVE && persistence_.HasChanges())
      CallHeld(site_, &IOleClientSite::SaveObject);
    CallHeld(adviseHolder_, &IOleAdviseHolder::SendOnClose);
    return S_OK;
  });
}

STDMETHODIMP OleControl::GetMoniker(DWORD, DWORD, IMoniker** moniker) {
  if (moniker) *moniker = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::GetClipboardData(DWORD, IDataObject** data) {
  if (data) *data = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP OleControl::DoVerb(LONG verb, LPMSG, IOleClientSite* site, LONG, HWND, LPCRECT) {
  return Entered([&] {
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
  });
}

STDMETHODIMP OleControl::EnumVerbs(IEnumOLEVERB** enumerator) {
  return Entered([&] { return OleRegEnumVerbs(hooks_.ClassId(), enumerator); });
}

STDMETHODIMP OleControl::GetUserType(DWORD form, LPOLESTR* type) {
  return Entered([&] { return OleRegGetUserType(hooks_.ClassId(), form, type); });
}

STDMETHODIMP OleControl::SetExtent(DWORD aspect, SIZEL* himetric) {
  if (!himetric) return E_POINTER;
  if (!IsContent(aspect)) return DV_E_DVASPECT;
  return Entered([&] {
    view_.SetExtent(*himetric);
    return S_OK;
  });
}

STDMETHODIMP OleControl::Advise(IAdviseSink* sink, DWORD* cookie) {
  return Entered([&] {
    if (!adviseHolder_) {
      const HRESULT made = CreateOleAdviseHolder(adviseHolder_.Receive());
      if (FAILED(made)) return made;
    }
    return CallHeld(adviseHolder_, &IOleAdviseHolder::Advise, sink, cookie);
  });
}

STDMETHODIMP OleControl::Unadvise(DWORD cookie) {
  return Entered([&] {
    return adviseHolder_ ? CallHeld(adviseHolder_, &IOleAdviseHolder::Unadvise, cookie) : OLE_E_NOCONNECTION;
  });
}

STDMETHODIMP OleControl::EnumAdvise(IEnumSTATDATA** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return Entered([&] { return adviseHolder_ ? adviseHolder_->EnumAdvise(enumerator) : S_OK; });
}

STDMETHODIMP OleControl::GetMiscStatus(DWORD aspect, DWORD* status) {
  if (!status) return E_POINTER;
  *status = IsContent(aspect) ? kControlMiscStatus : 0;
  return S_OK;
}

// --- IOleControl ---

STDMETHODIMP OleControl::GetControlInfo(CONTROLINFO* info) {
  if (!info) return E_POINTER;
  // Enter opens the selected item.
  *info = {sizeof(CONTROLINFO), nullptr, 0, CTRLINFO_EATS_RETURN};
  return S_OK;
}

STDMETHODIMP OleControl::OnAmbientPropertyChange(DISPID) {
  return Entered([&] {
    // Of a container that is gone there are none, and the control stays closed.
    if (site_) ReadAmbientValues();
    return S_OK;
  });
}

STDMETHODIMP OleControl::FreezeEvents(BOOL freeze) {
  if (freeze)
    ++eventsFrozen_;
  else if (eventsFrozen_ > 0)
    --eventsFrozen_;
  return S_OK;
}

void OleControl::ReadAmbientValues() {
  const ComPtr<IOleClientSite> site = site_;
  const AmbientValues values = AskAmbientValues(site_);
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
  return Entered([&] {
    *window = inPlace_ ? hooks_.Window() : nullptr;
    return *window ? S_OK : E_FAIL;
  });
}

STDMETHODIMP OleControl::InPlaceDeactivate() {
  return Entered([&] {
    if (!inPlace_) return S_OK;
    UIDeactivate();
    // The container's code may have done the rest.
    if (!std::exchange(inPlace_, false)) return S_OK;
    // Before more of its code runs, which may activate the control anew.
    const ComPtr<IOleInPlaceSite> site = std::move(inPlaceSite_);
    frame_ = {};
    document_ = {};
    // The window keeps what it shows, away from the container.
    hooks_.Park();
    NotifyFocus(false);
    // From here on the container draws what is shown now.
    ViewChanged();
    site->OnInPlaceDeactivate();
    return S_OK;
  });
}

STDMETHODIMP OleControl::UIDeactivate() {
  return Entered([&] {
    if (!uiActive_) return S_OK;
    uiActive_ = false;
    CallHeld(document_, &IOleInPlaceUIWindow::SetActiveObject, nullptr, nullptr);
    CallHeld(frame_, &IOleInPlaceFrame::SetActiveObject, nullptr, nullptr);
    CallHeld(inPlaceSite_, &IOleInPlaceSite::OnUIDeactivate, FALSE);
    return S_OK;
  });
}

STDMETHODIMP OleControl::SetObjectRects(LPCRECT position, LPCRECT clip) {
  if (!position || !clip) return E_POINTER;
  return Entered([&] {
    if (inPlace_) Place(*position, *clip);
    return S_OK;
  });
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
  return Entered([&] {
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
  });
}

STDMETHODIMP OleControl::OnDocWindowActivate(BOOL activate) {
  return Entered([&] {
    if (activate && uiActive_) CallHeld(frame_, &IOleInPlaceFrame::SetActiveObject, this, nullptr);
    return S_OK;
  });
}

// --- IQuickActivate ---

STDMETHODIMP OleControl::QuickActivate(QACONTAINER* container, QACONTROL* control) {
  if (!container || !control) return E_POINTER;
  return Entered([&] {
    const ULONG size = control->cbSize;
    *control = {};
    control->cbSize = size;
    if (container->pClientSite) SetClientSite(container->pClientSite);
    if (container->pAdviseSink) view_.SetAdvise(DVASPECT_CONTENT, 0, container->pAdviseSink);
    if (container->pUnkEventSink) points_.Events().Advise(container->pUnkEventSink, &control->dwEventCookie);
    if (container->pPropertyNotifySink)
      points_.PropertyListeners().Advise(container->pPropertyNotifySink, &control->dwPropNotifyCookie);
    control->dwMiscStatus = kControlMiscStatus;
    control->dwViewStatus = VIEWSTATUS_OPAQUE;
    return S_OK;
  });
}

}  // namespace tarnwick
