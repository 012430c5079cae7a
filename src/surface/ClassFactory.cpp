#include "surface/ClassFactory.h"

#include <array>

#include "platform/windows/ComPtr.h"
#include "surface/CBVAccountObject.h"
#include "surface/CFileUploadObject.h"
#include "surface/ComObject.h"
#include "surface/Guard.h"
#include "surface/Module.h"
#include "surface/TypeLibrary.h"
#include "surface/ctrlListImageObject.h"
#include "surface/ctrlThumbNailViewObject.h"

namespace tarnwick {
namespace {

// In Tarnwick.rc.
constexpr int kListImageBitmap = 101;
constexpr int kThumbNailViewBitmap = 102;

template <typename Object>
IUnknown* Make(IUnknown*) {
  return static_cast<IUnknown*>(static_cast<IDispatch*>(new Object));
}

template <typename Control>
IUnknown* MakeControl(IUnknown* outer) {
  return (new Control(outer))->Own();
}

const std::array kClasses = {
    CreatableClass{CLSID_CFileUpload, L"CFileUpload", L"Tarnwick client of the hosting service", 0,
                   Make<CFileUploadObject>},
    CreatableClass{CLSID_CBVAccount, L"CBVAccount", L"Tarnwick account details", 0, Make<CBVAccountObject>},
    CreatableClass{CLSID_ctrlListImage, L"ctrlListImage", L"Tarnwick list of the account's files",
                   kListImageBitmap, MakeControl<ctrlListImageObject>},
    CreatableClass{CLSID_ctrlThumbNailView, L"ctrlThumbNailView",
                   L"Tarnwick thumbnails of the account's pictures", kThumbNailViewBitmap,
                   MakeControl<ctrlThumbNailViewObject>},
};

class ClassFactory final : public ComObject<IClassFactory> {
 public:
  explicit ClassFactory(const CreatableClass& itsClass) : class_(itsClass) {}

  STDMETHODIMP CreateInstance(IUnknown* outer, REFIID interfaceId, void** object) override {
    if (!object) return E_POINTER;
    *object = nullptr;
    // Containers make a control and what they add to it one object.
    if (outer && (!class_.IsControl() || interfaceId != IID_IUnknown)) return CLASS_E_NOAGGREGATION;
    return Guarded([&] {
      const auto made = ComPtr<IUnknown>::Adopt(class_.make(outer));
      return made->QueryInterface(interfaceId, object);
    });
  }
  STDMETHODIMP LockServer(BOOL lock) override {
    return Guarded([&] {
      lock ? module::Hold() : module::LetGo();
      return S_OK;
    });
  }

 private:
  const CreatableClass& class_;
};

}  // namespace

std::span<const CreatableClass> CreatableClasses() {
  return kClasses;
}

HRESULT GetClassFactory(REFCLSID classId, REFIID interfaceId, void** factory) {
  if (!factory) return E_POINTER;
  *factory = nullptr;
  return Guarded([&]() -> HRESULT {
    for (const CreatableClass& known : kClasses) {
      if (known.id != classId) continue;
      const auto made = ComPtr<IClassFactory>::Adopt(new ClassFactory(known));
      return made->QueryInterface(interfaceId, factory);
    }
    return CLASS_E_CLASSNOTAVAILABLE;
  });
}

}  // namespace tarnwick
