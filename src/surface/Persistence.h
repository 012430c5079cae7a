// How a control is kept with its host's form or document: in a stream, a property bag, or a storage of its
// own.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ocidl.h>

#include "surface/ControlPart.h"

namespace tarnwick {

// The entries that load and save run the host's code, which may release the control inside.
class Persistence final : public ControlPart<IPersistStreamInit, IPersistPropertyBag, IPersistStorage> {
 public:
  using ControlPart::ControlPart;

  // Since the control was last loaded or saved, a property has changed.
  bool HasChanges() const { return dirty_; }
  void NoteChange() { dirty_ = true; }

  // IPersist
  STDMETHODIMP GetClassID(CLSID* classId) override;

  // IPersistStreamInit
  STDMETHODIMP IsDirty() override { return dirty_ ? S_OK : S_FALSE; }
  STDMETHODIMP Load(IStream* stream) override;
  STDMETHODIMP Save(IStream* stream, BOOL clearDirty) override;
  STDMETHODIMP GetSizeMax(ULARGE_INTEGER* size) override;
  STDMETHODIMP InitNew() override;

  // IPersistPropertyBag
  STDMETHODIMP Load(IPropertyBag* bag, IErrorLog* log) override;
  STDMETHODIMP Save(IPropertyBag* bag, BOOL clearDirty, BOOL all) override;

  // IPersistStorage. No storage is held between the calls.
  STDMETHODIMP InitNew(IStorage* storage) override;
  STDMETHODIMP Load(IStorage* storage) override;
  STDMETHODIMP Save(IStorage* storage, BOOL sameAsLoad) override;
  STDMETHODIMP SaveCompleted(IStorage*) override { return S_OK; }
  STDMETHODIMP HandsOffStorage() override { return S_OK; }

 private:
  bool dirty_ = false;
};

}  // namespace tarnwick
