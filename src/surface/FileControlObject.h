// What both controls are to their hosts: the members that both interfaces have, the control on a form,
// events, drags and drops. Each control adds its own members, its rules and its window.
#pragma once

#include "controls/FileControl.h"
#include "controls/windows/ControlWindow.h"
#include "platform/windows/WindowsSecureFetch.h"
#include "platform/windows/WindowsStreamSocket.h"
#include "platform/windows/WindowsTimer.h"
#include "surface/CFileUploadObject.h"
#include "surface/DropTarget.h"
#include "surface/DualObject.h"
#include "surface/HostEvents.h"
#include "surface/OleControl.h"
#include "surface/TypeLibrary.h"
#include "transfer/PictureDownloader.h"
#include "transfer/UploadObject.h"

namespace tarnwick {

// A class of controls. The identifiers stand in the type library.
struct ControlClass {
  const CLSID& id;
  const IID& events;
  // As error information names the source.
  const wchar_t* name;
  // HIMETRIC.
  SIZEL extent;
};

// `Interface` is the control's dual interface. The members' numbers are the same in both where both have
// them.
template <typename Interface>
class FileControlObject : public DualObject<Interface>,
                          public ISupportErrorInfo,
                          protected ControlWindowUser,
                          private OleControlHooks,
                          private DropUser {
 public:
  // The unknown that counts this object alone; what `outer` holds when there is one. Not counted anew.
  IUnknown* Own();

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;
  STDMETHODIMP InterfaceSupportsErrorInfo(REFIID interfaceId) override;

  // The members of the interface that list, select, transfer, rename, delete or drag raise events or pump
  // messages, and thus run the host's code; so do the ones that take an object or a VARIANT of the host's, or
  // notify of a property. They keep the control alive.
  STDMETHODIMP get_mobjFileupload(_CFileUpload** value) override;
  STDMETHODIMP put_mobjFileupload(_CFileUpload* value) override;
  STDMETHODIMP putref_mobjFileupload(_CFileUpload* value) override;
  STDMETHODIMP get_m_LastError(FtpErrors* value) override;
  STDMETHODIMP put_m_LastError(FtpErrors value) override;
  STDMETHODIMP get_m_strLastErrorDesc(BSTR* value) override;
  STDMETHODIMP put_m_strLastErrorDesc(BSTR value) override;
  STDMETHODIMP get_m_strWinsockBuffer(BSTR* value) override;
  STDMETHODIMP put_m_strWinsockBuffer(BSTR value) override;
  STDMETHODIMP get_m_strDataBuffer(BSTR* value) override;
  STDMETHODIMP put_m_strDataBuffer(BSTR value) override;
  STDMETHODIMP get_m_strLocalFilePath(BSTR* value) override;
  STDMETHODIMP put_m_strLocalFilePath(BSTR value) override;
  STDMETHODIMP get_m_intLocalFileID(short* value) override;
  STDMETHODIMP put_m_intLocalFileID(short value) override;
  STDMETHODIMP get_m_bTransferInProgress(VARIANT_BOOL* value) override;
  STDMETHODIMP put_m_bTransferInProgress(VARIANT_BOOL value) override;
  STDMETHODIMP get_m_bUploadFile(VARIANT_BOOL* value) override;
  STDMETHODIMP put_m_bUploadFile(VARIANT_BOOL value) override;
  STDMETHODIMP get_m_lUploadedBytes(LONG* value) override;
  STDMETHODIMP put_m_lUploadedBytes(LONG value) override;
  STDMETHODIMP get_m_strLastServerResponse(BSTR* value) override;
  STDMETHODIMP put_m_strLastServerResponse(BSTR value) override;
  STDMETHODIMP get_m_bFileIsOpened(VARIANT_BOOL* value) override;
  STDMETHODIMP put_m_bFileIsOpened(VARIANT_BOOL value) override;
  STDMETHODIMP get_gbUploadImage(VARIANT_BOOL* value) override;
  STDMETHODIMP put_gbUploadImage(VARIANT_BOOL value) override;
  STDMETHODIMP get_gbConnectionFailed(VARIANT_BOOL* value) override;
  STDMETHODIMP put_gbConnectionFailed(VARIANT_BOOL value) override;
  STDMETHODIMP get_gszDownloadPath(BSTR* value) override;
  STDMETHODIMP put_gszDownloadPath(BSTR value) override;
  STDMETHODIMP get_gbDownload(VARIANT_BOOL* value) override;
  STDMETHODIMP put_gbDownload(VARIANT_BOOL value) override;
  STDMETHODIMP get_bRenameEnabled(VARIANT_BOOL* value) override;
  STDMETHODIMP put_bRenameEnabled(VARIANT_BOOL value) override;
  STDMETHODIMP get_bConnectedToFtp(VARIANT_BOOL* value) override;
  STDMETHODIMP put_bConnectedToFtp(VARIANT_BOOL value) override;
  STDMETHODIMP UploadedFileSetFocus(BSTR* szFileName, VARIANT* result) override;
  STDMETHODIMP DeleteFile() override;
  STDMETHODIMP Init(BSTR* szFileFilter, VARIANT_BOOL* result) override;
  STDMETHODIMP UploadImage(BSTR szLocalPath, VARIANT_BOOL* result) override;
  STDMETHODIMP CheckFileExtension(BSTR* szNewString, BSTR* szOriExt, VARIANT_BOOL* result) override;
  STDMETHODIMP IsFileNameValid(BSTR* szFileName, VARIANT_BOOL* result) override;
  STDMETHODIMP EnableRename(VARIANT_BOOL* bEnableRename, VARIANT* result) override;
  STDMETHODIMP DownLoadFileFromServer(BSTR szLocalFilePath, BSTR* result) override;
  STDMETHODIMP GetFileDetails(VARIANT FileName, IDispatch** colFiles, VARIANT* result) override;
  STDMETHODIMP SelectedFileName(BSTR* result) override;
  STDMETHODIMP GetSelectedFilesHttpPath(VARIANT* result) override;
  STDMETHODIMP get_OLEDropMode(short* value) override;
  STDMETHODIMP put_OLEDropMode(short value) override;
  STDMETHODIMP get_OLEDragMode(LONG* value) override;
  STDMETHODIMP put_OLEDragMode(LONG value) override;
  STDMETHODIMP OLEDrag() override;
  STDMETHODIMP CheckIfFileDoesNotExist(BSTR szFileName, VARIANT_BOOL* result) override;
  STDMETHODIMP ChangeFileFilter(BSTR szFileFilter) override;
  STDMETHODIMP RenameFile(BSTR* strOldFileName, BSTR* strNewFileName, VARIANT_BOOL* result) override;

 protected:
  // `outer` is the controlling unknown when the control is aggregated, else null. It outlives the control.
  FileControlObject(const ControlClass& itsClass, IUnknown* outer);
  ~FileControlObject() override = default;
  // The first call of the destructor: the drop target is revoked before its window is destroyed.
  void StopDrops();

  virtual FileControl& Rules() = 0;
  virtual ControlWindow& TheWindow() = 0;
  // The window is new, or another one than before.
  virtual void WindowMade(HWND) {}

  // What rules are made with.
  ControlParts Parts() { return {apartment_.Get(), events_, uploader_, downloader_}; }
  OleControl& Ole() { return ole_; }
  Apartment& TheApartment() { return apartment_.Get(); }
  // For the members in which code of the host's runs, in events and while messages are pumped: it may release
  // the control inside. What its window and a drag tell keeps it alive without that.
  ComPtr<IUnknown> KeptAlive() { return ComPtr<IUnknown>(&Identity()); }
  // OleControlHooks
  IUnknown& Identity() override { return outer_ ? *outer_ : static_cast<Interface&>(*this); }

 private:
  // This object without the one that it is a part of.
  class Part final : public IUnknown {
   public:
    explicit Part(FileControlObject& object) : object_(object) {}
    STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
    STDMETHODIMP_(ULONG) AddRef() override { return object_.DualObject<Interface>::AddRef(); }
    STDMETHODIMP_(ULONG) Release() override { return object_.DualObject<Interface>::Release(); }

   private:
    FileControlObject& object_;
  };

  void* FindInterface(REFIID interfaceId) override;

  // ControlWindowUser
  void WindowEnds() override { StopDrops(); }
  void Activated() override { ole_.Activated(); }
  void FocusLeft() override { ole_.LostFocus(); }
  void DragBegins() override;

  // OleControlHooks
  const CLSID& ClassId() const override { return class_.id; }
  HWND Window() override;
  void Park() override { TheWindow().Park(); }
  std::optional<SIZE> SizeOnOtherScreen() override { return TheWindow().SizeOnOtherScreen(); }
  void AmbientChanged(const AmbientValues& values) override;
  void Closing() override { Rules().EndTransfer(); }
  void SiteGone() override { Rules().Close(); }
  std::span<const PersistedProperty> Properties() const override;
  std::int32_t GetProperty(DISPID id) const override;
  void SetProperty(DISPID id, std::int32_t value) override;

  // DropUser
  void DragMoves(DataObject& data, DWORD& effect, const DragPoint& at, std::int16_t state) override;
  void Dropped(DataObject& data, DWORD& effect, const DragPoint& at) override;

  // A font of the container's may be the host's own code, which runs here.
  void ApplyLook();
  // Leaves error information with this description for the host; the result of the call that failed.
  HRESULT ReportError(const wchar_t* description, std::int32_t number) const;

  IUnknown* const outer_;
  Part part_{*this};
  const ControlClass class_;
  const ApartmentHold apartment_;
  OleControl ole_;
  HostEvents events_;
  UploadObject uploader_;
  WindowsStreamSocket socket_;
  WindowsSecureFetch secureFetch_;
  WindowsTimer watchdog_;
  PictureDownloader downloader_;
  // As long as there is a window that was asked for.
  ComPtr<DropTarget> dropTarget_;
  AmbientValues ambient_;
  // The control stores these for the host and does nothing with them.
  struct {
    Text m_strWinsockBuffer;
    Text m_strDataBuffer;
    Text m_strLocalFilePath;
    std::int16_t m_intLocalFileID = 0;
    bool m_bUploadFile = false;
    Text m_strLastServerResponse;
    bool m_bFileIsOpened = false;
    bool gbUploadImage = false;
    Text gszDownloadPath;
    bool gbDownload = false;
    bool bConnectedToFtp = false;
    std::int16_t OLEDropMode = 0;
    std::int32_t OLEDragMode = 0;
  } stored_;
  // What the host was last given for the rules' client, so that it gets the same object again.
  ComPtr<CFileUploadObject> clientObject_;
};

}  // namespace tarnwick
