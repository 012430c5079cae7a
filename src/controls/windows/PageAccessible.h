// What screen readers and other programs that read the screen learn of the thumbnails' grid, by the system's
// accessibility interface: a list with the pictures of the page as its items.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleacc.h>

#include <atomic>

namespace tarnwick {

class WindowsThumbnailPage;

// The grid, or one of its slots. Such programs keep it as long as they like, so it counts its references and
// lets go of its page when that ends. What it is asked runs none of the host's code; what it is told to do is
// posted to the grid's window.
class PageAccessible final : public IAccessible {
 public:
  // Posted to the grid's window, with acts of the user and the slot that they are for.
  static constexpr UINT kActMessage = WM_APP;
  enum Act : WPARAM { kTakeFocus = 1, kSelect = 2, kOpen = 4 };

  // Slots count from 1; 0 is the grid. Begins with one reference, which its creator owns.
  PageAccessible(WindowsThumbnailPage& page, int slot);
  PageAccessible(const PageAccessible&) = delete;
  PageAccessible& operator=(const PageAccessible&) = delete;

  // The window is gone: from here on each call fails, and no other process holds the object any more.
  void Disconnect();
  // Whether the process has objects of this class, whose code must stay loaded.
  static bool AnyLeft();

  STDMETHODIMP QueryInterface(REFIID id, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;

  STDMETHODIMP GetTypeInfoCount(UINT* count) override;
  STDMETHODIMP GetTypeInfo(UINT, LCID, ITypeInfo**) override { return E_NOTIMPL; }
  STDMETHODIMP GetIDsOfNames(REFIID, LPOLESTR*, UINT, LCID, DISPID*) override { return E_NOTIMPL; }
  STDMETHODIMP Invoke(DISPID, REFIID, LCID, WORD, DISPPARAMS*, VARIANT*, EXCEPINFO*, UINT*) override {
    return E_NOTIMPL;
  }

  STDMETHODIMP get_accParent(IDispatch** parent) override;
  STDMETHODIMP get_accChildCount(LONG* count) override;
  STDMETHODIMP get_accChild(VARIANT child, IDispatch** object) override;
  STDMETHODIMP get_accName(VARIANT child, BSTR* name) override;
  STDMETHODIMP get_accValue(VARIANT child, BSTR* value) override;
  STDMETHODIMP get_accDescription(VARIANT child, BSTR* text) override;
  STDMETHODIMP get_accRole(VARIANT child, VARIANT* role) override;
  STDMETHODIMP get_accState(VARIANT child, VARIANT* state) override;
  STDMETHODIMP get_accHelp(VARIANT child, BSTR* text) override { return NoText(child, text); }
  STDMETHODIMP get_accHelpTopic(BSTR*, VARIANT, LONG*) override { return DISP_E_MEMBERNOTFOUND; }
  STDMETHODIMP get_accKeyboardShortcut(VARIANT child, BSTR* text) override { return NoText(child, text); }
  STDMETHODIMP get_accFocus(VARIANT* child) override;
  STDMETHODIMP get_accSelection(VARIANT* child) override;
  STDMETHODIMP get_accDefaultAction(VARIANT child, BSTR* action) override;
  STDMETHODIMP accSelect(LONG flags, VARIANT child) override;
  STDMETHODIMP accLocation(LONG* left, LONG* top, LONG* width, LONG* height, VARIANT child) override;
  STDMETHODIMP accNavigate(LONG, VARIANT, VARIANT*) override { return DISP_E_MEMBERNOTFOUND; }
  STDMETHODIMP accHitTest(LONG left, LONG top, VARIANT* child) override;
  STDMETHODIMP accDoDefaultAction(VARIANT child) override;
  STDMETHODIMP put_accName(VARIANT, BSTR) override { return DISP_E_MEMBERNOTFOUND; }
  STDMETHODIMP put_accValue(VARIANT, BSTR) override { return DISP_E_MEMBERNOTFOUND; }

 private:
  ~PageAccessible();
  // Runs body(slot) for the slot that `child` means.
  template <typename Body>
  HRESULT Asked(const VARIANT& child, Body&& body);
  template <typename Body>
  HRESULT AskedText(const VARIANT& child, BSTR* text, Body&& body);
  HRESULT NoText(const VARIANT& child, BSTR* text);
  // The selected picture, when `wanted`.
  HRESULT TellSelected(VARIANT* child, bool wanted);
  // A reference to the object of a slot or of the grid.
  IDispatch* ObjectOf(int slot) const;
  HRESULT Post(WPARAM acts, int slot) const;

  WindowsThumbnailPage* page_;
  const int slot_;
  std::atomic<ULONG> references_{1};
};

}  // namespace tarnwick
