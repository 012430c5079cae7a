// What a control looks like: drawn by its container, as data, and with notifications when it
// changes.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>

#include "surface/ControlPart.h"

namespace tarnwick {

class View final : public ControlPart<IViewObject2, IDataObject> {
 public:
  // `extent` is the control's size in HIMETRIC until a container gives it another one.
  View(OleControlHooks& hooks, const SIZEL& extent) : ControlPart(hooks), extent_(extent) {}

  // Notifies the view advise and the data advises that the control looks different. Runs the host's code,
  // which may release the control inside.
  void NotifyChanged();

  // Sets the size and notifies of it, as NotifyChanged does.
  void SetExtent(const SIZEL& extent);

  // IViewObject2
  STDMETHODIMP Draw(DWORD aspect, LONG index, void* aspectInfo, DVTARGETDEVICE* target, HDC targetDc, HDC dc,
                    LPCRECTL bounds, LPCRECTL windowBounds, BOOL(STDMETHODCALLTYPE* mayContinue)(ULONG_PTR),
                    ULONG_PTR continueArgument) override;
  STDMETHODIMP GetColorSet(DWORD aspect, LONG index, void* aspectInfo, DVTARGETDEVICE* target, HDC targetDc,
                           LOGPALETTE** colors) override;
  STDMETHODIMP Freeze(DWORD, LONG, void*, DWORD*) override { return E_NOTIMPL; }
  STDMETHODIMP Unfreeze(DWORD) override { return E_NOTIMPL; }
  STDMETHODIMP SetAdvise(DWORD aspects, DWORD flags, IAdviseSink* sink) override;
  STDMETHODIMP GetAdvise(DWORD* aspects, DWORD* flags, IAdviseSink** sink) override;
  STDMETHODIMP GetExtent(DWORD aspect, LONG index, DVTARGETDEVICE* target, SIZEL* himetric) override;

  // IDataObject: the picture as a metafile, of either kind.
  STDMETHODIMP GetData(FORMATETC* format, STGMEDIUM* medium) override;
  STDMETHODIMP GetDataHere(FORMATETC*, STGMEDIUM*) override { return DV_E_FORMATETC; }
  STDMETHODIMP QueryGetData(FORMATETC* format) override;
  STDMETHODIMP GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) override;
  STDMETHODIMP SetData(FORMATETC*, STGMEDIUM*, BOOL) override { return E_NOTIMPL; }
  STDMETHODIMP EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) override;
  STDMETHODIMP DAdvise(FORMATETC* format, DWORD flags, IAdviseSink* sink, DWORD* cookie) override;
  STDMETHODIMP DUnadvise(DWORD cookie) override;
  STDMETHODIMP EnumDAdvise(IEnumSTATDATA** enumerator) override;

 private:
  SIZEL extent_;
  ComPtr<IAdviseSink> sink_;
  DWORD aspects_ = 0;
  DWORD flags_ = 0;
  ComPtr<IDataAdviseHolder> dataAdvises_;
};

}  // namespace tarnwick
