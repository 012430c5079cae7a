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

interface _ctrlListImage
mobjFileupload: CFileUpload
m_LastError: FtpErrors
m_strLastErrorDesc: text
m_strWinsockBuffer: text
m_strDataBuffer: text
m_strLocalFilePath: text
m_intLocalFileID: short
m_bTransferInProgress: boolean
m_lDownloadedBytes: long
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
ListViewSetFocus(): variant
UploadedFileSetFocus(ref szFileName: text): variant
DeleteFile()
Init(ref szFileFilter: text): boolean
UploadImage(szLocalPath: text): boolean
CheckFileExtension(ref szNewString: text, ref szOriExt: text): boolean
IsFileNameValid(ref szFileName: text): boolean
StartLabelExit(): variant
EnableRename(ref bEnableRename: boolean): variant
DownLoadFileFromServer(szLocalFilePath: text): text
GetFileDetails(FileName: variant, ref colFiles: object): variant
SelectedFileName(): text
GetSelectedFilesHttpPath(): variant
GetFileNames(): variant
OLEDropMode: short
OLEDragMode: long
OLEDrag()
Overlay(ref Key1: variant, ref Key2: variant): picture
CheckIfFileDoesNotExist(szFileName: text): boolean
SetMultiSelectProperty(ref bVal: boolean): variant
ChangeFileFilter(szFileFilter: text)
RenameFile(ref strOldFileName: text, ref strNewFileName: text): boolean

interface _ctrlThumbNailView
mobjFileupload: CFileUpload
m_LastError: FtpErrors
m_strLastErrorDesc: text
m_strWinsockBuffer: text
m_strDataBuffer: text
m_strLocalFilePath: text
m_intLocalFileID: short
m_bTransferInProgress: boolean
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
UploadedFileSetFocus(ref szFileName: text): variant
DeleteFile()
Init(ref szFileFilter: text): boolean
UploadImage(szLocalPath: text): boolean
CheckFileExtension(ref szNewString: text, ref szOriExt: text): boolean
IsFileNameValid(ref szFileName: text): boolean
EnableRename(ref bEnableRename: boolean): variant
DownLoadFileFromServer(szLocalFilePath: text): text
GetFileDetails(FileName: variant, ref colFiles: object): variant
SelectedFileName(): text
GetSelectedFilesHttpPath(): variant
OLEDropMode: short
OLEDragMode: long
OLEDrag()
Overlay(ref Key1: variant, ref Key2: variant): picture
CheckIfFileDoesNotExist(szFileName: text): boolean
ChangeFileFilter(szFileFilter: text)
RenameFile(ref strOldFileName: text, ref strNewFileName: text): boolean
iImgNo: short
EditFileLabel(): boolean
SetLabelText(ref szString: text): variant
ValidateFileName(ref NewString: text): variant
PictureSetFocus(): variant

events __ctrlListImage
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

events __ctrlThumbNailView
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

enumeration FTP_CONNECTION_STATES
FTP_CONNECTION_RESOLVING_HOST = 0
FTP_CONNECTION_HOST_RESOLVED = 1
FTP_CONNECTION_CONNECTED = 2
FTP_CONNECTION_AUTHENTICATION = 3
FTP_USER_LOGGED = 4
FTP_ESTABLISHING_DATA_CONNECTION = 5
FTP_DATA_CONNECTION_ESTABLISHED = 6
FTP_RETRIEVING_DIRECTORY_INFO = 7
FTP_DIRECTORY_INFO_COMPLETED = 8
FTP_TRANSFER_STARTING = 9
FTP_TRANSFER_COMLETED = 10

enumeration FtpTransferModes
FTP_ASCII_MODE = 0
FTP_IMAGE_MODE = 1

