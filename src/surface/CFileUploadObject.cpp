#include "surface/CFileUploadObject.h"

#include "surface/CBVAccountObject.h"
#include "surface/Guard.h"
#include "surface/HostCollection.h"

namespace tarnwick {
CFileUploadObject::CFileUploadObject() : client_(std::make_shared<CFileUpload>(apartment_.Get())) {}

CFileUploadObject::CFileUploadObject(std::shared_ptr<CFileUpload> client) : client_(std::move(client)) {}

ComPtr<CFileUploadObject> CFileUploadObject::From(IUnknown* object) {
  // As with records: the class's own identifier leads back to the object.
  ComPtr<CFileUploadObject> self;
  if (object) object->QueryInterface(CLSID_CFileUpload, self.ReceiveVoid());
  return self;
}

void* CFileUploadObject::FindInterface(REFIID interfaceId) {
  return interfaceId == CLSID_CFileUpload ? this : DualObject::FindInterface(interfaceId);
}

// --- Session ---

STDMETHODIMP CFileUploadObject::get_HTTPServer(BSTR* value) {
  return GetText(client_->GetHTTPServer(), value);
}

STDMETHODIMP CFileUploadObject::put_HTTPServer(BSTR value) {
  return Guarded([&] {
    client_->SetHTTPServer(ViewOf(value));
    return S_OK;
  });
}

STDMETHODIMP CFileUploadObject::get_UploadObject(_CUpload** value) {
  if (!value) return E_POINTER;
  *value = nullptr;
  return Guarded([&] {
    const std::shared_ptr<CUpload>& record = client_->GetUploadObject();
    if (!uploadObject_ || uploadObject_->Record() != record)
      uploadObject_ = ComPtr<CUploadObject>::Adopt(new CUploadObject(record));
    *value = ComPtr<CUploadObject>(uploadObject_).Detach();
    return S_OK;
  });
}

STDMETHODIMP CFileUploadObject::put_UploadObject(_CUpload* value) {
  return putref_UploadObject(value);
}

STDMETHODIMP CFileUploadObject::putref_UploadObject(_CUpload* value) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Guarded([&]() -> HRESULT {
    ComPtr<CUploadObject> object = CUploadObject::From(value);
    // Records are made by the library only.
    if (value && !object) return DISP_E_TYPEMISMATCH;
    client_->SetUploadObject(object ? object->Record() : nullptr);
    uploadObject_ = std::move(object);
    return S_OK;
  });
}

STDMETHODIMP CFileUploadObject::ConnectToServer(BSTR szServer, VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return client_->ConnectToServer(ViewOf(szServer)); });
}

STDMETHODIMP CFileUploadObject::LogonAs(BSTR ProductID, BSTR Username, BSTR Password, BSTR MGUID,
                                        VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] {
    return client_->LogonAs(ViewOf(ProductID), ViewOf(Username), ViewOf(Password), ViewOf(MGUID));
  });
}

STDMETHODIMP CFileUploadObject::OpenSession(VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return client_->OpenSession(); });
}

STDMETHODIMP CFileUploadObject::DisconnectFromServer() {
  return Guarded([&] {
    client_->DisconnectFromServer();
    return S_OK;
  });
}

STDMETHODIMP CFileUploadObject::GetFileUploadPath(BSTR* result) {
  return AnsweredText(result, [&] { return client_->GetFileUploadPath(); });
}

STDMETHODIMP CFileUploadObject::GetUserBasePath(BSTR* result) {
  return AnsweredText(result, [&] { return client_->GetUserBasePath(); });
}

STDMETHODIMP CFileUploadObject::EnCodeString(BSTR szString, BSTR* result) {
  return AnsweredText(result, [&] { return CFileUpload::EnCodeString(ViewOf(szString)); });
}

// --- Files ---

STDMETHODIMP CFileUploadObject::ListFilesForUser(IDispatch** colFiles, VARIANT_BOOL* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredBoolean(result, [&] {
    // A current list is the answer itself: nothing is asked and the collection is left alone.
    if (client_->ListIsCurrent()) return true;
    if (!colFiles) return false;
    const HostCollection collection(colFiles);
    return client_->ListFilesForUser([&](const std::shared_ptr<CUpload>& file) {
      const auto object = ComPtr<CUploadObject>::Adopt(new CUploadObject(file));
      collection.Add(object.Get(), Text(file->FilePath));
    });
  });
}

