// The service page: one action for each request, selected by the deciphered ClientAction.
#pragma once

#include <string>

#include "hosting/Exchange.h"
#include "hosting/FormBody.h"
#include "hosting/Options.h"
#include "hosting/Store.h"
#include "service/Reply.h"

namespace tarnwick::hosting {

class ServicePage {
 public:
  // Both must outlive the page.
  ServicePage(Store& store, const Options& options) : store_(store), options_(options) {}

  // The deciphered action word of a request's form; empty when there is none or it is unknown.
  static std::string ActionOf(const Reply& form);

  // Carries the action out. `hostName` goes into file addresses. Failures of disk or database throw.
  FormBody Answer(const std::string& action, const Reply& form, const std::string& hostName, LogNote& note);

  // The answer to a request that is malformed or names an unknown user or action.
  static FormBody Error() { return {"ErrorOccured", "1"}; }

 private:
  struct Call;
  using Action = FormBody (ServicePage::*)(const Call&);
  static Action Find(const std::string& action);

  FormBody EstablishConnection(const Call& call);
  FormBody UserValidate(const Call& call);
  FormBody PathFromRoot(const Call& call);
  FormBody RenameFile(const Call& call);
  FormBody FileUpload(const Call& call);
  FormBody GetMaxUserQuota(const Call& call);
  FormBody GetTotalUsedQuota(const Call& call);
  FormBody CanUploadFile(const Call& call);
  FormBody DeleteFile(const Call& call);
  FormBody ListFiles(const Call& call);
  FormBody GetMeKey(const Call& call);
  FormBody AddUser(const Call& call);
  FormBody DeleteUser(const Call& call);
  FormBody ValidUserID(const Call& call);
  FormBody SendMeMail(const Call& call);
  FormBody HardLimit(const Call& call);
  FormBody SoftLimit(const Call& call);
  FormBody GetMGUIDForUser(const Call& call);
  FormBody GetCreationDateForMGUID(const Call& call);
  FormBody GetCurrentDateTimeFromServer(const Call& call);
  FormBody ManagePassword(const Call& call);
  FormBody ReRegister(const Call& call);
  FormBody BVAccountDetails(const Call& call);
  FormBody HasUserExpired(const Call& call);
  FormBody PremiumAccountSize(const Call& call);

  Account Known(const Call& call, TextView parameter);
  bool HasExpired(const Account& account) const;
  std::string FileUrl(const Call& call, const Account& account, std::string_view name) const;

  Store& store_;
  const Options& options_;
};

}  // namespace tarnwick::hosting
