// The client of the hosting service: logs a user on, lists, registers, renames and deletes the user's files,
// asks for quotas and administers accounts.
//
// Every public operation is one exchange with the service page unless it says otherwise. None of them throws:
// on any failure an operation returns its result as it stood, which is 0, an empty text or false where no
// other failure value is named. They block without pumping messages.
#pragma once

#include <cstdint>
#include <functional>
#include <initializer_list>
#include <memory>
#include <optional>

#include "base/Text.h"
#include "service/CBVAccount.h"
#include "service/HTTPServer.h"
#include "session/Apartment.h"
#include "session/CUpload.h"

namespace tarnwick {

// Status codes of the service.
namespace status {
inline constexpr std::int32_t kSuccess = 1001;
inline constexpr std::int32_t kNegative = 1002;
inline constexpr std::int32_t kUserExists = 1003;
inline constexpr std::int32_t kFailure = 1004;
inline constexpr std::int32_t kRenameRefused = 1033;
}  // namespace status

class CFileUpload {
 public:
  // Take what an operation adds to a collection; they may throw to refuse it, which ends the operation.
  using FileSink = std::function<void(const std::shared_ptr<CUpload>& file)>;
  using AccountSink = std::function<void(const std::shared_ptr<CBVAccount>& account)>;

  // `apartment` outlives the object. The first object of an apartment loads the host product's strings.
  explicit CFileUpload(Apartment& apartment);
  // Closes the apartment's FTP connection.
  ~CFileUpload();
  CFileUpload(const CFileUpload&) = delete;
  CFileUpload& operator=(const CFileUpload&) = delete;

  // --- Session ---

  // The server name as last set on this object. Setting it changes the name for the whole apartment.
  const Text& GetHTTPServer() const { return serverName_; }
  void SetHTTPServer(TextView serverName);

  // The record of the file that is being registered; made when there is none. Setting null drops it.
  const std::shared_ptr<CUpload>& GetUploadObject();
  void SetUploadObject(std::shared_ptr<CUpload> record) { uploadObject_ = std::move(record); }

  // Sets the apartment's server name and asks whether the service is there. With "https://" in front of it
  // ("https://host" or "https://host:port") everything goes over TLS; what is neither that nor "host" or
  // "host:port" is asked nothing.
  bool ConnectToServer(TextView szServer);

  // Logs the user on and forgets the previous listing. Whenever the result is false, the previous user name
  // and password stand again and the listing stays; the MGUID and the product number keep their new values.
  bool LogonAs(TextView ProductID, TextView Username, TextView Password, TextView MGUID);

  // Opens the FTP connection (no service request but for the folder's path) and goes to the user's folder.
  // True when the connection is open, even when the folder is not there. Over TLS there is no FTP: true when
  // the service takes the user.
  bool OpenSession();

  // Closes the FTP connection. No service request.
  void DisconnectFromServer();

  // Path of the user's folder from the server's root.
  Text GetFileUploadPath();

  // Web address of the user's folder; "http://" (or "https://") and the server name alone when the service
  // does not tell. Empty, without a request, for a name that cannot be a server's.
  Text GetUserBasePath();

  // `szString` with "%", "+", "#" and "&" escaped, the characters that break a form value. No request.
  static Text EnCodeString(TextView szString);

  // --- Files ---

  // Hands a record per file of the account to `colFiles`, in the server's order. When ListIsCurrent, returns
  // true at once without a request and hands over nothing. An error half-way leaves what was handed over and
  // returns false.
  bool ListFilesForUser(const FileSink& colFiles);

  // Whether ListFilesForUser has nothing to ask: the all-files list is current and not empty. No request.
  bool ListIsCurrent() const { return apartment_.listing.isCurrent && !apartment_.listing.all.IsEmpty(); }

  // Does nothing and returns false; the controls have an operation of this name.
  static bool GetFileDetails() { return false; }

  // Register the file `szFilePath`, whose bytes went to the server through its acceptor page, and return its
  // web address. The file's attributes are cleared meanwhile, where that is allowed, and stand again
  // afterwards. UploadFile takes the name after the last "/", SaveUploadFile the one after the last "\".
  Text UploadFile(TextView szFilePath);
  Text SaveUploadFile(TextView szFilePath);

  // Sets three values of the UploadObject record. No request.
  void SetCUploadObject(TextView FileName, TextView FilePath, double FileSize);

  // 1001, or 1033 in every other case.
  std::int32_t RenameFile(TextView ProductID, TextView Username, TextView FileToRename, TextView NewFileName);

  // 1001 when the file was deleted, 0 when not, 1004 after a failed exchange.
  std::int32_t DeleteFileForUser(TextView FileToBeDeleted);

  // Bytes that the account may hold, and that it holds; nullopt (for the first 0) when the service fails.
  double GetMaxQuota(TextView ProductID, TextView Username);
  std::optional<double> GetTotalUsedQuota(TextView ProductID, TextView Username);

  // 1001 when the account may upload, 1002 when its quota is used up, 1004 when it expired or on failure.
  std::int32_t CanUploadFile();

