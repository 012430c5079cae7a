#include "surface/Embedding.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

#include "platform/windows/Owner.h"
#include "surface/ComEnumerator.h"
#include "surface/Guard.h"
#include "surface/OleControl.h"

namespace tarnwick {
namespace {

constexpr wchar_t kStreamName[] = L"Contents";

constexpr std::array kFormats = {
    FORMATETC{CF_ENHMETAFILE, nullptr, DVASPECT_CONTENT, -1, TYMED_ENHMF},
    FORMATETC{CF_METAFILEPICT, nullptr, DVASPECT_CONTENT, -1, TYMED_MFPICT},
};

using MetafileOwner = Owner<HENHMETAFILE, DeleteEnhMetaFile>;

// The screen, as what a metafile measures itself against.
class Reference {
 public:
  Reference() = default;
  ~Reference() { ReleaseDC(nullptr, dc_); }
  Reference(const Reference&) = delete;
  Reference& operator=(const Reference&) = delete;
  HDC Get() const { return dc_; }

 private:
  const HDC dc_ = GetDC(nullptr);
};

// Empty when there is no memory.
MetafileOwner PictureOf(OleControl& control, const SIZEL& himetric, HDC reference) {
  const RECT frame = {0, 0, himetric.cx, himetric.cy};
  const HDC dc = CreateEnhMetaFileW(reference, nullptr, &frame, nullptr);
  if (!dc) return {};
  // Metafiles count by the millimetres of the device, not by its dots per inch.
  const RECTL bounds = {
      0, 0, MulDiv(himetric.cx, GetDeviceCaps(reference, HORZRES), 100 * GetDeviceCaps(reference, HORZSIZE)),
      MulDiv(himetric.cy, GetDeviceCaps(reference, VERTRES), 100 * GetDeviceCaps(reference, VERTSIZE))};
  control.Draw(DVASPECT_CONTENT, -1, nullptr, nullptr, nullptr, dc, &bounds, nullptr, nullptr, 0);
  return MetafileOwner(CloseEnhMetaFile(dc));
}

// The same picture as older programs take it; null when there is no memory.
HGLOBAL OldPictureOf(const MetafileOwner& picture, const SIZEL& himetric, HDC reference) {
  std::vector<BYTE> bits(GetWinMetaFileBits(picture.Get(), 0, nullptr, MM_ANISOTROPIC, reference));
  const auto size = static_cast<UINT>(bits.size());
  GetWinMetaFileBits(picture.Get(), size, bits.data(), MM_ANISOTROPIC, reference);
  const HMETAFILE old = SetMetaFileBitsEx(size, bits.data());
  const HGLOBAL block = old ? GlobalAlloc(GMEM_MOVEABLE, sizeof(METAFILEPICT)) : nullptr;
  if (!block) {
    if (old) DeleteMetaFile(old);
    return nullptr;
  }
  const METAFILEPICT head = {MM_ANISOTROPIC, himetric.cx, himetric.cy, old};
  std::memcpy(GlobalLock(block), &head, sizeof head);
  GlobalUnlock(block);
  return block;
}

}  // namespace

void Embedding::ViewChanged() {
  if (const ComPtr<IDataAdviseHolder> listeners = listeners_) listeners->SendOnDataChange(this, 0, 0);
}

STDMETHODIMP Embedding::QueryInterface(REFIID interfaceId, void** object) {
  return control_.QueryInterface(interfaceId, object);
}
STDMETHODIMP_(ULONG) Embedding::AddRef() {
  return control_.AddRef();
}
STDMETHODIMP_(ULONG) Embedding::Release() {
  return control_.Release();
}

// --- IPersistStorage ---

STDMETHODIMP Embedding::GetClassID(CLSID* classId) {
  return control_.GetClassID(classId);
}

STDMETHODIMP Embedding::IsDirty() {
  return control_.IsDirty();
}

STDMETHODIMP Embedding::InitNew(IStorage* storage) {
  return storage ? control_.InitNew() : E_POINTER;
}

STDMETHODIMP Embedding::Load(IStorage* storage) {
  if (!storage) return E_POINTER;
  // The storage may be the host's own, whose code may release the control.
  const ComPtr<IPersistStorage> alive(this);
  ComPtr<IStream> stream;
  const HRESULT opened =
      storage->OpenStream(kStreamName, nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, 0, stream.Receive());
  return FAILED(opened) ? opened : control_.Load(stream.Get());
}

STDMETHODIMP Embedding::Save(IStorage* storage, BOOL sameAsLoad) {
  if (!storage) return E_POINTER;
  const ComPtr<IPersistStorage> alive(this);
  ComPtr<IStream> stream;
  const HRESULT made = storage->CreateStream(kStreamName, STGM_CREATE | STGM_WRITE | STGM_SHARE_EXCLUSIVE, 0,
                                             0, stream.Receive());
  return FAILED(made) ? made : control_.Save(stream.Get(), sameAsLoad);
}

STDMETHODIMP Embedding::SaveCompleted(IStorage*) {
  return S_OK;
}

STDMETHODIMP Embedding::HandsOffStorage() {
  return S_OK;
}

// --- IDataObject ---

STDMETHODIMP Embedding::GetData(FORMATETC* format, STGMEDIUM* medium) {
  if (!format || !medium) return E_POINTER;
  *medium = {};
  const HRESULT known = QueryGetData(format);
  if (known != S_OK) return known;
  return Guarded([&] {
    SIZEL extent = {};
    control_.GetExtent(DVASPECT_CONTENT, &extent);
    const Reference reference;
    MetafileOwner picture = PictureOf(control_, extent, reference.Get());
    if (!picture) return E_OUTOFMEMORY;
    if (format->cfFormat == CF_ENHMETAFILE) {
      medium->tymed = TYMED_ENHMF;
      medium->hEnhMetaFile = picture.Detach();
      return S_OK;
    }
    medium->hMetaFilePict = OldPictureOf(picture, extent, reference.Get());
    if (!medium->hMetaFilePict) return E_OUTOFMEMORY;
    medium->tymed = TYMED_MFPICT;
    return S_OK;
  });
}

STDMETHODIMP Embedding::GetDataHere(FORMATETC*, STGMEDIUM*) {
  return DV_E_FORMATETC;
}

STDMETHODIMP Embedding::QueryGetData(FORMATETC* format) {
  if (!format) return E_POINTER;
  if (format->dwAspect != DVASPECT_CONTENT) return DV_E_DVASPECT;
  const auto* const found = std::find_if(kFormats.begin(), kFormats.end(), [&](const FORMATETC& known) {
    return known.cfFormat == format->cfFormat;
  });
  if (found == kFormats.end()) return DV_E_FORMATETC;
  return format->tymed & found->tymed ? S_OK : DV_E_TYMED;
}

STDMETHODIMP Embedding::GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) {
  if (!format || !canonical) return E_POINTER;
  *canonical = *format;
  canonical->ptd = nullptr;
  return DATA_S_SAMEFORMATETC;
}

