// A window's place for one control: a full site with ambient properties, a sink for events and property
// changes, keyboard handling, and a property bag. The demo host shows the control with it, the tests examine
// the control with it.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>
#include <olectl.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "platform/windows/ComPtr.h"
#include "surface/Automation.h"

namespace tarnwick::demo {

// Named values as a form keeps them.
class PropertyBag final : public IPropertyBag {
 public:
  std::map<std::wstring, Variant> values;

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return ++references_; }
  STDMETHODIMP_(ULONG) Release() override;
  STDMETHODIMP Read(LPCOLESTR name, VARIANT* value, IErrorLog* log) override;
  STDMETHODIMP Write(LPCOLESTR name, VARIANT* value) override;

 private:
  ULONG references_ = 1;
};

// What the container tells the control about itself.
struct Ambient {
  ComPtr<IFontDisp> font;
  OLE_COLOR backColor = 0x80000000 | COLOR_BTNFACE;
  OLE_COLOR foreColor = 0x80000000 | COLOR_BTNTEXT;
  bool userMode = true;
};

class ControlContainer final : public IOleClientSite,
                               public IOleInPlaceSite,
                               public IOleInPlaceFrame,
                               public IOleControlSite,
                               public IPropertyNotifySink,
                               public IDispatch {
 public:
  enum class WayIn { kSteps, kQuickActivate };

  // The control lives in `window`. The object begins with one reference, its creator's.
  explicit ControlContainer(HWND window) : window_(window) {}
  ControlContainer(const ControlContainer&) = delete;
  ControlContainer& operator=(const ControlContainer&) = delete;

  Ambient ambient;
  // Events of the control, by number, with their arguments in the order of the declaration.
  std::function<void(DISPID event, std::vector<VARIANT>& arguments)> onEvent;
  // A key that the control passed on, with 1 for Shift, 2 for Control and 4 for Alt; true when the form took
  // it, else it is looked at as a dialog key.
  std::function<bool(const MSG& message, DWORD modifiers)> onKey;
  // Runs when the control is activated in place and when it gets the keyboard; a failure refuses that.
  std::function<HRESULT(bool ui)> onActivate;
  // Runs first in each call of the control that tells the container something or asks for something of its
  // own.
  std::function<void(const char* call)> onCall;
  // Persisted properties that the control said to have changed.
  std::vector<DISPID> changed;
  // Calls that no container must get, in words.
  std::vector<std::string> violations;

  // Creates the control and connects its events. With `bag` it is loaded from it, else made new.
  HRESULT Create(REFCLSID classId, WayIn wayIn, IPropertyBag* bag);
  // Takes up a control that was in another container, as it is, and connects its events.
  HRESULT TakeUp(IUnknown& control, WayIn wayIn);
  // Where the control is, in pixels of the window.
  void SetBounds(const RECT& bounds);
  HRESULT Do(LONG verb);
  // Offers a key to the active control; true when it took it.
  bool TranslateKey(MSG& message);
  // Tells the control that an ambient property has changed.
  void AmbientChanged(DISPID property);
  // Lets go of the control in the middle of what it does, without a word to it.
  void Abandon();
  // Ends the control. Returns the references that it still had after the container's last one was released:
  // 0, when nobody else holds it.
  ULONG Close();

  IUnknown* Control() const { return control_.Get(); }
  bool IsUiActive() const { return static_cast<bool>(active_); }
  // Whether the control has said that it has the focus, and not that it lost it.
  bool HasFocus() const { return hasFocus_; }

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override { return ++references_; }
  STDMETHODIMP_(ULONG) Release() override;

  // IOleClientSite
  STDMETHODIMP SaveObject() override;
  STDMETHODIMP GetMoniker(DWORD assign, DWORD which, IMoniker** moniker) override;
  STDMETHODIMP GetContainer(IOleContainer** container) override;
  STDMETHODIMP ShowObject() override;
  STDMETHODIMP OnShowWindow(BOOL show) override;
  STDMETHODIMP RequestNewObjectLayout() override { return E_NOTIMPL; }

  // IOleWindow, IOleInPlaceSite
  STDMETHODIMP GetWindow(HWND* window) override;
  STDMETHODIMP ContextSensitiveHelp(BOOL enter) override;
  STDMETHODIMP CanInPlaceActivate() override { return S_OK; }
  STDMETHODIMP OnInPlaceActivate() override;
  STDMETHODIMP OnUIActivate() override;
  STDMETHODIMP GetWindowContext(IOleInPlaceFrame** frame, IOleInPlaceUIWindow** document, LPRECT position,
                                LPRECT clip, LPOLEINPLACEFRAMEINFO info) override;
  STDMETHODIMP Scroll(SIZE distance) override;
  STDMETHODIMP OnUIDeactivate(BOOL undoable) override;
  STDMETHODIMP OnInPlaceDeactivate() override;
  STDMETHODIMP DiscardUndoState() override { return S_OK; }
  STDMETHODIMP DeactivateAndUndo() override { return S_OK; }
  STDMETHODIMP OnPosRectChange(LPCRECT position) override;

  // IOleInPlaceFrame
  STDMETHODIMP GetBorder(LPRECT border) override;
  STDMETHODIMP RequestBorderSpace(LPCBORDERWIDTHS widths) override;
  STDMETHODIMP SetBorderSpace(LPCBORDERWIDTHS widths) override;
  STDMETHODIMP SetActiveObject(IOleInPlaceActiveObject* object, LPCOLESTR name) override;
  STDMETHODIMP InsertMenus(HMENU menu, LPOLEMENUGROUPWIDTHS widths) override;
  STDMETHODIMP SetMenu(HMENU menu, HOLEMENU oleMenu, HWND object) override;
  STDMETHODIMP RemoveMenus(HMENU menu) override;
  STDMETHODIMP SetStatusText(LPCOLESTR text) override;
  STDMETHODIMP EnableModeless(BOOL enable) override;
  STDMETHODIMP TranslateAccelerator(LPMSG message, WORD id) override;

  // IOleControlSite
  STDMETHODIMP OnControlInfoChanged() override { return S_OK; }
  STDMETHODIMP LockInPlaceActive(BOOL lock) override;
  STDMETHODIMP GetExtendedControl(IDispatch** extended) override;
  STDMETHODIMP TransformCoords(POINTL* himetric, POINTF* container, DWORD flags) override;
  STDMETHODIMP TranslateAccelerator(MSG* message, DWORD modifiers) override;
  STDMETHODIMP OnFocus(BOOL got) override;
  STDMETHODIMP ShowPropertyFrame() override { return E_NOTIMPL; }

  // IPropertyNotifySink
  STDMETHODIMP OnChanged(DISPID property) override;
  STDMETHODIMP OnRequestEdit(DISPID property) override;

  // IDispatch: the ambient properties
  STDMETHODIMP GetTypeInfoCount(UINT* count) override;
  STDMETHODIMP GetTypeInfo(UINT index, LCID locale, ITypeInfo** info) override;
  STDMETHODIMP GetIDsOfNames(REFIID reserved, LPOLESTR* names, UINT count, LCID locale, DISPID* ids) override;
  STDMETHODIMP Invoke(DISPID member, REFIID reserved, LCID locale, WORD flags, DISPPARAMS* arguments,
                      VARIANT* result, EXCEPINFO* exception, UINT* argumentError) override;

 private:
  class EventSink;

  ~ControlContainer() = default;
  HRESULT Site(WayIn wayIn);
  HRESULT Connect(IUnknown* sink, REFIID interfaceId, DWORD& cookie) const;
  void Disconnect(REFIID interfaceId, DWORD cookie) const;
  void Called(const char* call) const {
    if (onCall) onCall(call);
  }
  void Violation(const char* what) { violations.emplace_back(what); }

  HWND window_;
  ULONG references_ = 1;
  RECT bounds_ = {0, 0, 320, 240};
  ComPtr<IUnknown> control_;
  ComPtr<IOleObject> object_;
  ComPtr<IOleInPlaceActiveObject> active_;
  IID events_ = {};
  DWORD eventCookie_ = 0;
  DWORD notifyCookie_ = 0;
  bool inPlace_ = false;
  bool hasFocus_ = false;
};

}  // namespace tarnwick::demo
