// What documents want of a control beside what forms do: it is kept in a storage of its own, and what it
// looks like can be had as data.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>

#include "platform/windows/ComPtr.h"

namespace tarnwick {

class OleControl;

// A part of the control's OLE side, whose identity it has.
class Embedding final : public IPersistStorage, public IDataObject {
 public:
  explicit Embedding(OleControl& control) : control_(control) {}
  Embedding(const Embedding&) = delete;
  Embedding& operator=(const Embedding&) = delete;

  // Notifies the data advises that the control's picture has changed.
  void ViewChanged();

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;

  // IPersistStorage. No storage is held between the calls.
  STDMETHODIMP GetClassID(CLSID* classId) override;
  STDMETHODIMP IsDirty() override;
  STDMETHODIMP InitNew(IStorage* storage) override;
  STDMETHODIMP Load(IStorage* storage) override;
  STDMETHODIMP Save(IStorage* storage, BOOL sameAsLoad) override;
  STDMETHODIMP SaveCompleted(IStorage* storage) override;
  STDMETHODIMP HandsOffStorage() override;

  // IDataObject: the picture as a metafile, of either kind.
  STDMETHODIMP GetData(FORMATETC* format, STGMEDIUM* medium) override;
  STDMETHODIMP GetDataHere(FORMATETC* format, STGMEDIUM* medium) override;
  STDMETHODIMP QueryGetData(FORMATETC* format) override;
  STDMETHODIMP GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) override;
  STDMETHODIMP SetData(FORMATETC* format, STGMEDIUM* medium, BOOL release) override;
  STDMETHODIMP EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) override;
  STDMETHODIMP DAdvise(FORMATETC* format, DWORD flags, IAdviseSink* sink, DWORD* cookie) override;
  STDMETHODIMP DUnadvise(DWORD cookie) override;
  STDMETHODIMP EnumDAdvise(IEnumSTATDATA** enumerator) override;

 private:
  OleControl& control_;
  ComPtr<IDataAdviseHolder> listeners_;
};

}  // namespace tarnwick
