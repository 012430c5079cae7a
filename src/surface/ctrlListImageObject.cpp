#include "surface/ctrlListImageObject.h"

#include "surface/Guard.h"

namespace tarnwick {
namespace {

// 320 by 240 pixels at 96 dots per inch.
constexpr SIZEL kExtent = {320 * 2540 / 96, 240 * 2540 / 96};

const ControlClass kClass = {CLSID_ctrlListImage, DIID___ctrlListImage, L"Tarnwick.ctrlListImage", kExtent};

}  // namespace

ctrlListImageObject::ctrlListImageObject(IUnknown* outer)
    : FileControlObject(kClass, outer),
      view_(module::Instance(), *this),
      rules_(std::make_unique<ctrlListImage>(Parts(), view_)) {
  view_.SetUser(*rules_);
}

STDMETHODIMP ctrlListImageObject::get_m_lDownloadedBytes(LONG* value) {
  return GetNumber<LONG>(rules_->m_lDownloadedBytes, value);
}
STDMETHODIMP ctrlListImageObject::put_m_lDownloadedBytes(LONG value) {
  return PutNumber(rules_->m_lDownloadedBytes, value);
}
STDMETHODIMP ctrlListImageObject::GetFileNames(VARIANT* result) {
  return AnsweredVariant(result, [&] {
    const std::vector<Text> names = rules_->GetFileNames();
    Variant array;
    V_ARRAY(&array.Get()) = SafeArrayCreateVector(VT_VARIANT, 0, static_cast<ULONG>(names.size()));
    if (!V_ARRAY(&array.Get())) throw std::bad_alloc();
    V_VT(&array.Get()) = VT_ARRAY | VT_VARIANT;
    for (std::size_t i = 0; i < names.size(); ++i) {
      Variant name;
      name.Get() = VariantFromText(names[i]);
      LONG position = static_cast<LONG>(i);
      if (FAILED(SafeArrayPutElement(V_ARRAY(&array.Get()), &position, &name.Get()))) throw std::bad_alloc();
    }
    return array.Detach();
  });
}

STDMETHODIMP ctrlListImageObject::SetMultiSelectProperty(VARIANT_BOOL* bVal, VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    rules_->SetMultiSelectProperty(bVal && *bVal != VARIANT_FALSE);
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::ListViewSetFocus(VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    rules_->ListViewSetFocus();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::StartLabelExit(VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    rules_->StartLabelExit();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::Overlay(VARIANT* Key1, VARIANT* Key2, IPictureDisp** result) {
  if (!result) return E_POINTER;
  *result = nullptr;
  if (!Key1 || !Key2) return E_POINTER;
  // A key may be an object of the host's, whose code tells its number.
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&]() -> HRESULT {
    const std::int32_t lower = NumberFromVariant(*Key1);
    const std::int32_t upper = NumberFromVariant(*Key2);
    view_.Window();
    const int count = ImageList_GetImageCount(view_.SmallIcons());
    if (lower < 1 || lower > count || upper < 1 || upper > count)
      throw RuntimeError(error::kSubscriptOutOfRange);
    const ImageListOwner merged(
        ImageList_Merge(view_.SmallIcons(), lower - 1, view_.SmallIcons(), upper - 1, 0, 0));
    PICTDESC description = {};
    description.cbSizeofstruct = sizeof description;
    description.picType = PICTYPE_ICON;
    IconOwner icon(ImageList_GetIcon(merged.Get(), 0, ILD_TRANSPARENT));
    description.icon.hicon = icon.Get();
    const HRESULT made =
        OleCreatePictureIndirect(&description, IID_IPictureDisp, TRUE, reinterpret_cast<void**>(result));
    // The picture owns it now.
    if (SUCCEEDED(made)) icon.Detach();
    return made;
  });
}

}  // namespace tarnwick
