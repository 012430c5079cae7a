#include "surface/ctrlThumbNailViewObject.h"

#include "surface/Guard.h"

namespace tarnwick {
namespace {

const ControlClass kClass = {CLSID_ctrlThumbNailView, DIID___ctrlThumbNailView, L"Tarnwick.ctrlThumbNailView",
                             WindowsThumbnailPage::kNaturalExtent};

}  // namespace

ctrlThumbNailViewObject::ctrlThumbNailViewObject(IUnknown* outer)
    : FileControlObject(kClass, outer),
      page_(module::Instance(), *this),
      scrollHook_(TheApartment().scrollHook),
      rules_(std::make_unique<ctrlThumbNailView>(Parts(), page_)) {
  page_.SetUser(*rules_);
}

STDMETHODIMP ctrlThumbNailViewObject::get_iImgNo(short* value) {
  return GetNumber<short>(rules_->iImgNo, value);
}
STDMETHODIMP ctrlThumbNailViewObject::put_iImgNo(short value) {
  return PutNumber(rules_->iImgNo, value);
}

STDMETHODIMP ctrlThumbNailViewObject::EditFileLabel(VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return ctrlThumbNailView::EditFileLabel(); });
}

STDMETHODIMP ctrlThumbNailViewObject::SetLabelText(BSTR* szString, VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    rules_->SetLabelText(ViewOf(szString));
    Ole().ViewChanged();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlThumbNailViewObject::ValidateFileName(BSTR* NewString, VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    Text name(ViewOf(NewString));
    rules_->ValidateFileName(name);
    AssignChanged(NewString, name);
    Ole().ViewChanged();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlThumbNailViewObject::PictureSetFocus(VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    rules_->PictureSetFocus();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlThumbNailViewObject::Overlay(VARIANT*, VARIANT*, IPictureDisp** result) {
  if (!result) return E_POINTER;
  *result = nullptr;
  return S_OK;
}

}  // namespace tarnwick