STDMETHODIMP CFileUploadObject::GetFileDetails(VARIANT, IDispatch**, VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [] { return CFileUpload::GetFileDetails(); });
}

STDMETHODIMP CFileUploadObject::UploadFile(BSTR szFilePath, BSTR* result) {
  return AnsweredText(result, [&] { return client_->UploadFile(ViewOf(szFilePath)); });
}

STDMETHODIMP CFileUploadObject::SaveUploadFile(BSTR szFilePath, BSTR* result) {
  return AnsweredText(result, [&] { return client_->SaveUploadFile(ViewOf(szFilePath)); });
}

STDMETHODIMP CFileUploadObject::SetCUploadObject(BSTR FileName, BSTR FilePath, double FileSize,
                                                 VARIANT* result) {
  return AnsweredVariant(result, [&] {
    client_->SetCUploadObject(ViewOf(FileName), ViewOf(FilePath), FileSize);
    return VARIANT{};
  });
}

STDMETHODIMP CFileUploadObject::RenameFile(BSTR ProductID, BSTR Username, BSTR FileToRename, BSTR NewFileName,
                                           VARIANT* result) {
  return AnsweredVariant(result, [&] {
    return VariantFromNumber(
        client_->RenameFile(ViewOf(ProductID), ViewOf(Username), ViewOf(FileToRename), ViewOf(NewFileName)));
  });
}

STDMETHODIMP CFileUploadObject::DeleteFileForUser(BSTR FileToBeDeleted, LONG* result) {
  return Answered(result, 0, [&] { *result = client_->DeleteFileForUser(ViewOf(FileToBeDeleted)); });
}

STDMETHODIMP CFileUploadObject::GetMaxQuota(BSTR ProductID, BSTR Username, double* result) {
  return Answered(result, 0, [&] { *result = client_->GetMaxQuota(ViewOf(ProductID), ViewOf(Username)); });
}

STDMETHODIMP CFileUploadObject::GetTotalUsedQuota(BSTR ProductID, BSTR Username, VARIANT* result) {
  return AnsweredVariant(result, [&] {
    VARIANT quota = VARIANT{};
    if (const auto used = client_->GetTotalUsedQuota(ViewOf(ProductID), ViewOf(Username))) {
      V_VT(&quota) = VT_R8;
      V_R8(&quota) = *used;
    }
    return quota;
  });
}

STDMETHODIMP CFileUploadObject::CanUploadFile(LONG* result) {
  return Answered(result, 0, [&] { *result = client_->CanUploadFile(); });
}

STDMETHODIMP CFileUploadObject::CanDeleteFile(VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [] { return CFileUpload::CanDeleteFile(); });
}

STDMETHODIMP CFileUploadObject::CanDownLoadFile(VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [] { return CFileUpload::CanDownLoadFile(); });
}

STDMETHODIMP CFileUploadObject::FileExists(BSTR* szNewFileName, VARIANT_BOOL* result) {
  return AnsweredBoolean(result,
                         [&] { return szNewFileName && client_->FileExists(ViewOf(*szNewFileName)); });
}

STDMETHODIMP CFileUploadObject::IsAccountEmpty(VARIANT_BOOL* result) {
  return AnsweredBoolean(result, [&] { return client_->IsAccountEmpty(); });
}

STDMETHODIMP CFileUploadObject::DownloadFile(BSTR szServerFileName, BSTR szLocalFileName, BSTR* result) {
  return AnsweredText(
      result, [&] { return client_->DownloadFile(ViewOf(szServerFileName), ViewOf(szLocalFileName)); });
}

STDMETHODIMP CFileUploadObject::AbortFileTransfer(VARIANT* bAbortStatus, VARIANT* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredVariant(result, [&] {
    if (bAbortStatus) client_->AbortFileTransfer(BooleanFromVariant(*bAbortStatus));
    return VARIANT{};
  });
}

// --- Accounts ---

STDMETHODIMP CFileUploadObject::AddUser(BSTR ProductID, BSTR Username, VARIANT GUID, BSTR* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredText(
      result, [&] { return client_->AddUser(ViewOf(ProductID), ViewOf(Username), TextFromVariant(GUID)); });
}

