#include "surface/FileControlObject.h"

#include <array>

#include "platform/windows/AnsiText.h"
#include "surface/Guard.h"
#include "surface/HostCollection.h"

namespace tarnwick {
namespace {

constexpr std::array kProperties = {PersistedProperty{L"OLEDropMode", DISPID_OLEDropMode, VT_I2},
                                    PersistedProperty{L"OLEDragMode", DISPID_OLEDragMode, VT_I4}};

}  // namespace

template <typename Interface>
FileControlObject<Interface>::FileControlObject(const ControlClass& itsClass, IUnknown* outer)
    : outer_(outer),
      class_(itsClass),
      ole_(*this, itsClass.events, itsClass.extent),
      events_(ole_),
      uploader_(apartment_.Get().platform),
      downloader_(apartment_.Get(), socket_, secureFetch_, watchdog_) {}

template <typename Interface>
void FileControlObject<Interface>::StopDrops() {
  if (const ComPtr<DropTarget> target = std::exchange(dropTarget_, {})) target->Revoke();
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::QueryInterface(REFIID interfaceId, void** object) {
  return outer_ ? outer_->QueryInterface(interfaceId, object)
                : DualObject<Interface>::QueryInterface(interfaceId, object);
}
template <typename Interface>
STDMETHODIMP_(ULONG)
FileControlObject<Interface>::AddRef() {
  return outer_ ? outer_->AddRef() : DualObject<Interface>::AddRef();
}
template <typename Interface>
STDMETHODIMP_(ULONG)
FileControlObject<Interface>::Release() {
  return outer_ ? outer_->Release() : DualObject<Interface>::Release();
}

template <typename Interface>
IUnknown* FileControlObject<Interface>::Own() {
  return outer_ ? &part_ : &Identity();
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::Part::QueryInterface(REFIID interfaceId, void** object) {
  if (!object) return E_POINTER;
  if (interfaceId == IID_IUnknown) {
    *object = this;
    AddRef();
    return S_OK;
  }
  *object = object_.FindInterface(interfaceId);
  if (!*object) return E_NOINTERFACE;
  // What is handed out counts for the whole.
  object_.AddRef();
  return S_OK;
}

template <typename Interface>
void* FileControlObject<Interface>::FindInterface(REFIID interfaceId) {
  if (interfaceId == IID_ISupportErrorInfo) return static_cast<ISupportErrorInfo*>(this);
  if (void* found = DualObject<Interface>::FindInterface(interfaceId)) return found;
  return ole_.FindInterface(interfaceId);
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::InterfaceSupportsErrorInfo(REFIID interfaceId) {
  return interfaceId == __uuidof(Interface) ? S_OK : S_FALSE;
}

template <typename Interface>
HRESULT FileControlObject<Interface>::ReportError(const wchar_t* description, std::int32_t number) const {
  ComPtr<ICreateErrorInfo> made;
  ComPtr<IErrorInfo> info;
  if (SUCCEEDED(CreateErrorInfo(made.Receive()))) {
    std::wstring text = description;
    std::wstring source = class_.name;
    made->SetGUID(__uuidof(Interface));
    made->SetDescription(text.data());
    made->SetSource(source.data());
    if (SUCCEEDED(made->QueryInterface(IID_IErrorInfo, info.ReceiveVoid()))) SetErrorInfo(0, info.Get());
  }
  return ResultFromErrorNumber(number);
}

// --- Fields ---

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_mobjFileupload(_CFileUpload** value) {
  if (!value) return E_POINTER;
  *value = nullptr;
  return Guarded([&] {
    const std::shared_ptr<CFileUpload>& client = Rules().mobjFileupload;
    if (!client) return S_OK;
    if (!clientObject_ || clientObject_->Client() != client)
      clientObject_ = ComPtr<CFileUploadObject>::Adopt(new CFileUploadObject(client));
    *value = ComPtr<CFileUploadObject>(clientObject_).Detach();
    return S_OK;
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_mobjFileupload(_CFileUpload* value) {
  return putref_mobjFileupload(value);
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::putref_mobjFileupload(_CFileUpload* value) {
  // The value may be an object of the host's, whose code may release the control.
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&]() -> HRESULT {
    ComPtr<CFileUploadObject> object = CFileUploadObject::From(value);
    // The control works with clients of the library only.
    if (value && !object) return DISP_E_TYPEMISMATCH;
    Rules().mobjFileupload = object ? object->Client() : nullptr;
    clientObject_ = std::move(object);
    return S_OK;
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_LastError(FtpErrors* value) {
  return GetNumber(static_cast<FtpErrors>(Rules().m_LastError), value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_LastError(FtpErrors value) {
  return PutNumber(Rules().m_LastError, value);
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_strLastErrorDesc(BSTR* value) {
  return GetText(Rules().m_strLastErrorDesc, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_strLastErrorDesc(BSTR value) {
  return PutText(Rules().m_strLastErrorDesc, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_strWinsockBuffer(BSTR* value) {
  return GetText(stored_.m_strWinsockBuffer, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_strWinsockBuffer(BSTR value) {
  return PutText(stored_.m_strWinsockBuffer, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_strDataBuffer(BSTR* value) {
  return GetText(stored_.m_strDataBuffer, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_strDataBuffer(BSTR value) {
  return PutText(stored_.m_strDataBuffer, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_strLocalFilePath(BSTR* value) {
  return GetText(stored_.m_strLocalFilePath, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_strLocalFilePath(BSTR value) {
  return PutText(stored_.m_strLocalFilePath, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_strLastServerResponse(BSTR* value) {
  return GetText(stored_.m_strLastServerResponse, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_strLastServerResponse(BSTR value) {
  return PutText(stored_.m_strLastServerResponse, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_gszDownloadPath(BSTR* value) {
  return GetText(stored_.gszDownloadPath, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_gszDownloadPath(BSTR value) {
  return PutText(stored_.gszDownloadPath, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_bTransferInProgress(VARIANT_BOOL* value) {
  return GetBoolean(Rules().m_bTransferInProgress, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_bTransferInProgress(VARIANT_BOOL value) {
  return PutBoolean(Rules().m_bTransferInProgress, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_bUploadFile(VARIANT_BOOL* value) {
  return GetBoolean(stored_.m_bUploadFile, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_bUploadFile(VARIANT_BOOL value) {
  return PutBoolean(stored_.m_bUploadFile, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_bFileIsOpened(VARIANT_BOOL* value) {
  return GetBoolean(stored_.m_bFileIsOpened, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_bFileIsOpened(VARIANT_BOOL value) {
  return PutBoolean(stored_.m_bFileIsOpened, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_gbUploadImage(VARIANT_BOOL* value) {
  return GetBoolean(stored_.gbUploadImage, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_gbUploadImage(VARIANT_BOOL value) {
  return PutBoolean(stored_.gbUploadImage, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_gbConnectionFailed(VARIANT_BOOL* value) {
  return GetBoolean(Rules().gbConnectionFailed, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_gbConnectionFailed(VARIANT_BOOL value) {
  return PutBoolean(Rules().gbConnectionFailed, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_gbDownload(VARIANT_BOOL* value) {
  return GetBoolean(stored_.gbDownload, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_gbDownload(VARIANT_BOOL value) {
  return PutBoolean(stored_.gbDownload, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_bRenameEnabled(VARIANT_BOOL* value) {
  return GetBoolean(Rules().bRenameEnabled, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_bRenameEnabled(VARIANT_BOOL value) {
  return PutBoolean(Rules().bRenameEnabled, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_bConnectedToFtp(VARIANT_BOOL* value) {
  return GetBoolean(stored_.bConnectedToFtp, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_bConnectedToFtp(VARIANT_BOOL value) {
  return PutBoolean(stored_.bConnectedToFtp, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_intLocalFileID(short* value) {
  return GetNumber<short>(stored_.m_intLocalFileID, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_intLocalFileID(short value) {
  return PutNumber(stored_.m_intLocalFileID, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_m_lUploadedBytes(LONG* value) {
  return GetNumber<LONG>(Rules().m_lUploadedBytes, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_m_lUploadedBytes(LONG value) {
  return PutNumber(Rules().m_lUploadedBytes, value);
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_OLEDropMode(short* value) {
  return GetNumber<short>(stored_.OLEDropMode, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_OLEDropMode(short value) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&] {
    stored_.OLEDropMode = value;
    ole_.PropertyChanged(DISPID_OLEDropMode);
    return S_OK;
  });
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::get_OLEDragMode(LONG* value) {
  return GetNumber<LONG>(stored_.OLEDragMode, value);
}
template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::put_OLEDragMode(LONG value) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&] {
    stored_.OLEDragMode = value;
    ole_.PropertyChanged(DISPID_OLEDragMode);
    return S_OK;
  });
}

// --- Listing and selection ---

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::Init(BSTR* szFileFilter, VARIANT_BOOL* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  if (!result) return E_POINTER;
  *result = VARIANT_FALSE;
  return Guarded([&]() -> HRESULT {
    try {
      *result = AutomationBoolean(Rules().Init(ViewOf(szFileFilter)));
      ole_.ViewChanged();
      return S_OK;
    } catch (const RuntimeError& failure) {
      if (failure.Number() == init_error::kNoClient)
        return ReportError(L"The control has no service client", failure.Number());
      // A connection that was not safe says why.
      const bool unsafe = Rules().m_LastError == ftp_error::kConnectAborted;
      return ReportError(
          unsafe ? WideFromText(Rules().m_strLastErrorDesc).c_str() : L"The service did not list the files",
          failure.Number());
    }
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::ChangeFileFilter(BSTR szFileFilter) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Done([&] {
    Rules().ChangeFileFilter(ViewOf(szFileFilter));
    ole_.ViewChanged();
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::GetFileDetails(VARIANT FileName, IDispatch** colFiles,
                                                          VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    if (colFiles) {
      const HostCollection collection(colFiles);
      Rules().GetFileDetails(TextFromVariant(FileName), [&](const std::shared_ptr<CUpload>& record) {
        const auto object = ComPtr<CUploadObject>::Adopt(new CUploadObject(record));
        collection.Add(object.Get(), {});
      });
    }
    return VARIANT{};
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::SelectedFileName(BSTR* result) {
  return AnsweredText(result, [&] { return Rules().SelectedFileName(); });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::GetSelectedFilesHttpPath(VARIANT* result) {
  return AnsweredVariant(result, [&] {
    const std::optional<Text> path = Rules().GetSelectedFilesHttpPath();
    return path ? VariantFromText(*path) : VARIANT{};
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::UploadedFileSetFocus(BSTR* szFileName, VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    Rules().UploadedFileSetFocus(ViewOf(szFileName));
    ole_.ViewChanged();
    return VARIANT{};
  });
}

// --- Operations ---

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::UploadImage(BSTR szLocalPath, VARIANT_BOOL* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredBoolean(result, [&] {
    const bool uploaded = Rules().UploadImage(ViewOf(szLocalPath));
    ole_.ViewChanged();
    return uploaded;
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::DeleteFile() {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Done([&] {
    Rules().DeleteFile();
    ole_.ViewChanged();
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::RenameFile(BSTR* strOldFileName, BSTR* strNewFileName,
                                                      VARIANT_BOOL* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredBoolean(result, [&] {
    const bool renamed = Rules().RenameFile(ViewOf(strOldFileName), ViewOf(strNewFileName));
    ole_.ViewChanged();
    return renamed;
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::DownLoadFileFromServer(BSTR szLocalFilePath, BSTR* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredText(result, [&] { return Rules().DownLoadFileFromServer(ViewOf(szLocalFilePath)); });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::IsFileNameValid(BSTR* szFileName, VARIANT_BOOL* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredBoolean(result, [&] { return Rules().IsFileNameValid(ViewOf(szFileName)); });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::CheckFileExtension(BSTR* szNewString, BSTR* szOriExt,
                                                              VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] {
    Text name(ViewOf(szNewString));
    const bool kept = Rules().CheckFileExtension(name, ViewOf(szOriExt));
    AssignChanged(szNewString, name);
    return kept;
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::CheckIfFileDoesNotExist(BSTR szFileName, VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return Rules().CheckIfFileDoesNotExist(ViewOf(szFileName)); });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::EnableRename(VARIANT_BOOL* bEnableRename, VARIANT* result) {
  return AnsweredVariant(result, [&] {
    VARIANT enabled = {};
    V_VT(&enabled) = VT_BOOL;
    V_BOOL(&enabled) =
        AutomationBoolean(Rules().EnableRename(bEnableRename && *bEnableRename != VARIANT_FALSE));
    return enabled;
  });
}

template <typename Interface>
STDMETHODIMP FileControlObject<Interface>::OLEDrag() {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Done([&] { Rules().OLEDrag(); });
}

// --- The OLE side ---

template <typename Interface>
HWND FileControlObject<Interface>::Window() {
  const HWND window = TheWindow().Window();
  // A host that did not initialise OLE has a control without drops. A container may destroy the window, of
  // which OLE is notified, and ask for another.
  if (window && !dropTarget_)
    Done([&] {
      dropTarget_ = ComPtr<DropTarget>::Adopt(new DropTarget(window, Identity(), *this));
      WindowMade(window);
      ApplyLook();
    });
  return window;
}

template <typename Interface>
void FileControlObject<Interface>::AmbientChanged(const AmbientValues& values) {
  ambient_ = values;
  // Before the container's font is asked, inside which the container may close the control.
  Rules().Open();
  ApplyLook();
}

template <typename Interface>
void FileControlObject<Interface>::ApplyLook() {
  // A font may be code of the host's, which may change the ambient values.
  const ComPtr<IFont> ambientFont = ambient_.font;
  HFONT font = nullptr;
  if (ambientFont && FAILED(ambientFont->get_hFont(&font))) font = nullptr;
  // One colour of a container makes no legible pair with one of the system's.
  const bool colours = ambient_.hasForeColor && ambient_.hasBackColor;
  TheWindow().SetLook(font, colours ? std::optional(ambient_.foreColor) : std::nullopt,
                      colours ? std::optional(ambient_.backColor) : std::nullopt);
}

template <typename Interface>
std::span<const PersistedProperty> FileControlObject<Interface>::Properties() const {
  return kProperties;
}

template <typename Interface>
std::int32_t FileControlObject<Interface>::GetProperty(DISPID id) const {
  return id == DISPID_OLEDropMode ? stored_.OLEDropMode : stored_.OLEDragMode;
}

template <typename Interface>
void FileControlObject<Interface>::SetProperty(DISPID id, std::int32_t value) {
  if (id == DISPID_OLEDropMode)
    stored_.OLEDropMode = static_cast<std::int16_t>(value);
  else
    stored_.OLEDragMode = value;
}

// --- Drag and drop ---

template <typename Interface>
void FileControlObject<Interface>::DragBegins() {
  const FileControl::DragContent content = Rules().ContentOfDrag();
  const auto data = ComPtr<DataObject>::Adopt(new DataObject(content.address, content.localFile));
  data->SetPromiseHandler([&](std::int16_t format) { Rules().OnSetData(*data, format); });
  std::int32_t allowed = DROPEFFECT_COPY;
  Rules().OnStartDrag(*data, allowed);
  const DWORD done = RunDrag(*data, static_cast<DWORD>(allowed), [&](DWORD effect) {
    auto shown = static_cast<std::int32_t>(effect);
    bool defaultCursors = true;
    Rules().OnGiveFeedback(shown, defaultCursors);
    return defaultCursors;
  });
  // The target may keep the data; the promise ends with the drag.
  data->SetPromiseHandler({});
  Rules().OnCompleteDrag(static_cast<std::int32_t>(done));
}

template <typename Interface>
void FileControlObject<Interface>::DragMoves(DataObject& data, DWORD& effect, const DragPoint& at,
                                             std::int16_t state) {
  constexpr std::int16_t kEnter = 0;
  auto wanted = static_cast<std::int32_t>(effect & DROPEFFECT_COPY);
  Rules().OnDragOver(data, wanted, at, state);
  effect = static_cast<DWORD>(wanted);
  if (state == kEnter && !data.Files().empty()) Rules().OnFilesEnter();
}

template <typename Interface>
void FileControlObject<Interface>::Dropped(DataObject& data, DWORD& effect, const DragPoint& at) {
  auto wanted = static_cast<std::int32_t>(effect & DROPEFFECT_COPY);
  Rules().OnDrop(data, data.Files(), wanted, at);
  effect = static_cast<DWORD>(wanted);
}

template class FileControlObject<_ctrlListImage>;
template class FileControlObject<_ctrlThumbNailView>;

}  // namespace tarnwick
