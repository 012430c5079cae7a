#include "surface/DataObject.h"

#include <shellapi.h>
#include <shlobj.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <string>

#include "base/RuntimeError.h"
#include "platform/windows/AnsiText.h"
#include "surface/CollectionObject.h"
#include "surface/ComEnumerator.h"
#include "surface/Guard.h"

namespace tarnwick {
namespace {

constexpr DISPID kGetData = 1;
constexpr DISPID kSetData = 2;
constexpr DISPID kGetFormat = 3;
constexpr DISPID kClear = 4;
constexpr DISPID kFiles = 5;

constexpr std::array kMembers = {LateBoundMember{L"GetData", kGetData}, LateBoundMember{L"SetData", kSetData},
                                 LateBoundMember{L"GetFormat", kGetFormat}, LateBoundMember{L"Clear", kClear},
                                 LateBoundMember{L"Files", kFiles}};

FORMATETC FormatOf(CLIPFORMAT format) {
  return {format, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
}

// A block of global memory with these bytes; null when there is no memory.
HGLOBAL GlobalCopy(const void* bytes, std::size_t size) {
  const HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, size);
  if (!block) return nullptr;
  std::memcpy(GlobalLock(block), bytes, size);
  GlobalUnlock(block);
  return block;
}

// The files as DROPFILES: the head, then each path with its terminator, then one more.
HGLOBAL DropFilesOf(const std::vector<Text>& files) {
  std::wstring paths;
  for (const Text& file : files) paths += WideFromText(file) + L'\0';
  paths += L'\0';
  DROPFILES head = {};
  head.pFiles = sizeof head;
  head.fWide = TRUE;
  std::string block(reinterpret_cast<const char*>(&head), sizeof head);
  block.append(reinterpret_cast<const char*>(paths.data()), paths.size() * sizeof(wchar_t));
  return GlobalCopy(block.data(), block.size());
}

std::vector<Text> FilesOf(HDROP drop) {
  std::vector<Text> files;
  const UINT count = DragQueryFileW(drop, 0xFFFFFFFF, nullptr, 0);
  for (UINT i = 0; i < count; ++i) {
    std::wstring path(DragQueryFileW(drop, i, nullptr, 0), L'\0');
    DragQueryFileW(drop, i, path.data(), static_cast<UINT>(path.size() + 1));
    files.push_back(TextFromWide(path));
  }
  return files;
}

}  // namespace

DataObject::DataObject(TextView text, TextView file) : text_(text), hasText_(!text.empty()) {
  if (!file.empty()) files_.emplace_back(file);
}

DataObject::DataObject(IDataObject& foreign) {
  STGMEDIUM medium = {};
  FORMATETC format = FormatOf(CF_HDROP);
  if (SUCCEEDED(foreign.GetData(&format, &medium))) {
    if (medium.tymed == TYMED_HGLOBAL) files_ = FilesOf(static_cast<HDROP>(medium.hGlobal));
    ReleaseStgMedium(&medium);
  }
  format = FormatOf(CF_UNICODETEXT);
  if (SUCCEEDED(foreign.GetData(&format, &medium))) {
    if (const auto* units = medium.tymed == TYMED_HGLOBAL
                                ? static_cast<const wchar_t*>(GlobalLock(medium.hGlobal))
                                : nullptr) {
      // What comes from elsewhere need not have its terminator.
      const std::size_t room = GlobalSize(medium.hGlobal) / sizeof(wchar_t);
      text_ = TextFromWide({units, static_cast<std::size_t>(std::find(units, units + room, L'\0') - units)});
      hasText_ = true;
      GlobalUnlock(medium.hGlobal);
    }
    ReleaseStgMedium(&medium);
  }
}

bool DataObject::Has(CLIPFORMAT format) const {
  return ((format == CF_UNICODETEXT || format == CF_TEXT) && hasText_) ||
         (format == CF_HDROP && !files_.empty());
}

const Text& DataObject::FetchText() {
  const std::optional<CLIPFORMAT> promised = std::exchange(promised_, std::nullopt);
  if (promised && onPromised_) onPromised_(static_cast<std::int16_t>(*promised));
  return text_;
}

// --- IDataObject ---

STDMETHODIMP DataObject::QueryGetData(FORMATETC* format) {
  if (!format) return E_POINTER;
  if (format->dwAspect != DVASPECT_CONTENT) return DV_E_DVASPECT;
  if (!(format->tymed & TYMED_HGLOBAL)) return DV_E_TYMED;
  return Has(format->cfFormat) ? S_OK : DV_E_FORMATETC;
}

STDMETHODIMP DataObject::GetData(FORMATETC* format, STGMEDIUM* medium) {
  if (!medium) return E_POINTER;
  *medium = {};
  const HRESULT known = QueryGetData(format);
  if (FAILED(known)) return known;
  return Guarded([&] {
    switch (format->cfFormat) {
      case CF_HDROP:
        medium->hGlobal = DropFilesOf(files_);
        break;
      case CF_UNICODETEXT: {
        const Text& text = FetchText();
        medium->hGlobal = GlobalCopy(text.c_str(), (text.size() + 1) * sizeof(char16_t));
        break;
      }
      default: {
        const std::string ansi = AnsiFromText(FetchText()).value_or(std::string());
        medium->hGlobal = GlobalCopy(ansi.c_str(), ansi.size() + 1);
        break;
      }
    }
    if (!medium->hGlobal) return STG_E_MEDIUMFULL;
    medium->tymed = TYMED_HGLOBAL;
    return S_OK;
  });
}

STDMETHODIMP DataObject::GetDataHere(FORMATETC*, STGMEDIUM*) {
  return E_NOTIMPL;
}

STDMETHODIMP DataObject::GetCanonicalFormatEtc(FORMATETC*, FORMATETC* canonical) {
  if (!canonical) return E_POINTER;
  canonical->ptd = nullptr;
  return E_NOTIMPL;
}

STDMETHODIMP DataObject::SetData(FORMATETC*, STGMEDIUM*, BOOL) {
  return E_NOTIMPL;
}

STDMETHODIMP DataObject::EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) {
  if (!enumerator) return E_POINTER;
  *enumerator = nullptr;
  if (direction != DATADIR_GET) return E_NOTIMPL;
  return Guarded([&] {
    std::vector<FORMATETC> formats;
    for (const CLIPFORMAT format : std::array<CLIPFORMAT, 3>{CF_HDROP, CF_UNICODETEXT, CF_TEXT})
      if (Has(format)) formats.push_back(FormatOf(format));
    *enumerator = new ComEnumerator<IEnumFORMATETC, FORMATETC>(std::move(formats));
    return S_OK;
  });
}

