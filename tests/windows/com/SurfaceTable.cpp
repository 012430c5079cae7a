// What hosts were promised.
#include "SurfaceTable.h"

namespace tarnwick::test {

// clang-format off
const char* const kSurface = R"(
class CFileUpload creatable default _CFileUpload
class CUpload default _CUpload
class CBVAccount creatable default _CBVAccount
class CRegistry default _CRegistry
class ctrlListImage creatable control default _ctrlListImage events __ctrlListImage
class ctrlThumbNailView creatable control default _ctrlThumbNailView events __ctrlThumbNailView

interface _CFileUpload
HTTPServer: text
UploadObject: CUpload
RenameFile(ProductID: text, Username: text, FileToRename: text, NewFileName: text): variant
UploadFile(szFilePath: text): text
GetMaxQuota(ProductID: text, Username: text): double
GetTotalUsedQuota(ProductID: text, Username: text): variant
CanUploadFile(): long
CanDeleteFile(): boolean
SetCUploadObject(FileName: text, FilePath: text, FileSize: double): variant
DeleteFileForUser(FileToBeDeleted: text): long
GetFileDetails(FileName: variant, ref colFiles: object): boolean
ListFilesForUser(ref colFiles: object): boolean
DisconnectFromServer()
ConnectToServer(szServer: text): boolean
LogonAs(ProductID: text, Username: text, Password: text, MGUID: text): boolean
OpenSession(): boolean
GetFileUploadPath(): text
GetKeyForUser(ProductID: text, Username: text): text
AddUser(ProductID: text, Username: text, GUID: variant): text
DeleteUser(ProductID: text, Username: text, Password: variant, blnDeleteFolder: boolean): long
IsValidUserID(Username: variant, ProductID: variant): boolean
EmailKeyToUser(ProductID: text, Username: text, optional ref blnNewUser: long = 0): long
GetHardLimit(szProductID: variant): long
GetSoftLimit(szProductID: variant): long
GetMGUIDForUser(szProductID: text, szUserName: text): text
GetCreationDateForMGUID(szProductID: text, szUserName: text): text
GetCurrentDateTimeFromServer(): text
CanDownLoadFile(): boolean
DownloadFile(szServerFileName: text, szLocalFileName: text): text
ManagePassword(szProductID: text, szUserName: text, szPassword: text, szNewPassword: text): long
ActivateAccount(szProductID: text, szUserName: text, szPassword: text): text
AbortFileTransfer(ref bAbortStatus: variant): variant
IsAccountEmpty(): boolean
SaveUploadFile(szFilePath: text): text
FileExists(ref szNewFileName: text): boolean
EnCodeString(szString: text): text
GetUserBasePath(): text
GetAccountDetailsForMGUID(MGUID: text, Username: text, ProductID: text, ref col: object): long
HasUserAccountExpired(Username: text): long
GetPremiumBaseAccountSize(Username: text): long

interface _CUpload
FileName: text
FileDate: text
FilePath: text
FileSize: double

interface _CBVAccount
ServiceLevelName: text
ExpiryPeriod: long
CurrentDate: text
StartDate: text
UsedQuota: variant
Quota: variant
EmailAddress: text

interface _CRegistry
setBaseRegKey(ref regHive: REG_HIVES, ref regSubKeys: text)
getRegSetting(ref RegNameValue: text, optional ref Subkey: text = "", optional ref Datatype: REG_KEYTYPE = 0): text

interface _ctrlListImage, _ctrlThumbNailView
mobjFileupload: CFileUpload
m_LastError: FtpErrors
m_strLastErrorDesc: text
m_strWinsockBuffer: text
m_strDataBuffer: text
m_strLocalFilePath: text
m_intLocalFileID: short
m_bTransferInProgress: boolean
(list) m_lDownloadedBytes: long
m_bUploadFile: boolean
m_lUploadedBytes: long
m_strLastServerResponse: text
m_bFileIsOpened: boolean
gbUploadImage: boolean
gbConnectionFailed: boolean
gszDownloadPath: text
gbDownload: boolean
bRenameEnabled: boolean
bConnectedToFtp: boolean
(list) ListViewSetFocus(): variant
UploadedFileSetFocus(ref szFileName: text): variant
DeleteFile()
Init(ref szFileFilter: text): boolean
UploadImage(szLocalPath: text): boolean
CheckFileExtension(ref szNewString: text, ref szOriExt: text): boolean
IsFileNameValid(ref szFileName: text): boolean
(list) StartLabelExit(): variant
EnableRename(ref bEnableRename: boolean): variant
DownLoadFileFromServer(szLocalFilePath: text): text
GetFileDetails(FileName: variant, ref colFiles: object): variant
SelectedFileName(): text
GetSelectedFilesHttpPath(): variant
(list) GetFileNames(): variant
OLEDropMode: short
OLEDragMode: long
OLEDrag()
Overlay(ref Key1: variant, ref Key2: variant): picture
CheckIfFileDoesNotExist(szFileName: text): boolean
(list) SetMultiSelectProperty(ref bVal: boolean): variant
ChangeFileFilter(szFileFilter: text)
RenameFile(ref strOldFileName: text, ref strNewFileName: text): boolean
(thumbnails) iImgNo: short
(thumbnails) EditFileLabel(): boolean
(thumbnails) SetLabelText(ref szString: text): variant
(thumbnails) ValidateFileName(ref NewString: text): variant
(thumbnails) PictureSetFocus(): variant

events __ctrlListImage, __ctrlThumbNailView
1 FileManagerEvent(ref lErrorValue: variant, ref szdescription: text)
2 OLEStartDrag(ref Data: object, ref AllowedEffects: long)
3 OLESetData(ref Data: object, ref DataFormat: short)
4 OLEGiveFeedback(ref Effect: long, ref DefaultCursors: boolean)
5 OLEDragOver(ref Data: object, ref Effect: long, ref Button: short, ref Shift: short, ref x: single, ref y: single, ref State: short)
6 OLEDragDrop(ref Data: object, ref Effect: long, ref Button: short, ref Shift: short, ref x: single, ref y: single)
7 OLECompleteDrag(ref Effect: long)
8 StateChanged(ref State: FTP_CONNECTION_STATES)
9 DownloadProgress(ref lBytes: long)
10 UploadProgress(ref lBytes: long)
11 ReplyMessage(sMessage: text)
)";
// clang-format on

}  // namespace tarnwick::test
