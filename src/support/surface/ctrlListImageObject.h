// ctrlListImage as hosts see it: the control on a form, around the rules and the list window.
#pragma once

#include <memory>

#include "controls/listimage/ctrlListImage.h"
#include "platform/windows/WindowsListView.h"
#include "platform/windows/WindowsStreamSocket.h"
#include "platform/windows/WindowsTimer.h"
#include "support/surface/CFileUploadObject.h"
#include "support/surface/DropTarget.h"
#include "support/surface/DualObject.h"
#include "support/surface/OleControl.h"
#include "support/surface/TypeLibrary.h"
#include "transfer/PictureDownloader.h"
#include "transfer/UploadObject.h"

namespace tarnwick {

class ctrlListImageObject final : public DualObject<_ctrlListImage>,
                                  public ISupportErrorInfo,
                                  private OleControlHooks,
                                  private ControlEvents,
                                  private ListViewUser,
                                  private DropUser {
 public:
  ctrlListImageObject();

  STDMETHODIMP QueryInterface(REFIID interfaceId, void** object) override;
  STDMETHODIMP_(ULONG) AddRef() override;
  STDMETHODIMP_(ULONG) Release() override;
  STDMETHODIMP InterfaceSupportsErrorInfo(REFIID interfaceId) override;

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
  STDMETHODIMP get_m_lDownloadedBytes(LONG* value) override;
  STDMETHODIMP put_m_lDownloadedBytes(LONG value) override;
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
  STDMETHODIMP ListViewSetFocus(VARIANT* result) override;
  STDMETHODIMP UploadedFileSetFocus(BSTR* szFileName, VARIANT* result) override;
  STDMETHODIMP DeleteFile() override;
  STDMETHODIMP Init(BSTR* szFileFilter, VARIANT_BOOL* result) override;
  STDMETHODIMP UploadImage(BSTR szLocalPath, VARIANT_BOOL* result) override;
  STDMETHODIMP CheckFileExtension(BSTR* szNewString, BSTR* szOriExt, VARIANT_BOOL* result) override;
  STDMETHODIMP IsFileNameValid(BSTR* szFileName, VARIANT_BOOL* result) override;
  STDMETHODIMP StartLabelExit(VARIANT* result) override;
  STDMETHODIMP EnableRename(VARIANT_BOOL* bEnableRename, VARIANT* result) override;
  STDMETHODIMP DownLoadFileFromServer(BSTR szLocalFilePath, BSTR* result) override;
  STDMETHODIMP GetFileDetails(VARIANT FileName, IDispatch** colFiles, VARIANT* result) override;
  STDMETHODIMP SelectedFileName(BSTR* result) override;
  STDMETHODIMP GetSelectedFilesHttpPath(VARIANT* result) override;
  STDMETHODIMP GetFileNames(VARIANT* result) override;
  STDMETHODIMP get_OLEDropMode(short* value) override;
  STDMETHODIMP put_OLEDropMode(short value) override;
  STDMETHODIMP get_OLEDragMode(LONG* value) override;
  STDMETHODIMP put_OLEDragMode(LONG value) override;
  STDMETHODIMP OLEDrag() override;
  STDMETHODIMP Overlay(VARIANT* Key1, VARIANT* Key2, IPictureDisp** result) override;
  STDMETHODIMP CheckIfFileDoesNotExist(BSTR szFileName, VARIANT_BOOL* result) override;
  STDMETHODIMP SetMultiSelectProperty(VARIANT_BOOL* bVal, VARIANT* result) override;
  STDMETHODIMP ChangeFileFilter(BSTR szFileFilter) override;
  STDMETHODIMP RenameFile(BSTR* strOldFileName, BSTR* strNewFileName, VARIANT_BOOL* result) override;

 private:
  ~ctrlListImageObject() override;
  void* FindInterface(REFIID interfaceId) override;

  // OleControlHooks
  IUnknown& Identity() override { return static_cast<_ctrlListImage&>(*this); }
  const CLSID& ClassId() const override { return CLSID_ctrlListImage; }
  HWND Window() override;
  void Park() override { view_.Park(); }
  void Draw(HDC dc, const RECT& bounds) override { view_.Draw(dc, bounds); }
  void AmbientChanged(const AmbientValues& values) override;
  void GiveFocus() override { view_.Focus(); }
  void SiteGone() override { rules_->Close(); }
  std::span<const PersistedProperty> Properties() const override;
  std::int32_t GetProperty(DISPID id) const override;
  void SetProperty(DISPID id, std::int32_t value) override;

  // ControlEvents
  void FileManagerEvent(std::int16_t code, TextView description) override;
  void OLEStartDrag(DragData& data, std::int32_t& allowedEffects) override;
  void OLESetData(DragData& data, std::int16_t format) override;
  void OLEGiveFeedback(std::int32_t& effect, bool& defaultCursors) override;
  void OLEDragOver(DragData& data, std::int32_t& effect, const DragPoint& at, std::int16_t state) override;
  void OLEDragDrop(DragData& data, std::int32_t& effect, const DragPoint& at) override;
  void OLECompleteDrag(std::int32_t effect) override;
  void StateChanged(ConnectionState state) override;
  void DownloadProgress(std::int32_t lBytes) override;
  void UploadProgress(std::int32_t lBytes) override;
  void ReplyMessage(TextView sMessage) override;

  // ListViewUser
  Text ItemText(std::size_t item, std::size_t column) const override;
  bool IsGif(std::size_t item) const override;
  std::optional<std::size_t> FindItem(TextView prefix, std::size_t start) const override;
  void KeyPressed(int key) override;
  void EnterPressed() override;
  void ButtonPressed() override;
  void Clicked() override;
  void DoubleClicked() override {}
  bool LabelEditBegins(std::size_t item) override;
  bool LabelEditEnds(std::size_t item, TextView text) override;
  void DragBegins() override;
  void GotFocus() override;

  // DropUser
  void DragMoves(DataObject& data, DWORD& effect, const DragPoint& at, std::int16_t state) override;
  void Dropped(DataObject& data, DWORD& effect, const DragPoint& at) override;

  void ApplyLook();
  // Raises an automation error with a description.
  static HRESULT Fail(const wchar_t* description, std::int32_t number);

  const ApartmentHold apartment_;
  OleControl ole_;
  WindowsListView view_;
  UploadObject uploader_;
  WindowsStreamSocket socket_;
  WindowsTimer watchdog_;
  PictureDownloader downloader_;
  std::unique_ptr<ctrlListImage> rules_;
  ComPtr<DropTarget> dropTarget_;
  AmbientValues ambient_;
  // What the host was last given for the rules' client, so that it gets the same object again.
  ComPtr<CFileUploadObject> clientObject_;
};

}  // namespace tarnwick
