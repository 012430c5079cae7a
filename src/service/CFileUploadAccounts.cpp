// The operations that administer accounts.
#include "base/RuntimeError.h"
#include "service/CFileUpload.h"
#include "service/Log.h"
#include "support/PathHelpers.h"
#include "transfer/AcceptorPages.h"

namespace tarnwick {
namespace {

constexpr TextView kFailureText = u"1004";
constexpr std::int32_t kCreateFolderAction = 5;
constexpr std::int32_t kDeleteFolderAction = 6;

// Runs a folder action; the number that it raised, 0 when it succeeded.
template <typename Action>
std::int32_t ErrorNumberOf(Action&& action) {
  try {
    std::forward<Action>(action)();
    return 0;
  } catch (const RuntimeError& failure) {
    return failure.Number();
  }
}

bool FolderActionIsDone(std::int32_t errorNumber) {
  return errorNumber == 0 || errorNumber == acceptor::kFolderState;
}

}  // namespace

Text CFileUpload::AddUser(TextView ProductID, TextView Username, TextView GUID) {
  return ResultAsItStood(Text(), [&](Text& result) {
    Log(u"Inside AddUser");
    Log(u"Adding parameters");
    const Reply reply = Ask(
        u"UserKeyRequest", u"AddUser",
        {{u"UserName", EnCodeString(Username)}, {u"ProductID", Text(ProductID)}, {u"MGUID", Text(GUID)}}, 1);
    std::int32_t code = status::kFailure;
    bool addedOnService = false;
    Secret password;
    Text mguid;
    if (reply.ErrorOccured() != 1) {
      Log(u"Start select case on return value");
      code = NumberFromText(reply.First(u"AddUser"));
      addedOnService = code == status::kSuccess;
    }
    if (addedOnService) {
      Log(u"In case SUCCEESS");
      // The base path is told for older services; folders are named without it.
      Log(u"Checking base path for '\\'");
      Log(reply.First(u"BasePath").ends_with(u'\\') ? u"'\\' found" : u"'\\' not found, adding '\\'");
      const Text folder = reply.First(u"UserFolder");
      password = reply.First(u"Password");
      mguid = reply.First(u"MGUID");
      if (!SetUpAccount(ProductID, Username, password, mguid, folder)) code = status::kFailure;
    }

    Log(u"Checking if user added in DB");
    if (code == status::kSuccess) {
      Log(u"Calling EmailKeyToUser with the following parameters:");
      EmailKeyToUser(ProductID, Username, 1);
    } else if (addedOnService) {
      DeleteUser(ProductID, Username, password);
    }
    if (code != status::kSuccess)
      result = TextFromNumber(code);
    else
      result = mguid.empty() ? TextFromNumber(status::kNegative) : mguid;
    Log(u"Returning from AddUser: ");
  });
}

bool CFileUpload::SetUpAccount(TextView ProductID, TextView Username, TextView password, TextView mguid,
                               TextView folder) {
  Log(u"Calling Logon with the following paramaters:");
  if (!LogonAs(ProductID, Username, password, mguid)) {
    Log(u"Logon returned false");
    return false;
  }
  Log(u"Logon returned true");
  Log(u"Calling FolderActionWithEvents");
  const SessionValues& session = apartment_.session;
  const bool done = FolderActionIsDone(ErrorNumberOf([&] {
    channel_.FolderActionWithEvents(UsersBaseUrl(session.serverName), folder,
                                    AcceptorPath(u"CreateFolderAcceptor.asp"), kCreateFolderAction,
                                    session.userName, session.password, kProductGuid);
  }));
  Log(done ? u"Folder exists/No error occured" : u"Set szRetVal as 1004");
  return done;
}

std::int32_t CFileUpload::DeleteUser(TextView ProductID, TextView Username, TextView Password) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& result) {
    if (!IsValidUserID(Username, ProductID)) {
      result = status::kUserExists;
      return;
    }
    const SessionValues& session = apartment_.session;
    const std::int32_t folderError = ErrorNumberOf([&] {
      channel_.FolderActionWithEvents(UsersBaseUrl(session.serverName), UserFolderName(Username),
                                      AcceptorPath(u"DeleteFolderAcceptor.asp"), kDeleteFolderAction,
                                      Username, Password, kProductGuid);
    });
    if (!FolderActionIsDone(folderError)) {
      result = folderError == acceptor::kRefused ? status::kNegative : status::kFailure;
    } else if (!LogonAs(ProductID, Username, Password, session.mguid)) {
      result = status::kNegative;
    } else {
      result = AskForNumber(u"DeleteUserRequest", u"DeleteUser",
                            {{u"UserName", EnCodeString(Username)},
                             {u"ProductID", Text(ProductID)},
                             {u"Password", Text(Password)}},
                            1, u"DeleteUser", status::kFailure);
    }
  });
}

bool CFileUpload::IsValidUserID(TextView Username, TextView ProductID) {
  return ResultAsItStood(false, [&](bool& valid) {
    valid = BooleanFromText(AskForText(
        u"ValidUserID", u"ValidUserID",
        {{u"UserName", EnCodeString(Username)}, {u"ProductID", Text(ProductID)}}, 0, u"ValidUser", u"FALSE"));
  });
}

