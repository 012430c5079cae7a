// CUpload as hosts see it.
#pragma once

#include <memory>

#include "session/CUpload.h"
#include "surface/DualObject.h"
#include "surface/TypeLibrary.h"

namespace tarnwick {

class CUploadObject final : public DualObject<_CUpload> {
 public:
  // Shows `record`, which the object shares with the library.
  explicit CUploadObject(std::shared_ptr<CUpload> record) : record_(std::move(record)) {}

  const std::shared_ptr<CUpload>& Record() const { return record_; }

  // The object behind an interface that a host hands in; null when it is not one of ours. Runs the code of
  // the host's own object.
  static ComPtr<CUploadObject> From(IUnknown* object);

  STDMETHODIMP get_FileName(BSTR* value) override;
  STDMETHODIMP put_FileName(BSTR value) override;
  STDMETHODIMP get_FileDate(BSTR* value) override;
  STDMETHODIMP put_FileDate(BSTR value) override;
  STDMETHODIMP get_FilePath(BSTR* value) override;
  STDMETHODIMP put_FilePath(BSTR value) override;
  STDMETHODIMP get_FileSize(double* value) override;
  STDMETHODIMP put_FileSize(double value) override;

 private:
  void* FindInterface(REFIID interfaceId) override;

  const std::shared_ptr<CUpload> record_;
};

}  // namespace tarnwick
