#include "surface/View.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

#include "platform/windows/Owner.h"
#include "platform/windows/SystemDpi.h"
#include "surface/ComEnumerator.h"

namespace tarnwick {
namespace {

constexpr int kHimetricPerInch = 2540;

constexpr std::array kFormats = {
    FORMATETC{CF_ENHMETAFILE, nullptr, DVASPECT_CONTENT, -1, TYMED_ENHMF},
    FORMATETC{CF_METAFILEPICT, nullptr, DVASPECT_CONTENT, -1, TYMED_MFPICT},
};

using MetafileOwner = Owner<HENHMETAFILE, DeleteEnhMetaFile>;

// Empty when there is no memory.
MetafileOwner PictureOf(View& view, const SIZEL& himetric, HDC reference) {
  const RECT frame = {0, 0, himetric.cx, himetric.cy};
  const HDC dc = CreateEnhMetaFileW(reference, nullptr, &frame, nullptr);
  if (!dc) return {};
  // Metafiles count by the millimetres of the device, not by its dots per inch.
  const RECTL bounds = {
      0, 0, MulDiv(himetric.cx, GetDeviceCaps(reference, HORZRES), 100 * GetDeviceCaps(reference, HORZSIZE)),
      MulDiv(himetric.cy, GetDeviceCaps(reference, VERTRES), 100 * GetDeviceCaps(reference, VERTSIZE))};
  view.Draw(DVASPECT_CONTENT, -1, nullptr, nullptr, nullptr, dc, &bounds, nullptr, nullptr, 0);
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

void View::NotifyChanged() {
  const ComPtr<IUnknown> alive = KeptAlive();
  if (const ComPtr<IDataAdviseHolder> advises = dataAdvises_) advises->SendOnDataChange(this, 0, 0);
  const ComPtr<IAdviseSink> sink = sink_;
  if (sink && (aspects_ & DVASPECT_CONTENT)) {
    if (flags_ & ADVF_ONLYONCE) sink_ = {};
    sink->OnViewChange(DVASPECT_CONTENT, -1);
  }
}

void View::SetExtent(const SIZEL& extent) {
  extent_ = extent;
  NotifyChanged();
}

// --- IViewObject2 ---

STDMETHODIMP View::Draw(DWORD aspect, LONG, void*, DVTARGETDEVICE*, HDC, HDC dc, LPCRECTL bounds, LPCRECTL,
                        BOOL(STDMETHODCALLTYPE*)(ULONG_PTR), ULONG_PTR) {
  if (!bounds || !dc) return E_INVALIDARG;
  if (aspect != DVASPECT_CONTENT) return DV_E_DVASPECT;
  return Entered([&] {
    // Drawn in pixels whatever the target counts in: the picture is laid out as it looks on the screen.
    const int dpi = SystemDpi();
    const SIZE size = hooks_.SizeOnOtherScreen().value_or(
        SIZE{MulDiv(extent_.cx, dpi, kHimetricPerInch), MulDiv(extent_.cy, dpi, kHimetricPerInch)});
    POINT corners[2] = {{bounds->left, bounds->top}, {bounds->right, bounds->bottom}};
    LPtoDP(dc, corners, 2);
    const SavedDcOwner saved = SaveStateOf(dc);
    SetMapMode(dc, MM_ANISOTROPIC);
    SetWindowOrgEx(dc, 0, 0, nullptr);
    SetWindowExtEx(dc, size.cx, size.cy, nullptr);
    SetViewportOrgEx(dc, corners[0].x, corners[0].y, nullptr);
    SetViewportExtEx(dc, corners[1].x - corners[0].x, corners[1].y - corners[0].y, nullptr);
    hooks_.Draw(dc, {0, 0, size.cx, size.cy});
    return S_OK;
  });
}

STDMETHODIMP View::GetColorSet(DWORD, LONG, void*, DVTARGETDEVICE*, HDC, LOGPALETTE** colors) {
  if (!colors) return E_POINTER;
  *colors = nullptr;
  return S_FALSE;
}

STDMETHODIMP View::SetAdvise(DWORD aspects, DWORD flags, IAdviseSink* sink) {
  return Entered([&] {
    sink_ = ComPtr<IAdviseSink>(sink);
    aspects_ = aspects;
    flags_ = flags;
    if (flags & ADVF_PRIMEFIRST) NotifyChanged();
    return S_OK;
  });
}

STDMETHODIMP View::GetAdvise(DWORD* aspects, DWORD* flags, IAdviseSink** sink) {
  if (aspects) *aspects = aspects_;
  if (flags) *flags = flags_;
  if (sink) *sink = ComPtr<IAdviseSink>(sink_).Detach();
  return S_OK;
}

STDMETHODIMP View::GetExtent(DWORD aspect, LONG, DVTARGETDEVICE*, SIZEL* himetric) {
  if (!himetric) return E_POINTER;
  if (aspect != DVASPECT_CONTENT) return DV_E_DVASPECT;
  *himetric = extent_;
  return S_OK;
}

// --- IDataObject ---

STDMETHODIMP View::GetData(FORMATETC* format, STGMEDIUM* medium) {
  if (!format || !medium) return E_POINTER;
  *medium = {};
  const HRESULT known = QueryGetData(format);
  if (known != S_OK) return known;
  return Entered([&] {
    const SIZEL extent = extent_;
    // The screen is what a metafile measures itself against.
    const WindowDcOwner screen = DcOf(nullptr);
    MetafileOwner picture = PictureOf(*this, extent, screen.Get().dc);
    if (!picture) return E_OUTOFMEMORY;
    if (format->cfFormat == CF_ENHMETAFILE) {
      medium->tymed = TYMED_ENHMF;
      medium->hEnhMetaFile = picture.Detach();
      return S_OK;
    }
    medium->hMetaFilePict = OldPictureOf(picture, extent, screen.Get().dc);
    if (!medium->hMetaFilePict) return E_OUTOFMEMORY;
    medium->tymed = TYMED_MFPICT;
    return S_OK;
  });
}

STDMETHODIMP View::QueryGetData(FORMATETC* format) {
  if (!format) return E_POINTER;
  if (format->dwAspect != DVASPECT_CONTENT) return DV_E_DVASPECT;
  const auto* const found = std::find_if(kFormats.begin(), kFormats.end(), [&](const FORMATETC& known) {
    return known.cfFormat == format->cfFormat;
  });
  if (found == kFormats.end()) return DV_E_FORMATETC;
  return format->tymed & found->tymed ? S_OK : DV_E_TYMED;
}

STDMETHODIMP View::GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) {
  if (!format || !canonical) return E_POINTER;
  *canonical = *format;
  canonical->ptd = nullptr;
  return DATA_S_SAMEFORMATETC;
}

STDMETHODIMP View::EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  if (direction != DATADIR_GET) return E_NOTIMPL;
  return Entered([&] {
    *enumerator = new ComEnumerator<IEnumFORMATETC, FORMATETC>({kFormats.begin(), kFormats.end()});
    return S_OK;
  });
}

STDMETHODIMP View::DAdvise(FORMATETC* format, DWORD flags, IAdviseSink* sink, DWORD* cookie) {
  if (!format || !sink || !cookie) return E_POINTER;
  // 0 stands for all of them.
  const HRESULT known = format->cfFormat == 0 ? S_OK : QueryGetData(format);
  if (known != S_OK) return known;
  return Entered([&] {
    if (!dataAdvises_) {
      const HRESULT made = CreateDataAdviseHolder(dataAdvises_.Receive());
      if (FAILED(made)) return made;
    }
    const ComPtr<IDataAdviseHolder> advises = dataAdvises_;
    return advises->Advise(this, format, flags, sink, cookie);
  });
}

STDMETHODIMP View::DUnadvise(DWORD cookie) {
  return Entered([&] {
    const ComPtr<IDataAdviseHolder> advises = dataAdvises_;
    return advises ? advises->Unadvise(cookie) : OLE_E_NOCONNECTION;
  });
}

STDMETHODIMP View::EnumDAdvise(IEnumSTATDATA** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  return Entered(
      [&] { return dataAdvises_ ? dataAdvises_->EnumAdvise(enumerator) : OLE_E_ADVISENOTSUPPORTED; });
}

}  // namespace tarnwick