enumeration FTP_RESPONSE_CODES
FTP_RESPONSE_RESTATRT_MARKER_REPLY = 110
FTP_RESPONSE_SERVICE_READY_IN_MINUTES = 120
FTP_RESPONSE_DATA_CONNECTION_ALREADY_OPEN = 125
FTP_RESPONSE_FILE_STATUS_OK = 150
FTP_RESPONSE_COMMAND_OK = 200
FTP_RESPONSE_COMMAND_NOT_IMPLEMENTED_SUPERFLUOUS_AT_THIS_SITE = 202
FTP_RESPONSE_SYSTEM_STATUS_OR_SYSTEM_HELP_REPLY = 211
FTP_RESPONSE_DIRECTORY_STATUS = 212
FTP_RESPONSE_FILE_STATUS = 213
FTP_RESPONSE_HELP_MESSAGE = 214
FTP_RESPONSE_NAME_SYSTEM_TYPE = 215
FTP_RESPONSE_SERVICE_READY_FOR_NEW_USER = 220
FTP_RESPONSE_SERVICE_CLOSING_CONTROL_CONNECTION = 221
FTP_RESPONSE_DATA_CONNECTION_OPEN = 225
FTP_RESPONSE_CLOSING_DATA_CONNECTION = 226
FTP_RESPONSE_ENTERING_PASSIVE_MODE = 227
FTP_RESPONSE_USER_LOGGED_IN = 230
FTP_RESPONSE_REQUESTED_FILE_ACTION_OK_COMPLETED = 250
FTP_RESPONSE_PATHNAME_CREATED = 257
FTP_RESPONSE_USER_NAME_OK_NEED_PASSWORD = 331
FTP_RESPONSE_NEED_ACCOUNT_FOR_LOGIN = 332
FTP_RESPONSE_REQUESTED_FILE_ACTION_PENDING_FURTHER_INFO = 350
FTP_RESPONSE_SERVICE_NOT_AVAILABLE_CLOSING_CONTROL_CONNECTION = 421
FTP_RESPONSE_CANNOT_OPEN_DATA_CONNECTION = 425
FTP_RESPONSE_CONNECTION_CLOSED_TRANSFER_ABORTED = 426
FTP_RESPONSE_REQUESTED_FILE_ACTION_NOT_TAKEN = 450
FTP_RESPONSE_REQUESTED_ACTION_ABORTED = 451
FTP_RESPONSE_REQUESTED_ACTION_NOT_TAKEN = 452
FTP_RESPONSE_SYNTAX_ERROR_COMMAND_UNRECOGNIZED = 500
FTP_RESPONSE_SYNTAX_ERROR_IN_PARAMETERS_OR_ARGUMENTS = 501
FTP_RESPONSE_COMMAND_NOT_IMPLEMENTED = 502
FTP_RESPONSE_BAD_SEQUENCE_OF_COMMANDS = 503
FTP_RESPONSE_COMMAND_NOT_IMPLEMENTED_FOR_THAT_PARAMETER = 504
FTP_RESPONSE_NOT_LOGGED_IN = 530
FTP_RESPONSE_NEED_ACCOUNT_FOR_STORING_FILES = 532
FTP_RESPONSE_REQUESTED_ACTION_NOT_TAKEN_FILE_UNAVAILABLE = 550
FTP_RESPONSE_REQUESTED_ACTION_ABORTED_PAGE_TYPE_UNKNOWN = 551
FTP_RESPONSE_REQUESTED_FILE_ACTION_ABORTED_EXCEEDED_STORAGE_ALLOCATION = 552
FTP_RESPONSE_REQUESTED_ACTION_NOT_TAKEN_FILE_NAME_NOT_ALLOWED = 553

