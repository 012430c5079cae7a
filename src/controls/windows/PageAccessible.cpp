#include "controls/windows/PageAccessible.h"

#include <new>
#include <utility>

#include "controls/windows/WindowsThumbnailPage.h"
#include "platform/windows/AnsiText.h"

namespace tarnwick {
namespace {

constexpr wchar_t kOpenAction[] = L"Open";

std::atomic<int> objects{0};

VARIANT Self() {
  VARIANT self = {};
  V_VT(&self) = VT_I4;
  V_I4(&self) = CHILDID_SELF;
  return self;
}

HRESULT TellNumber(VARIANT* target, LONG number) {
  *target = Self();
  V_I4(target) = number;
  return S_OK;
}

void TellObject(VARIANT* target, IDispatch* object) {
  V_VT(target) = VT_DISPATCH;
  V_DISPATCH(target) = object;
}

}  // namespace

PageAccessible::PageAccessible(WindowsThumbnailPage& page, int slot) : page_(&page), slot_(slot) {
  ++objects;
}

PageAccessible::~PageAccessible() {
  --objects;
}

bool PageAccessible::AnyLeft() {
  return objects > 0;
}

void PageAccessible::Disconnect() {
  page_ = nullptr;
  CoDisconnectObject(this, 0);
}

// --- IUnknown, IDispatch ---

STDMETHODIMP PageAccessible::QueryInterface(REFIID id, void** object) {
  if (!object) return E_POINTER;
  const bool known = id == IID_IUnknown || id == IID_IDispatch || id == __uuidof(IAccessible);
  *object = known ? static_cast<IAccessible*>(this) : nullptr;
  if (!known) return E_NOINTERFACE;
  AddRef();
  return S_OK;
}

STDMETHODIMP_(ULONG) PageAccessible::AddRef() {
  return ++references_;
}

STDMETHODIMP_(ULONG) PageAccessible::Release() {
  const ULONG left = --references_;
  if (left == 0) delete this;
  return left;
}

STDMETHODIMP PageAccessible::GetTypeInfoCount(UINT* count) {
  if (!count) return E_POINTER;
  *count = 0;
  return S_OK;
}

// --- What it is asked ---

template <typename Body>
HRESULT PageAccessible::Asked(const VARIANT& child, Body&& body) {
  if (!page_) return CO_E_OBJNOTCONNECTED;
  if (V_VT(&child) != VT_I4) return E_INVALIDARG;
  const LONG number = V_I4(&child);
  // A slot has no items. Those of the grid can be asked for by their numbers, too.
  if (number != CHILDID_SELF && (slot_ != 0 || number < 0 || number > page_->PictureCount()))
    return E_INVALIDARG;
  try {
    return std::forward<Body>(body)(number == CHILDID_SELF ? slot_ : static_cast<int>(number));
  } catch (...) {
    return E_OUTOFMEMORY;
  }
}

template <typename Body>
HRESULT PageAccessible::AskedText(const VARIANT& child, BSTR* text, Body&& body) {
  if (!text) return E_POINTER;
  *text = nullptr;
  return Asked(child, [&](int slot) {
    const std::wstring told = std::forward<Body>(body)(slot);
    if (told.empty()) return S_FALSE;
    *text = SysAllocStringLen(told.data(), static_cast<UINT>(told.size()));
    return *text ? S_OK : E_OUTOFMEMORY;
  });
}

HRESULT PageAccessible::NoText(const VARIANT& child, BSTR* text) {
  return AskedText(child, text, [](int) { return std::wstring(); });
}

IDispatch* PageAccessible::ObjectOf(int slot) const {
  PageAccessible& object = page_->AccessibleOf(slot);
  object.AddRef();
  return &object;
}

STDMETHODIMP PageAccessible::get_accParent(IDispatch** parent) {
  if (!parent) return E_POINTER;
  *parent = nullptr;
  return Asked(Self(), [&](int slot) {
    if (slot == 0)
      return AccessibleObjectFromWindow(page_->WindowOf(0), static_cast<DWORD>(OBJID_WINDOW), IID_IDispatch,
                                        reinterpret_cast<void**>(parent));
    *parent = ObjectOf(0);
    return S_OK;
  });
}

STDMETHODIMP PageAccessible::get_accChildCount(LONG* count) {
  if (!count) return E_POINTER;
  *count = 0;
  return Asked(Self(), [&](int slot) {
    if (slot == 0) *count = page_->PictureCount();
    return S_OK;
  });
}

STDMETHODIMP PageAccessible::get_accChild(VARIANT child, IDispatch** object) {
  if (!object) return E_POINTER;
  *object = nullptr;
  return Asked(child, [&](int slot) {
    *object = ObjectOf(slot);
    return S_OK;
  });
}

STDMETHODIMP PageAccessible::get_accName(VARIANT child, BSTR* name) {
  return AskedText(child, name, [&](int slot) { return page_->SpokenName(slot); });
}

STDMETHODIMP PageAccessible::get_accValue(VARIANT child, BSTR* value) {
  return AskedText(child, value, [&](int slot) { return slot == 0 ? page_->SpokenPlace() : std::wstring(); });
}

STDMETHODIMP PageAccessible::get_accDescription(VARIANT child, BSTR* text) {
  return AskedText(child, text, [&](int slot) { return page_->SpokenDetails(slot); });
}

STDMETHODIMP PageAccessible::get_accRole(VARIANT child, VARIANT* role) {
  if (!role) return E_POINTER;
  VariantInit(role);
  return Asked(
      child, [&](int slot) { return TellNumber(role, slot == 0 ? ROLE_SYSTEM_LIST : ROLE_SYSTEM_LISTITEM); });
}

STDMETHODIMP PageAccessible::get_accState(VARIANT child, VARIANT* state) {
  if (!state) return E_POINTER;
  VariantInit(state);
  return Asked(child, [&](int slot) {
    const HWND window = page_->WindowOf(slot);
    const bool selected = slot != 0 && page_->SelectedSlot() == slot;
    const bool focused = GetFocus() == page_->WindowOf(0);
    LONG told = STATE_SYSTEM_FOCUSABLE;
    if (slot != 0) told |= STATE_SYSTEM_SELECTABLE;
    if (selected) told |= STATE_SYSTEM_SELECTED;
    // Of the grid, as long as no picture has it.
    if (focused && (selected || (slot == 0 && page_->SelectedSlot() == 0))) told |= STATE_SYSTEM_FOCUSED;
    if (!IsWindowVisible(window)) told |= STATE_SYSTEM_INVISIBLE;
    return TellNumber(state, told);
  });
}

HRESULT PageAccessible::TellSelected(VARIANT* child, bool wanted) {
  const int selected = wanted ? page_->SelectedSlot() : 0;
  if (slot_ == 0 && selected != 0)
    TellObject(child, ObjectOf(selected));
  else if (wanted && slot_ == selected)
    *child = Self();
  return V_VT(child) == VT_EMPTY ? S_FALSE : S_OK;
}

STDMETHODIMP PageAccessible::get_accFocus(VARIANT* child) {
  if (!child) return E_POINTER;
  VariantInit(child);
  return Asked(Self(), [&](int) { return TellSelected(child, GetFocus() == page_->WindowOf(0)); });
}

STDMETHODIMP PageAccessible::get_accSelection(VARIANT* child) {
  if (!child) return E_POINTER;
  VariantInit(child);
  return Asked(Self(), [&](int) {
    return slot_ == 0 && page_->SelectedSlot() != 0 ? TellSelected(child, true) : S_FALSE;
  });
}

STDMETHODIMP PageAccessible::get_accDefaultAction(VARIANT child, BSTR* action) {
  return AskedText(child, action, [](int slot) { return std::wstring(slot == 0 ? L"" : kOpenAction); });
}

STDMETHODIMP PageAccessible::accLocation(LONG* left, LONG* top, LONG* width, LONG* height, VARIANT child) {
  if (!left || !top || !width || !height) return E_POINTER;
  *left = *top = *width = *height = 0;
  return Asked(child, [&](int slot) {
    RECT place = {};
    GetWindowRect(page_->WindowOf(slot), &place);
    *left = place.left;
    *top = place.top;
    *width = place.right - place.left;
    *height = place.bottom - place.top;
    return S_OK;
  });
}

STDMETHODIMP PageAccessible::accHitTest(LONG left, LONG top, VARIANT* child) {
  if (!child) return E_POINTER;
  VariantInit(child);
  return Asked(Self(), [&](int slot) {
    const auto isIn = [&](int which) {
      RECT place = {};
      const HWND window = page_->WindowOf(which);
      return IsWindowVisible(window) && GetWindowRect(window, &place) && PtInRect(&place, {left, top});
    };
    if (!isIn(slot)) return S_FALSE;
    *child = Self();
    for (int item = 1; slot == 0 && item <= page_->PictureCount(); ++item)
      if (isIn(item)) TellObject(child, ObjectOf(item));
    return S_OK;
  });
}

// --- What it is told to do ---

// Not done at once: the host's code runs in it, which may show a dialog while the program that asked waits.
HRESULT PageAccessible::Post(WPARAM acts, int slot) const {
  return PostMessageW(page_->WindowOf(0), kActMessage, acts, slot) ? S_OK : E_FAIL;
}

STDMETHODIMP PageAccessible::accSelect(LONG flags, VARIANT child) {
  return Asked(child, [&](int slot) {
    const LONG known = SELFLAG_TAKEFOCUS | (slot == 0 ? 0 : SELFLAG_TAKESELECTION);
    if (flags == 0 || (flags & ~known) != 0) return E_INVALIDARG;
    // The focus of the grid is that of the selected picture.
    WPARAM acts = 0;
    if (slot != 0) acts |= kSelect;
    if (flags & SELFLAG_TAKEFOCUS) acts |= kTakeFocus;
    return Post(acts, slot);
  });
}

STDMETHODIMP PageAccessible::accDoDefaultAction(VARIANT child) {
  return Asked(child, [&](int slot) {
    return slot == 0 ? DISP_E_MEMBERNOTFOUND : Post(kTakeFocus | kSelect | kOpen, slot);
  });
}

}  // namespace tarnwick
