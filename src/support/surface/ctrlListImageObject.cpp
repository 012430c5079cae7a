#include "support/surface/ctrlListImageObject.h"

#include <array>

#include "support/surface/Guard.h"
#include "support/surface/HostCollection.h"

namespace tarnwick {
namespace {

// Numbers of the events in the type library.
enum EventNumber : DISPID {
  kFileManagerEvent = 1,
  kOLEStartDrag,
  kOLESetData,
  kOLEGiveFeedback,
  kOLEDragOver,
  kOLEDragDrop,
  kOLECompleteDrag,
  kStateChanged,
  kDownloadProgress,
  kUploadProgress,
  kReplyMessage,
};

constexpr DISPID kOleDropModeId = 34;
constexpr DISPID kOleDragModeId = 35;
constexpr std::array kProperties = {PersistedProperty{L"OLEDropMode", kOleDropModeId, VT_I2},
                                    PersistedProperty{L"OLEDragMode", kOleDragModeId, VT_I4}};

template <typename Value>
VARIANT ReferenceTo(VARTYPE type, Value& value) {
  VARIANT reference = {};
  V_VT(&reference) = static_cast<VARTYPE>(type | VT_BYREF);
  V_BYREF(&reference) = &value;
  return reference;
}

TextView ViewOf(BSTR* text) {
  return text ? tarnwick::ViewOf(*text) : TextView();
}

// Hands a changed text back through a by-reference argument.
void Assign(BSTR* target, TextView text) {
  const BSTR changed = NewBstr(text);
  SysFreeString(*target);
  *target = changed;
}

}  // namespace

ctrlListImageObject::ctrlListImageObject()
    : ole_(*this, DIID___ctrlListImage),
      view_(module::Instance(), *this),
      uploader_(apartment_.Get().platform),
      downloader_(apartment_.Get(), socket_, watchdog_) {
  rules_ = std::make_unique<ctrlListImage>(
      ctrlListImage::Parts{apartment_.Get(), view_, *this, uploader_, downloader_});
}

ctrlListImageObject::~ctrlListImageObject() {
  if (dropTarget_) dropTarget_->Revoke();
  rules_ = {};
  clientObject_ = {};
}

STDMETHODIMP ctrlListImageObject::QueryInterface(REFIID interfaceId, void** object) {
  return DualObject::QueryInterface(interfaceId, object);
}
STDMETHODIMP_(ULONG) ctrlListImageObject::AddRef() {
  return DualObject::AddRef();
}
STDMETHODIMP_(ULONG) ctrlListImageObject::Release() {
  return DualObject::Release();
}

void* ctrlListImageObject::FindInterface(REFIID interfaceId) {
  if (interfaceId == IID_ISupportErrorInfo) return static_cast<ISupportErrorInfo*>(this);
  if (void* found = DualObject::FindInterface(interfaceId)) return found;
  return ole_.FindInterface(interfaceId);
}

STDMETHODIMP ctrlListImageObject::InterfaceSupportsErrorInfo(REFIID interfaceId) {
  return interfaceId == __uuidof(_ctrlListImage) ? S_OK : S_FALSE;
}

HRESULT ctrlListImageObject::Fail(const wchar_t* description, std::int32_t number) {
  ComPtr<ICreateErrorInfo> made;
  ComPtr<IErrorInfo> info;
  if (SUCCEEDED(CreateErrorInfo(made.Receive()))) {
    std::wstring text = description;
    std::wstring source = L"Tarnwick.ctrlListImage";
    made->SetGUID(__uuidof(_ctrlListImage));
    made->SetDescription(text.data());
    made->SetSource(source.data());
    if (SUCCEEDED(made->QueryInterface(IID_IErrorInfo, info.ReceiveVoid()))) SetErrorInfo(0, info.Get());
  }
  return ResultFromErrorNumber(number);
}

// --- Fields ---

STDMETHODIMP ctrlListImageObject::get_mobjFileupload(_CFileUpload** value) {
  if (!value) return E_POINTER;
  *value = nullptr;
  return Guarded([&] {
    const std::shared_ptr<CFileUpload>& client = rules_->mobjFileupload;
    if (!client) return S_OK;
    if (!clientObject_ || clientObject_->Client() != client)
      clientObject_ = ComPtr<CFileUploadObject>::Adopt(new CFileUploadObject(client));
    *value = ComPtr<CFileUploadObject>(clientObject_).Detach();
    return S_OK;
  });
}

STDMETHODIMP ctrlListImageObject::put_mobjFileupload(_CFileUpload* value) {
  return putref_mobjFileupload(value);
}

STDMETHODIMP ctrlListImageObject::putref_mobjFileupload(_CFileUpload* value) {
  ComPtr<CFileUploadObject> object = CFileUploadObject::From(value);
  // The control works with clients of the library only.
  if (value && !object) return DISP_E_TYPEMISMATCH;
  rules_->mobjFileupload = object ? object->Client() : nullptr;
  clientObject_ = std::move(object);
  return S_OK;
}

STDMETHODIMP ctrlListImageObject::get_m_LastError(FtpErrors* value) {
  return GetNumber(static_cast<FtpErrors>(rules_->m_LastError), value);
}
STDMETHODIMP ctrlListImageObject::put_m_LastError(FtpErrors value) {
  return PutNumber(rules_->m_LastError, value);
}

STDMETHODIMP ctrlListImageObject::get_m_strLastErrorDesc(BSTR* value) {
  return GetText(rules_->m_strLastErrorDesc, value);
}
STDMETHODIMP ctrlListImageObject::put_m_strLastErrorDesc(BSTR value) {
  return PutText(rules_->m_strLastErrorDesc, value);
}
STDMETHODIMP ctrlListImageObject::get_m_strWinsockBuffer(BSTR* value) {
  return GetText(rules_->m_strWinsockBuffer, value);
}
STDMETHODIMP ctrlListImageObject::put_m_strWinsockBuffer(BSTR value) {
  return PutText(rules_->m_strWinsockBuffer, value);
}
STDMETHODIMP ctrlListImageObject::get_m_strDataBuffer(BSTR* value) {
  return GetText(rules_->m_strDataBuffer, value);
}
STDMETHODIMP ctrlListImageObject::put_m_strDataBuffer(BSTR value) {
  return PutText(rules_->m_strDataBuffer, value);
}
STDMETHODIMP ctrlListImageObject::get_m_strLocalFilePath(BSTR* value) {
  return GetText(rules_->m_strLocalFilePath, value);
}
STDMETHODIMP ctrlListImageObject::put_m_strLocalFilePath(BSTR value) {
  return PutText(rules_->m_strLocalFilePath, value);
}
STDMETHODIMP ctrlListImageObject::get_m_strLastServerResponse(BSTR* value) {
  return GetText(rules_->m_strLastServerResponse, value);
}
STDMETHODIMP ctrlListImageObject::put_m_strLastServerResponse(BSTR value) {
  return PutText(rules_->m_strLastServerResponse, value);
}
STDMETHODIMP ctrlListImageObject::get_gszDownloadPath(BSTR* value) {
  return GetText(rules_->gszDownloadPath, value);
}
STDMETHODIMP ctrlListImageObject::put_gszDownloadPath(BSTR value) {
  return PutText(rules_->gszDownloadPath, value);
}
STDMETHODIMP ctrlListImageObject::get_m_bTransferInProgress(VARIANT_BOOL* value) {
  return GetBoolean(rules_->m_bTransferInProgress, value);
}
STDMETHODIMP ctrlListImageObject::put_m_bTransferInProgress(VARIANT_BOOL value) {
  return PutBoolean(rules_->m_bTransferInProgress, value);
}
STDMETHODIMP ctrlListImageObject::get_m_bUploadFile(VARIANT_BOOL* value) {
  return GetBoolean(rules_->m_bUploadFile, value);
}
STDMETHODIMP ctrlListImageObject::put_m_bUploadFile(VARIANT_BOOL value) {
  return PutBoolean(rules_->m_bUploadFile, value);
}
STDMETHODIMP ctrlListImageObject::get_m_bFileIsOpened(VARIANT_BOOL* value) {
  return GetBoolean(rules_->m_bFileIsOpened, value);
}
STDMETHODIMP ctrlListImageObject::put_m_bFileIsOpened(VARIANT_BOOL value) {
  return PutBoolean(rules_->m_bFileIsOpened, value);
}
STDMETHODIMP ctrlListImageObject::get_gbUploadImage(VARIANT_BOOL* value) {
  return GetBoolean(rules_->gbUploadImage, value);
}
STDMETHODIMP ctrlListImageObject::put_gbUploadImage(VARIANT_BOOL value) {
  return PutBoolean(rules_->gbUploadImage, value);
}
STDMETHODIMP ctrlListImageObject::get_gbConnectionFailed(VARIANT_BOOL* value) {
  return GetBoolean(rules_->gbConnectionFailed, value);
}
STDMETHODIMP ctrlListImageObject::put_gbConnectionFailed(VARIANT_BOOL value) {
  return PutBoolean(rules_->gbConnectionFailed, value);
}
STDMETHODIMP ctrlListImageObject::get_gbDownload(VARIANT_BOOL* value) {
  return GetBoolean(rules_->gbDownload, value);
}
STDMETHODIMP ctrlListImageObject::put_gbDownload(VARIANT_BOOL value) {
  return PutBoolean(rules_->gbDownload, value);
}
STDMETHODIMP ctrlListImageObject::get_bRenameEnabled(VARIANT_BOOL* value) {
  return GetBoolean(rules_->bRenameEnabled, value);
}
STDMETHODIMP ctrlListImageObject::put_bRenameEnabled(VARIANT_BOOL value) {
  return PutBoolean(rules_->bRenameEnabled, value);
}
STDMETHODIMP ctrlListImageObject::get_bConnectedToFtp(VARIANT_BOOL* value) {
  return GetBoolean(rules_->bConnectedToFtp, value);
}
STDMETHODIMP ctrlListImageObject::put_bConnectedToFtp(VARIANT_BOOL value) {
  return PutBoolean(rules_->bConnectedToFtp, value);
}
STDMETHODIMP ctrlListImageObject::get_m_intLocalFileID(short* value) {
  return GetNumber<short>(rules_->m_intLocalFileID, value);
}
STDMETHODIMP ctrlListImageObject::put_m_intLocalFileID(short value) {
  return PutNumber(rules_->m_intLocalFileID, value);
}
STDMETHODIMP ctrlListImageObject::get_m_lDownloadedBytes(LONG* value) {
  return GetNumber<LONG>(rules_->m_lDownloadedBytes, value);
}
STDMETHODIMP ctrlListImageObject::put_m_lDownloadedBytes(LONG value) {
  return PutNumber(rules_->m_lDownloadedBytes, value);
}
STDMETHODIMP ctrlListImageObject::get_m_lUploadedBytes(LONG* value) {
  return GetNumber<LONG>(rules_->m_lUploadedBytes, value);
}
STDMETHODIMP ctrlListImageObject::put_m_lUploadedBytes(LONG value) {
  return PutNumber(rules_->m_lUploadedBytes, value);
}

STDMETHODIMP ctrlListImageObject::get_OLEDropMode(short* value) {
  return GetNumber<short>(rules_->OLEDropMode, value);
}
STDMETHODIMP ctrlListImageObject::put_OLEDropMode(short value) {
  rules_->OLEDropMode = value;
  ole_.PropertyChanged(kOleDropModeId);
  return S_OK;
}
STDMETHODIMP ctrlListImageObject::get_OLEDragMode(LONG* value) {
  return GetNumber<LONG>(rules_->OLEDragMode, value);
}
STDMETHODIMP ctrlListImageObject::put_OLEDragMode(LONG value) {
  rules_->OLEDragMode = value;
  ole_.PropertyChanged(kOleDragModeId);
  return S_OK;
}

// --- Listing and selection ---

STDMETHODIMP ctrlListImageObject::Init(BSTR* szFileFilter, VARIANT_BOOL* result) {
  if (!result) return E_POINTER;
  *result = VARIANT_FALSE;
  return Guarded([&]() -> HRESULT {
    try {
      *result = AutomationBoolean(rules_->Init(ViewOf(szFileFilter)));
      ole_.ViewChanged();
      return S_OK;
    } catch (const RuntimeError& failure) {
      return Fail(failure.Number() == list_error::kNoClient ? L"The control has no service client"
                                                            : L"The service did not list the files",
                  failure.Number());
    }
  });
}

STDMETHODIMP ctrlListImageObject::ChangeFileFilter(BSTR szFileFilter) {
  return Done([&] {
    rules_->ChangeFileFilter(ViewOf(szFileFilter));
    ole_.ViewChanged();
  });
}

STDMETHODIMP ctrlListImageObject::GetFileDetails(VARIANT FileName, IDispatch** colFiles, VARIANT* result) {
  return AnsweredVariant(result, [&] {
    if (colFiles) {
      const HostCollection collection(colFiles);
      rules_->GetFileDetails(TextFromVariant(FileName), [&](const std::shared_ptr<CUpload>& record) {
        const auto object = ComPtr<CUploadObject>::Adopt(new CUploadObject(record));
        collection.Add(object.Get(), {});
      });
    }
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::SelectedFileName(BSTR* result) {
  return AnsweredText(result, [&] { return rules_->SelectedFileName(); });
}

STDMETHODIMP ctrlListImageObject::GetSelectedFilesHttpPath(VARIANT* result) {
  return AnsweredVariant(result, [&] {
    const std::optional<Text> path = rules_->GetSelectedFilesHttpPath();
    return path ? VariantFromText(*path) : VARIANT{};
  });
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
  return AnsweredVariant(result, [&] {
    rules_->SetMultiSelectProperty(bVal && *bVal != VARIANT_FALSE);
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::ListViewSetFocus(VARIANT* result) {
  return AnsweredVariant(result, [&] {
    rules_->ListViewSetFocus();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::UploadedFileSetFocus(BSTR* szFileName, VARIANT* result) {
  return AnsweredVariant(result, [&] {
    rules_->UploadedFileSetFocus(ViewOf(szFileName));
    return VARIANT{};
  });
}

// --- Operations ---

STDMETHODIMP ctrlListImageObject::UploadImage(BSTR szLocalPath, VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return rules_->UploadImage(ViewOf(szLocalPath)); });
}

STDMETHODIMP ctrlListImageObject::DeleteFile() {
  return Done([&] { rules_->DeleteFile(); });
}

STDMETHODIMP ctrlListImageObject::RenameFile(BSTR* strOldFileName, BSTR* strNewFileName,
                                             VARIANT_BOOL* result) {
  return AnsweredBoolean(result,
                         [&] { return rules_->RenameFile(ViewOf(strOldFileName), ViewOf(strNewFileName)); });
}

STDMETHODIMP ctrlListImageObject::DownLoadFileFromServer(BSTR szLocalFilePath, BSTR* result) {
  return AnsweredText(result, [&] { return rules_->DownLoadFileFromServer(ViewOf(szLocalFilePath)); });
}

STDMETHODIMP ctrlListImageObject::IsFileNameValid(BSTR* szFileName, VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return rules_->IsFileNameValid(ViewOf(szFileName)); });
}

STDMETHODIMP ctrlListImageObject::CheckFileExtension(BSTR* szNewString, BSTR* szOriExt,
                                                     VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] {
    Text name(ViewOf(szNewString));
    const bool kept = rules_->CheckFileExtension(name, ViewOf(szOriExt));
    if (szNewString && name != ViewOf(szNewString)) Assign(szNewString, name);
    return kept;
  });
}

STDMETHODIMP ctrlListImageObject::CheckIfFileDoesNotExist(BSTR szFileName, VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return rules_->CheckIfFileDoesNotExist(ViewOf(szFileName)); });
}

STDMETHODIMP ctrlListImageObject::StartLabelExit(VARIANT* result) {
  return AnsweredVariant(result, [&] {
    rules_->StartLabelExit();
    return VARIANT{};
  });
}

STDMETHODIMP ctrlListImageObject::EnableRename(VARIANT_BOOL* bEnableRename, VARIANT* result) {
  return AnsweredVariant(result, [&] {
    VARIANT enabled = {};
    V_VT(&enabled) = VT_BOOL;
    V_BOOL(&enabled) =
        AutomationBoolean(rules_->EnableRename(bEnableRename && *bEnableRename != VARIANT_FALSE));
    return enabled;
  });
}

STDMETHODIMP ctrlListImageObject::OLEDrag() {
  return Done([&] { rules_->OLEDrag(); });
}

STDMETHODIMP ctrlListImageObject::Overlay(VARIANT* Key1, VARIANT* Key2, IPictureDisp** result) {
  if (!result) return E_POINTER;
  *result = nullptr;
  if (!Key1 || !Key2) return E_POINTER;
  return Guarded([&]() -> HRESULT {
    view_.Window();
    const int count = ImageList_GetImageCount(view_.SmallIcons());
    const std::int32_t lower = NumberFromVariant(*Key1);
    const std::int32_t upper = NumberFromVariant(*Key2);
    if (lower < 1 || lower > count || upper < 1 || upper > count)
      throw RuntimeError(error::kSubscriptOutOfRange);
    const ImageListOwner merged(
        ImageList_Merge(view_.SmallIcons(), lower - 1, view_.SmallIcons(), upper - 1, 0, 0));
    PICTDESC description = {};
    description.cbSizeofstruct = sizeof description;
    description.picType = PICTYPE_ICON;
    description.icon.hicon = ImageList_GetIcon(merged.Get(), 0, ILD_TRANSPARENT);
    return OleCreatePictureIndirect(&description, IID_IPictureDisp, TRUE, reinterpret_cast<void**>(result));
  });
}

// --- The OLE side ---

HWND ctrlListImageObject::Window() {
  const HWND window = view_.Window();
  // A host that did not initialise OLE has a control without drops.
  if (window && !dropTarget_)
    Done([&] {
      dropTarget_ = ComPtr<DropTarget>::Adopt(new DropTarget(view_.List(), Identity(), *this));
      ApplyLook();
    });
  return window;
}

void ctrlListImageObject::AmbientChanged(const AmbientValues& values) {
  ambient_ = values;
  ApplyLook();
}

void ctrlListImageObject::ApplyLook() {
  HFONT font = nullptr;
  if (ambient_.font && FAILED(ambient_.font->get_hFont(&font))) font = nullptr;
  // The list has the system's window colours; only what a container says of its own accord replaces them.
  view_.SetLook(font, ambient_.hasForeColor ? std::optional(ambient_.foreColor) : std::nullopt, std::nullopt);
}

std::span<const PersistedProperty> ctrlListImageObject::Properties() const {
  return kProperties;
}

std::int32_t ctrlListImageObject::GetProperty(DISPID id) const {
  return id == kOleDropModeId ? rules_->OLEDropMode : rules_->OLEDragMode;
}

void ctrlListImageObject::SetProperty(DISPID id, std::int32_t value) {
  if (id == kOleDropModeId)
    rules_->OLEDropMode = static_cast<std::int16_t>(value);
  else
    rules_->OLEDragMode = value;
}

// --- Events ---

void ctrlListImageObject::FileManagerEvent(std::int16_t code, TextView description) {
  Done([&] {
    Variant number;
    V_VT(&number.Get()) = VT_I2;
    V_I2(&number.Get()) = code;
    Variant text;
    text.Get() = VariantFromText(description);
    std::array arguments = {ReferenceTo(VT_VARIANT, number.Get()), ReferenceTo(VT_BSTR, V_BSTR(&text.Get()))};
    ole_.Raise(kFileManagerEvent, arguments);
  });
}

void ctrlListImageObject::OLEStartDrag(DragData& data, std::int32_t& allowedEffects) {
  IDispatch* object = static_cast<DataObject&>(data).Dispatch();
  LONG effects = allowedEffects;
  std::array arguments = {ReferenceTo(VT_DISPATCH, object), ReferenceTo(VT_I4, effects)};
  ole_.Raise(kOLEStartDrag, arguments);
  allowedEffects = effects;
}

void ctrlListImageObject::OLESetData(DragData& data, std::int16_t format) {
  IDispatch* object = static_cast<DataObject&>(data).Dispatch();
  std::array arguments = {ReferenceTo(VT_DISPATCH, object), ReferenceTo(VT_I2, format)};
  ole_.Raise(kOLESetData, arguments);
}

void ctrlListImageObject::OLEGiveFeedback(std::int32_t& effect, bool& defaultCursors) {
  LONG shown = effect;
  VARIANT_BOOL cursors = AutomationBoolean(defaultCursors);
  std::array arguments = {ReferenceTo(VT_I4, shown), ReferenceTo(VT_BOOL, cursors)};
  ole_.Raise(kOLEGiveFeedback, arguments);
  effect = shown;
  defaultCursors = cursors != VARIANT_FALSE;
}

void ctrlListImageObject::OLEDragOver(DragData& data, std::int32_t& effect, const DragPoint& at,
                                      std::int16_t state) {
  IDispatch* object = static_cast<DataObject&>(data).Dispatch();
  LONG wanted = effect;
  DragPoint point = at;
  std::array arguments = {ReferenceTo(VT_DISPATCH, object), ReferenceTo(VT_I4, wanted),
                          ReferenceTo(VT_I2, point.button), ReferenceTo(VT_I2, point.shift),
                          ReferenceTo(VT_R4, point.x),      ReferenceTo(VT_R4, point.y),
                          ReferenceTo(VT_I2, state)};
  ole_.Raise(kOLEDragOver, arguments);
  effect = wanted;
}

void ctrlListImageObject::OLEDragDrop(DragData& data, std::int32_t& effect, const DragPoint& at) {
  IDispatch* object = static_cast<DataObject&>(data).Dispatch();
  LONG wanted = effect;
  DragPoint point = at;
  std::array arguments = {ReferenceTo(VT_DISPATCH, object), ReferenceTo(VT_I4, wanted),
                          ReferenceTo(VT_I2, point.button), ReferenceTo(VT_I2, point.shift),
                          ReferenceTo(VT_R4, point.x),      ReferenceTo(VT_R4, point.y)};
  ole_.Raise(kOLEDragDrop, arguments);
  effect = wanted;
}

void ctrlListImageObject::OLECompleteDrag(std::int32_t effect) {
  LONG done = effect;
  std::array arguments = {ReferenceTo(VT_I4, done)};
  ole_.Raise(kOLECompleteDrag, arguments);
}

void ctrlListImageObject::StateChanged(ConnectionState state) {
  LONG number = static_cast<LONG>(state);
  std::array arguments = {ReferenceTo(VT_I4, number)};
  ole_.Raise(kStateChanged, arguments);
}

void ctrlListImageObject::DownloadProgress(std::int32_t lBytes) {
  LONG bytes = lBytes;
  std::array arguments = {ReferenceTo(VT_I4, bytes)};
  ole_.Raise(kDownloadProgress, arguments);
}

void ctrlListImageObject::UploadProgress(std::int32_t lBytes) {
  LONG bytes = lBytes;
  std::array arguments = {ReferenceTo(VT_I4, bytes)};
  ole_.Raise(kUploadProgress, arguments);
}

void ctrlListImageObject::ReplyMessage(TextView sMessage) {
  Done([&] {
    Variant text;
    text.Get() = VariantFromText(sMessage);
    std::array arguments = {text.Get()};
    ole_.Raise(kReplyMessage, arguments);
  });
}

// --- What the user does ---

Text ctrlListImageObject::ItemText(std::size_t item, std::size_t column) const {
  return rules_->ItemText(item, static_cast<int>(column));
}

bool ctrlListImageObject::IsGif(std::size_t item) const {
  return rules_->PictureOf(item).small == icon::kSmallGif;
}

std::optional<std::size_t> ctrlListImageObject::FindItem(TextView prefix, std::size_t start) const {
  return rules_->FindItem(prefix, start);
}

// Each handler keeps the control alive: the host's code runs inside.
void ctrlListImageObject::KeyPressed(int key) {
  const ComPtr<IUnknown> alive(&Identity());
  rules_->OnKeyDown(key);
}

void ctrlListImageObject::EnterPressed() {
  const ComPtr<IUnknown> alive(&Identity());
  rules_->OnEnter();
}

void ctrlListImageObject::ButtonPressed() {
  const ComPtr<IUnknown> alive(&Identity());
  ole_.Activated();
  rules_->OnMouseButton();
}

void ctrlListImageObject::Clicked() {
  const ComPtr<IUnknown> alive(&Identity());
  rules_->OnClick();
}

bool ctrlListImageObject::LabelEditBegins(std::size_t) {
  return rules_->OnBeforeLabelEdit();
}

bool ctrlListImageObject::LabelEditEnds(std::size_t item, TextView text) {
  const ComPtr<IUnknown> alive(&Identity());
  return rules_->OnAfterLabelEdit(item, text);
}

void ctrlListImageObject::GotFocus() {
  const ComPtr<IUnknown> alive(&Identity());
  ole_.Activated();
}

void ctrlListImageObject::DragBegins() {
  const ComPtr<IUnknown> alive(&Identity());
  const ctrlListImage::DragContent content = rules_->ContentOfDrag();
  const auto data = ComPtr<DataObject>::Adopt(new DataObject(content.address, content.localFile));
  std::int32_t allowed = DROPEFFECT_COPY;
  rules_->OnStartDrag(*data, allowed);
  const DWORD done = RunDrag(*data, static_cast<DWORD>(allowed), [&](DWORD effect) {
    auto shown = static_cast<std::int32_t>(effect);
    bool defaultCursors = true;
    rules_->OnGiveFeedback(shown, defaultCursors);
    return defaultCursors;
  });
  rules_->OnCompleteDrag(static_cast<std::int32_t>(done));
}

void ctrlListImageObject::DragMoves(DataObject& data, DWORD& effect, const DragPoint& at,
                                    std::int16_t state) {
  auto wanted = static_cast<std::int32_t>(effect & DROPEFFECT_COPY);
  rules_->OnDragOver(data, wanted, at, state);
  effect = static_cast<DWORD>(wanted);
}

void ctrlListImageObject::Dropped(DataObject& data, DWORD& effect, const DragPoint& at) {
  auto wanted = static_cast<std::int32_t>(effect & DROPEFFECT_COPY);
  rules_->OnDrop(data, data.Files(), wanted, at);
  effect = static_cast<DWORD>(wanted);
}

}  // namespace tarnwick