STDMETHODIMP DataObject::DAdvise(FORMATETC*, DWORD, IAdviseSink*, DWORD*) {
  return OLE_E_ADVISENOTSUPPORTED;
}
STDMETHODIMP DataObject::DUnadvise(DWORD) {
  return OLE_E_ADVISENOTSUPPORTED;
}
STDMETHODIMP DataObject::EnumDAdvise(IEnumSTATDATA**) {
  return OLE_E_ADVISENOTSUPPORTED;
}

// --- LateBoundObject ---

std::span<const LateBoundMember> DataObject::Members() const {
  return kMembers;
}

const OLECHAR* DataObject::DescriptionOf(std::int32_t number) const {
  return number == error::kInvalidFormat ? L"The data has no such format"
                                         : L"The argument is of the wrong type";
}

HRESULT DataObject::Call(DISPID member, const LateBoundArguments& arguments, Variant& result) {
  const auto format = [&](UINT parameter) {
    const VARIANT* given = arguments.At(parameter);
    return given ? static_cast<CLIPFORMAT>(NumberFromVariant(*given)) : CLIPFORMAT{CF_TEXT};
  };
  switch (member) {
    case kGetData: {
      const CLIPFORMAT wanted = format(0);
      if (!Has(wanted)) throw RuntimeError(error::kInvalidFormat);
      if (wanted != CF_HDROP) result.Get() = VariantFromText(FetchText());
      break;
    }
    case kSetData: {
      if (format(1) == CF_HDROP) throw RuntimeError(error::kInvalidFormat);
      const VARIANT* text = arguments.At(0);
      promised_.reset();
      if (!text || V_VT(text) == VT_ERROR) promised_ = format(1);
      text_ = promised_ ? Text() : TextFromVariant(*text);
      hasText_ = true;
      break;
    }
    case kGetFormat:
      V_VT(&result.Get()) = VT_BOOL;
      V_BOOL(&result.Get()) = AutomationBoolean(Has(format(0)));
      break;
    case kClear:
      text_.clear();
      hasText_ = false;
      promised_.reset();
      files_.clear();
      break;
    case kFiles: {
      auto files = ComPtr<CollectionObject>::Adopt(new CollectionObject);
      for (const Text& file : files_) {
        Variant path;
        path.Get() = VariantFromText(file);
        files->Append(std::move(path));
      }
      V_VT(&result.Get()) = VT_DISPATCH;
      V_DISPATCH(&result.Get()) = files.Detach();
      break;
    }
    default:
      return DISP_E_MEMBERNOTFOUND;
  }
  return S_OK;
}

}  // namespace tarnwick
