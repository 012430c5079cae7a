// CFileUpload as hosts see it: converts arguments and results, and forwards to the service client. No
// operation fails to the host; what goes wrong is told by the result.
#pragma once

#include <memory>

#include "service/CFileUpload.h"
#include "surface/CUploadObject.h"
#include "surface/DualObject.h"
#include "surface/ThreadApartment.h"
#include "surface/TypeLibrary.h"

namespace tarnwick {

class CFileUploadObject final : public DualObject<_CFileUpload> {
 public:
  // A new client of the calling thread's apartment.
  CFileUploadObject();
  // Shows `client`, which the object shares with a control.
  explicit CFileUploadObject(std::shared_ptr<CFileUpload> client);

  const std::shared_ptr<CFileUpload>& Client() const { return client_; }

  // The object behind an interface that a host hands in; null when it is not one of ours. Runs the code of
  // the host's own object.
  static ComPtr<CFileUploadObject> From(IUnknown* object);

  // None of the members pumps messages. Those that take a collection, an object or a VARIANT run the host's
  // code, and keep the client alive.
  STDMETHODIMP get_HTTPServer(BSTR* value) override;
  STDMETHODIMP put_HTTPServer(BSTR value) override;
  STDMETHODIMP get_UploadObject(_CUpload** value) override;
  STDMETHODIMP put_UploadObject(_CUpload* value) override;
  STDMETHODIMP putref_UploadObject(_CUpload* value) override;
  STDMETHODIMP RenameFile(BSTR ProductID, BSTR Username, BSTR FileToRename, BSTR NewFileName,
                          VARIANT* result) override;
  STDMETHODIMP UploadFile(BSTR szFilePath, BSTR* result) override;
  STDMETHODIMP GetMaxQuota(BSTR ProductID, BSTR Username, double* result) override;
  STDMETHODIMP GetTotalUsedQuota(BSTR ProductID, BSTR Username, VARIANT* result) override;
  STDMETHODIMP CanUploadFile(LONG* result) override;
  STDMETHODIMP CanDeleteFile(VARIANT_BOOL* result) override;
  STDMETHODIMP SetCUploadObject(BSTR FileName, BSTR FilePath, double FileSize, VARIANT* result) override;
  STDMETHODIMP DeleteFileForUser(BSTR FileToBeDeleted, LONG* result) override;
  STDMETHODIMP GetFileDetails(VARIANT FileName, IDispatch** colFiles, VARIANT_BOOL* result) override;
  STDMETHODIMP ListFilesForUser(IDispatch** colFiles, VARIANT_BOOL* result) override;
  STDMETHODIMP DisconnectFromServer() override;
  STDMETHODIMP ConnectToServer(BSTR szServer, VARIANT_BOOL* result) override;
  STDMETHODIMP LogonAs(BSTR ProductID, BSTR Username, BSTR Password, BSTR MGUID,
                       VARIANT_BOOL* result) override;
  STDMETHODIMP OpenSession(VARIANT_BOOL* result) override;
  STDMETHODIMP GetFileUploadPath(BSTR* result) override;
  STDMETHODIMP GetKeyForUser(BSTR ProductID, BSTR Username, BSTR* result) override;
  STDMETHODIMP AddUser(BSTR ProductID, BSTR Username, VARIANT GUID, BSTR* result) override;
  STDMETHODIMP DeleteUser(BSTR ProductID, BSTR Username, VARIANT Password, VARIANT_BOOL blnDeleteFolder,
                          LONG* result) override;
  STDMETHODIMP IsValidUserID(VARIANT Username, VARIANT ProductID, VARIANT_BOOL* result) override;
  STDMETHODIMP EmailKeyToUser(BSTR ProductID, BSTR Username, LONG* blnNewUser, LONG* result) override;
  STDMETHODIMP GetHardLimit(VARIANT szProductID, LONG* result) override;
  STDMETHODIMP GetSoftLimit(VARIANT szProductID, LONG* result) override;
  STDMETHODIMP GetMGUIDForUser(BSTR szProductID, BSTR szUserName, BSTR* result) override;
  STDMETHODIMP GetCreationDateForMGUID(BSTR szProductID, BSTR szUserName, BSTR* result) override;
  STDMETHODIMP GetCurrentDateTimeFromServer(BSTR* result) override;
  STDMETHODIMP CanDownLoadFile(VARIANT_BOOL* result) override;
  STDMETHODIMP DownloadFile(BSTR szServerFileName, BSTR szLocalFileName, BSTR* result) override;
  STDMETHODIMP ManagePassword(BSTR szProductID, BSTR szUserName, BSTR szPassword, BSTR szNewPassword,
                              LONG* result) override;
  STDMETHODIMP ActivateAccount(BSTR szProductID, BSTR szUserName, BSTR szPassword, BSTR* result) override;
  STDMETHODIMP AbortFileTransfer(VARIANT* bAbortStatus, VARIANT* result) override;
  STDMETHODIMP IsAccountEmpty(VARIANT_BOOL* result) override;
  STDMETHODIMP SaveUploadFile(BSTR szFilePath, BSTR* result) override;
  STDMETHODIMP FileExists(BSTR* szNewFileName, VARIANT_BOOL* result) override;
  STDMETHODIMP EnCodeString(BSTR szString, BSTR* result) override;
  STDMETHODIMP GetUserBasePath(BSTR* result) override;
  STDMETHODIMP GetAccountDetailsForMGUID(BSTR MGUID, BSTR Username, BSTR ProductID, IDispatch** col,
                                         LONG* result) override;
  STDMETHODIMP HasUserAccountExpired(BSTR Username, LONG* result) override;
  STDMETHODIMP GetPremiumBaseAccountSize(BSTR Username, LONG* result) override;

 private:
  // For what runs the host's code, which may release the client inside.
  ComPtr<IUnknown> KeptAlive() { return ComPtr<IUnknown>(static_cast<IDispatch*>(this)); }
  void* FindInterface(REFIID interfaceId) override;

  const ApartmentHold apartment_;
  const std::shared_ptr<CFileUpload> client_;
  // What the host was last given for the client's record, so that it gets the same object again.
  ComPtr<CUploadObject> uploadObject_;
};

}  // namespace tarnwick