Text CFileUpload::GetKeyForUser(TextView ProductID, TextView Username) {
  return ResultAsItStood(Text(), [&](Text& key) {
    key = AskForText(u"UserKeyRequest", u"GetMeKey",
                     {{u"UserName", EnCodeString(Username)}, {u"ProductID", Text(ProductID)}}, 1, u"GetKey",
                     kFailureText);
  });
}

std::int32_t CFileUpload::EmailKeyToUser(TextView ProductID, TextView Username, std::int32_t blnNewUser) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& number) {
    number = AskForNumber(u"EmailKeyRequest", u"SendMeMail",
                          {{u"UserName", EnCodeString(Username)},
                           {u"ProductID", Text(ProductID)},
                           {u"NewUser", TextFromNumber(blnNewUser)}},
                          1, u"SendMail", status::kFailure);
  });
}

std::int32_t CFileUpload::ManagePassword(TextView szProductID, TextView szUserName, TextView szPassword,
                                         TextView szNewPassword) {
  return ResultAsItStood(status::kFailure, [&](std::int32_t& result) {
    const std::int32_t answer = AskForNumber(u"UpdatePasswordObject", u"ManagePassword",
                                             {{u"Username", EnCodeString(szUserName)},
                                              {u"ProductID", Text(szProductID)},
                                              {u"Password", Encipher(szPassword)},
                                              {u"NewPassword", Encipher(szNewPassword)}},
                                             1, u"UpdatePassword", status::kFailure);
    if (answer == status::kSuccess) result = answer;
  });
}

Text CFileUpload::ActivateAccount(TextView szProductID, TextView szUserName, TextView szPassword) {
  return ResultAsItStood(Text(), [&](Text& result) {
    const Text mguid = AskForText(u"ActivateAccount", u"ReRegister",
                                  {{u"ProductID", Text(szProductID)},
                                   {u"Username", EnCodeString(szUserName)},
                                   {u"Password", EnCodeString(szPassword)}},
                                  1, u"MGUID", kFailureText);
    result = mguid.empty() ? TextFromNumber(status::kNegative) : mguid;
  });
}

std::int32_t CFileUpload::GetHardLimit(TextView szProductID) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& number) {
    number = AskForNumber(u"HardLimitRequest", u"HardLimit", {{u"ProductID", Text(szProductID)}}, 1,
                          u"HardLimit", 0);
  });
}

std::int32_t CFileUpload::GetSoftLimit(TextView szProductID) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& number) {
    number = AskForNumber(u"SoftLimitRequest", u"SoftLimit", {{u"ProductID", Text(szProductID)}}, 1,
                          u"SoftLimit", 0);
  });
}

Text CFileUpload::GetMGUIDForUser(TextView szProductID, TextView szUserName) {
  return ResultAsItStood(Text(), [&](Text& mguid) {
    mguid = AskForText(u"MGUIDRequest", u"GetMGUIDForUser",
                       {{u"ProductID", Text(szProductID)}, {u"UserName", EnCodeString(szUserName)}}, 1,
                       u"MGUID", kFailureText);
  });
}

Text CFileUpload::GetCreationDateForMGUID(TextView szProductID, TextView szUserName) {
  return ResultAsItStood(Text(), [&](Text& date) {
    date = AskForText(u"CreationDateRequest", u"GetCreationDateForMGUID",
                      {{u"ProductID", Text(szProductID)}, {u"UserName", EnCodeString(szUserName)}}, 1,
                      u"CreationDate", kFailureText);
  });
}

Text CFileUpload::GetCurrentDateTimeFromServer() {
  return ResultAsItStood(Text(), [&](Text& date) {
    date = AskForText(u"CurrentDateRequest", u"GetCurrentDateTimeFromServer", {}, 1, u"CurrentDate",
                      kFailureText);
  });
}

std::int32_t CFileUpload::GetAccountDetailsForMGUID(TextView MGUID, TextView Username, TextView ProductID,
                                                    const AccountSink& col) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& result) {
    const Reply reply = Ask(u"AccountDetails", u"BVAccountDetails",
                            {{u"ProductID", Text(ProductID)},
                             {u"MGUID", EnCodeString(MGUID)},
                             {u"Username", EnCodeString(Username)}},
                            1);
    if (reply.ErrorOccured() == 1) {
      result = status::kFailure;
      return;
    }
    auto account = std::make_shared<CBVAccount>();
    account->EmailAddress = reply.First(u"EmailAddress");
    account->ExpiryPeriod = NumberFromText(reply.First(u"ExpiryPeriod"));
    account->StartDate = reply.First(u"StartDate");
    account->CurrentDate = reply.First(u"CurrentDate");
    account->UsedQuota = reply.First(u"UsedQuota");
    account->Quota = reply.First(u"Quota");
    account->ServiceLevelName = reply.First(u"ServiceLevelName");
    col(account);
    result = status::kSuccess;
  });
}

std::int32_t CFileUpload::HasUserAccountExpired(TextView Username) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& number) {
    number = AskForNumber(u"HasUserExpired", u"HasUserExpired", {{u"UserName", Text(Username)}}, 1,
                          u"HasUserExpired", status::kFailure);
  });
}

std::int32_t CFileUpload::GetPremiumBaseAccountSize(TextView Username) {
  return ResultAsItStood(std::int32_t{0}, [&](std::int32_t& number) {
    number = AskForNumber(u"PremiumAccountSize", u"PremiumAccountSize", {{u"UserName", Text(Username)}}, 1,
                          u"PremiumAccountSize", status::kFailure);
  });
}

}  // namespace tarnwick