enumeration FtpErrors
ERROR_FTP_WINSOCK_AddressInUse = 0
ERROR_FTP_WINSOCK_AddressNotAvailable = 1
ERROR_FTP_WINSOCK_AlreadyComplete = 2
ERROR_FTP_WINSOCK_AlreadyConnected = 3
ERROR_FTP_WINSOCK_BadState = 4
ERROR_FTP_WINSOCK_ConnectAborted = 5
ERROR_FTP_WINSOCK_ConnectionRefused = 6
ERROR_FTP_WINSOCK_ConnectionReset = 7
ERROR_FTP_WINSOCK_GetNotSupported = 8
ERROR_FTP_WINSOCK_HostNotFound = 9
ERROR_FTP_WINSOCK_HostNotFoundTryAgain = 10
ERROR_FTP_WINSOCK_InProgress = 11
ERROR_FTP_WINSOCK_InvalidArg = 12
ERROR_FTP_WINSOCK_InvalidArgument = 13
ERROR_FTP_WINSOCK_InvalidOp = 14
ERROR_FTP_WINSOCK_InvalidPropertyValue = 15
ERROR_FTP_WINSOCK_MsgTooBig = 16
ERROR_FTP_WINSOCK_NetReset = 17
ERROR_FTP_WINSOCK_NetworkSubsystemFailed = 18
ERROR_FTP_WINSOCK_NetworkUnreachable = 19
ERROR_FTP_WINSOCK_NoBufferSpace = 20
ERROR_FTP_WINSOCK_NoData = 21
ERROR_FTP_WINSOCK_NonRecoverableError = 22
ERROR_FTP_WINSOCK_NotConnected = 23
ERROR_FTP_WINSOCK_NotInitialized = 24
ERROR_FTP_WINSOCK_NotSocket = 25
ERROR_FTP_WINSOCK_OpCanceled = 26
ERROR_FTP_WINSOCK_OutOfMemory = 27
ERROR_FTP_WINSOCK_OutOfRange = 28
ERROR_FTP_WINSOCK_PortNotSupported = 29
ERROR_FTP_WINSOCK_SetNotSupported = 30
ERROR_FTP_WINSOCK_SocketShutdown = 31
ERROR_FTP_WINSOCK_Success = 32
ERROR_FTP_WINSOCK_Timedout = 33
ERROR_FTP_WINSOCK_Unsupported = 34
ERROR_FTP_WINSOCK_WouldBlock = 35
ERROR_FTP_WINSOCK_WrongProtocol = 36
ERROR_FTP_PROTOCOL_SERVICE_READY_IN_MINUTES = 37
ERROR_FTP_PROTOCOL_USER_NAME_OK_NEED_PASSWORD = 38
ERROR_FTP_PROTOCOL_NEED_ACCOUNT_FOR_LOGIN = 39
ERROR_FTP_PROTOCOL_REQUESTED_FILE_ACTION_PENDING_FURTHER_INFO = 40
ERROR_FTP_PROTOCOL_SERVICE_NOT_AVAILABLE_CLOSING_CONTROL_CONNECTION = 41
ERROR_FTP_PROTOCOL_CANNOT_OPEN_DATA_CONNECTION = 42
ERROR_FTP_PROTOCOL_CONNECTION_CLOSED_TRANSFER_ABORTED = 43
ERROR_FTP_PROTOCOL_REQUESTED_FILE_ACTION_NOT_TAKEN = 44
ERROR_FTP_PROTOCOL_REQUESTED_ACTION_ABORTED = 45
ERROR_FTP_PROTOCOL_REQUESTED_ACTION_NOT_TAKEN = 46
ERROR_FTP_PROTOCOL_SYNTAX_ERROR_COMMAND_UNRECOGNIZED = 47
ERROR_FTP_PROTOCOL_SYNTAX_ERROR_IN_PARAMETERS_OR_ARGUMENTS = 48
ERROR_FTP_PROTOCOL_COMMAND_NOT_IMPLEMENTED = 49
ERROR_FTP_PROTOCOL_BAD_SEQUENCE_OF_COMMANDS = 50
ERROR_FTP_PROTOCOL_COMMAND_NOT_IMPLEMENTED_FOR_THAT_PARAMETER = 51
ERROR_FTP_PROTOCOL_NOT_LOGGED_IN = 52
ERROR_FTP_PROTOCOL_NEED_ACCOUNT_FOR_STORING_FILES = 53
ERROR_FTP_PROTOCOL_REQUESTED_ACTION_NOT_TAKEN_FILE_UNAVAILABLE = 54
ERROR_FTP_PROTOCOL_REQUESTED_ACTION_ABORTED_PAGE_TYPE_UNKNOWN = 55
ERROR_FTP_PROTOCOL_REQUESTED_FILE_ACTION_ABORTED_EXCEEDED_STORAGE_ALLOCATION = 56
ERROR_FTP_PROTOCOL_REQUESTED_ACTION_NOT_TAKEN_FILE_NAME_NOT_ALLOWED = 57
ERROR_FTP_USER_TIMEOUT = 58
ERROR_FTP_USER_TRANSFER_IN_PROGRESS = 59

enumeration REG_KEYTYPE
REG_SZ = 1
REG_EXPAND_SZ = 2
REG_BINARY = 3
REG_DWORD = 4

enumeration REG_HIVES
HKEY_CLASSES_ROOT = -2147483648
HKEY_CURRENT_USER = -2147483647
HKEY_LOCAL_MACHINE = -2147483646
HKEY_USERS = -2147483645
HKEY_DYN_DATA = -2147483642
HKEY_CURRENT_CONFIG = -2147483643
)";
// clang-format on

}  // namespace tarnwick::test