STDMETHODIMP Embedding::SetData(FORMATETC*, STGMEDIUM*, BOOL) {
  return E_NOTIMPL;
}

STDMETHODIMP Embedding::EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  if (direction != DATADIR_GET) return E_NOTIMPL;
  return Guarded([&] {
    *enumerator = new ComEnumerator<IEnumFORMATETC, FORMATETC>({kFormats.begin(), kFormats.end()});
    return S_OK;
  });
}

STDMETHODIMP Embedding::DAdvise(FORMATETC* format, DWORD flags, IAdviseSink* sink, DWORD* cookie) {
  if (!format || !sink || !cookie) return E_POINTER;
  // 0 stands for all of them.
  const HRESULT known = format->cfFormat == 0 ? S_OK : QueryGetData(format);
  if (known != S_OK) return known;
  if (!listeners_) {
    const HRESULT made = CreateDataAdviseHolder(listeners_.Receive());
    if (FAILED(made)) return made;
  }
  const ComPtr<IDataAdviseHolder> listeners = listeners_;
  return listeners->Advise(this, format, flags, sink, cookie);
}

STDMETHODIMP Embedding::DUnadvise(DWORD cookie) {
  const ComPtr<IDataAdviseHolder> listeners = listeners_;
  return listeners ? listeners->Unadvise(cookie) : OLE_E_NOCONNECTION;
}

STDMETHODIMP Embedding::EnumDAdvise(IEnumSTATDATA** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return listeners_ ? listeners_->EnumAdvise(enumerator) : OLE_E_ADVISENOTSUPPORTED;
}

}  // namespace tarnwick
