#include "surface/CUploadObject.h"

#include "surface/Guard.h"

namespace tarnwick {

ComPtr<CUploadObject> CUploadObject::From(IUnknown* object) {
  // The class's own identifier serves as a private interface that leads back to the object.
  ComPtr<CUploadObject> self;
  if (object) object->QueryInterface(CLSID_CUpload, self.ReceiveVoid());
  return self;
}

void* CUploadObject::FindInterface(REFIID interfaceId) {
  return interfaceId == CLSID_CUpload ? this : DualObject::FindInterface(interfaceId);
}

STDMETHODIMP CUploadObject::get_FileName(BSTR* value) {
  return GetText(record_->FileName, value);
}
STDMETHODIMP CUploadObject::put_FileName(BSTR value) {
  return PutText(record_->FileName, value);
}
STDMETHODIMP CUploadObject::get_FileDate(BSTR* value) {
  return GetText(record_->FileDate, value);
}
STDMETHODIMP CUploadObject::put_FileDate(BSTR value) {
  return PutText(record_->FileDate, value);
}
STDMETHODIMP CUploadObject::get_FilePath(BSTR* value) {
  return GetText(record_->FilePath, value);
}
STDMETHODIMP CUploadObject::put_FilePath(BSTR value) {
  return PutText(record_->FilePath, value);
}
STDMETHODIMP CUploadObject::get_FileSize(double* value) {
  return GetNumber(record_->FileSize, value);
}

STDMETHODIMP CUploadObject::put_FileSize(double value) {
  record_->FileSize = value;
  return S_OK;
}

}  // namespace tarnwick