  // Always true, without a request.
  static bool CanDeleteFile() { return true; }
  static bool CanDownLoadFile() { return true; }

  // Whether the all-files list holds a file of that very name (letter case counts). No request.
  bool FileExists(TextView szNewFileName) const;

  // Whether the all-files list is empty. No request.
  bool IsAccountEmpty() const { return apartment_.listing.all.IsEmpty(); }

  // Fetches a file of the user's folder, over the FTP connection or over TLS, and returns `szLocalFileName`,
  // or an empty text.
  Text DownloadFile(TextView szServerFileName, TextView szLocalFileName);

  // Stores the apartment's abort flag; true ends the transfers of its controls that run now. No request.
  void AbortFileTransfer(bool bAbortStatus);

  // --- Accounts ---

  // Creates an account and its folder, logs the new user on and has the key mailed. Returns the new MGUID, or
  // a status as text: 1002 (no MGUID), 1003 (user exists), 1004 (failed, and the account was removed again),
  // 1011 (limit of accounts), or what else the service said.
  Text AddUser(TextView ProductID, TextView Username, TextView GUID);

  // Removes an account with its folder. 1001 when done, 1002 when the password was refused, 1003 when there
  // is no such user, 1004 on failure. The folder always goes too.
  std::int32_t DeleteUser(TextView ProductID, TextView Username, TextView Password);

  bool IsValidUserID(TextView Username, TextView ProductID);

  // The user's key, "1004" after a failed exchange.
  Text GetKeyForUser(TextView ProductID, TextView Username);

  // Has the service mail the key; `blnNewUser` is passed on. The service's status, 1004 after a failed
  // exchange.
  std::int32_t EmailKeyToUser(TextView ProductID, TextView Username, std::int32_t blnNewUser);

  // 1001 when the password was changed, else 1004.
  std::int32_t ManagePassword(TextView szProductID, TextView szUserName, TextView szPassword,
                              TextView szNewPassword);

  // The MGUID of the account, "1002" when the service gives none, "1004" after a failed exchange.
  Text ActivateAccount(TextView szProductID, TextView szUserName, TextView szPassword);

  // The numbers of accounts at which the service warns and refuses.
  std::int32_t GetHardLimit(TextView szProductID);
  std::int32_t GetSoftLimit(TextView szProductID);

  // Texts of the service, "1004" after a failed exchange.
  Text GetMGUIDForUser(TextView szProductID, TextView szUserName);
  Text GetCreationDateForMGUID(TextView szProductID, TextView szUserName);
  Text GetCurrentDateTimeFromServer();

  // Hands the account's details to `col`. 1001 when done, 1004 after a failed exchange, 0 on other failures.
  std::int32_t GetAccountDetailsForMGUID(TextView MGUID, TextView Username, TextView ProductID,
                                         const AccountSink& col);

  // 1001 or 1002 as the service answers (not expired, expired), 1004 after a failed exchange.
  std::int32_t HasUserAccountExpired(TextView Username);

  // Bytes, 1004 after a failed exchange.
  std::int32_t GetPremiumBaseAccountSize(TextView Username);

 private:
  struct Parameter {
    TextView name;
    Secret value;
  };

  // One exchange: composes the request, sends it and reads the reply. `parameters` follow the enciphered
  // action. The reply is the caller's own, because what takes its values may be code of the host that asks
  // the next one.
  Reply Ask(TextView requestName, TextView clientAction, std::initializer_list<Parameter> parameters,
            std::int32_t sendFlag);

  // The first value of one reply variable, which is the whole result of an operation. `onFailure` after a
  // failed exchange; throws what a missing variable throws.
  Text AskForText(TextView requestName, TextView clientAction, std::initializer_list<Parameter> parameters,
                  std::int32_t sendFlag, TextView variable, TextView onFailure);

  // The same as a number; also throws what is no number.
  std::int32_t AskForNumber(TextView requestName, TextView clientAction,
                            std::initializer_list<Parameter> parameters, std::int32_t sendFlag,
                            TextView variable, std::int32_t onFailure);

  Text RegisterFile(TextView fileName, TextView path);
  // Logs the new user on and creates the user's folder; false when either fails.
  bool SetUpAccount(TextView ProductID, TextView Username, TextView password, TextView mguid,
                    TextView folder);
  // Whether the service takes the session's user and password for the product.
  bool AskForLogon(const Text& product);
  void LookUpFtpProxy();
  // What DownloadFile does over TLS. May throw.
  bool FetchSecurely(TextView serverFile, TextView localFile);

  // A value as it goes into the form when it is enciphered.
  static Text Encipher(TextView value);

  // The session's product number and escaped user name as parameter values.
  Text SessionProduct() const { return TextFromNumber(apartment_.session.productNumber); }
  Text SessionUser() const { return EnCodeString(apartment_.session.userName); }

  Apartment& apartment_;
  HTTPServer channel_;
  Text serverName_;
  std::shared_ptr<CUpload> uploadObject_;
};

}  // namespace tarnwick