STDMETHODIMP CFileUploadObject::DeleteUser(BSTR ProductID, BSTR Username, VARIANT Password, VARIANT_BOOL,
                                           LONG* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Answered(result, 0, [&] {
    *result = client_->DeleteUser(ViewOf(ProductID), ViewOf(Username), Secret(TextFromVariant(Password)));
  });
}

STDMETHODIMP CFileUploadObject::IsValidUserID(VARIANT Username, VARIANT ProductID, VARIANT_BOOL* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return AnsweredBoolean(
      result, [&] { return client_->IsValidUserID(TextFromVariant(Username), TextFromVariant(ProductID)); });
}

STDMETHODIMP CFileUploadObject::GetKeyForUser(BSTR ProductID, BSTR Username, BSTR* result) {
  return AnsweredText(result,
                      [&] { return Secret(client_->GetKeyForUser(ViewOf(ProductID), ViewOf(Username))); });
}

STDMETHODIMP CFileUploadObject::EmailKeyToUser(BSTR ProductID, BSTR Username, LONG* blnNewUser,
                                               LONG* result) {
  return Answered(result, 0, [&] {
    *result = client_->EmailKeyToUser(ViewOf(ProductID), ViewOf(Username), blnNewUser ? *blnNewUser : 0);
  });
}

STDMETHODIMP CFileUploadObject::ManagePassword(BSTR szProductID, BSTR szUserName, BSTR szPassword,
                                               BSTR szNewPassword, LONG* result) {
  return Answered(result, 0, [&] {
    *result = client_->ManagePassword(ViewOf(szProductID), ViewOf(szUserName), ViewOf(szPassword),
                                      ViewOf(szNewPassword));
  });
}

STDMETHODIMP CFileUploadObject::ActivateAccount(BSTR szProductID, BSTR szUserName, BSTR szPassword,
                                                BSTR* result) {
  return AnsweredText(result, [&] {
    return client_->ActivateAccount(ViewOf(szProductID), ViewOf(szUserName), ViewOf(szPassword));
  });
}

STDMETHODIMP CFileUploadObject::GetHardLimit(VARIANT szProductID, LONG* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Answered(result, 0, [&] { *result = client_->GetHardLimit(TextFromVariant(szProductID)); });
}

STDMETHODIMP CFileUploadObject::GetSoftLimit(VARIANT szProductID, LONG* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Answered(result, 0, [&] { *result = client_->GetSoftLimit(TextFromVariant(szProductID)); });
}

STDMETHODIMP CFileUploadObject::GetMGUIDForUser(BSTR szProductID, BSTR szUserName, BSTR* result) {
  return AnsweredText(result,
                      [&] { return client_->GetMGUIDForUser(ViewOf(szProductID), ViewOf(szUserName)); });
}

STDMETHODIMP CFileUploadObject::GetCreationDateForMGUID(BSTR szProductID, BSTR szUserName, BSTR* result) {
  return AnsweredText(
      result, [&] { return client_->GetCreationDateForMGUID(ViewOf(szProductID), ViewOf(szUserName)); });
}

STDMETHODIMP CFileUploadObject::GetCurrentDateTimeFromServer(BSTR* result) {
  return AnsweredText(result, [&] { return client_->GetCurrentDateTimeFromServer(); });
}

STDMETHODIMP CFileUploadObject::GetAccountDetailsForMGUID(BSTR MGUID, BSTR Username, BSTR ProductID,
                                                          IDispatch** col, LONG* result) {
  const ComPtr<IUnknown> alive = KeptAlive();
  return Answered(result, 0, [&] {
    if (!col) return;
    const HostCollection collection(col);
    *result = client_->GetAccountDetailsForMGUID(
        ViewOf(MGUID), ViewOf(Username), ViewOf(ProductID), [&](const std::shared_ptr<CBVAccount>& account) {
          const auto object = ComPtr<CBVAccountObject>::Adopt(new CBVAccountObject(*account));
          collection.Add(object.Get(), {});
        });
  });
}

STDMETHODIMP CFileUploadObject::HasUserAccountExpired(BSTR Username, LONG* result) {
  return Answered(result, 0, [&] { *result = client_->HasUserAccountExpired(ViewOf(Username)); });
}

STDMETHODIMP CFileUploadObject::GetPremiumBaseAccountSize(BSTR Username, LONG* result) {
  return Answered(result, 0, [&] { *result = client_->GetPremiumBaseAccountSize(ViewOf(Username)); });
}

}  // namespace tarnwick
