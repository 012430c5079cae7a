#include "hosting/ServicePage.h"

#include <algorithm>
#include <ctime>
#include <limits>
#include <map>

#include "hosting/Names.h"
#include "service/modEnctyption.h"
#include "support/RuntimeError.h"

namespace tarnwick::hosting {
namespace {

constexpr std::string_view kSuccess = "1001";
constexpr std::string_view kNegative = "1002";
constexpr std::string_view kExists = "1003";
constexpr std::string_view kFailed = "1004";
constexpr std::string_view kLimitReached = "1011";
constexpr std::string_view kRenameRefused = "1033";
constexpr std::int64_t kSecondsOfDay = 86400;

// Ends the action with the answer to an unknown user.
struct UnknownUser {};

std::string BooleanText(bool value) {
  return value ? "TRUE" : "FALSE";
}

std::string DateText(std::int64_t seconds) {
  const std::time_t time = seconds;
  std::tm local{};
  localtime_r(&time, &local);
  const auto twoDigits = [](int number) { return (number < 10 ? "0" : "") + std::to_string(number); };
  const int hour = local.tm_hour % 12 == 0 ? 12 : local.tm_hour % 12;
  return std::to_string(local.tm_mon + 1) + '/' + std::to_string(local.tm_mday) + '/' +
         std::to_string(local.tm_year + 1900) + ' ' + std::to_string(hour) + ':' + twoDigits(local.tm_min) +
         ':' + twoDigits(local.tm_sec) + (local.tm_hour < 12 ? " AM" : " PM");
}

std::int64_t Now() {
  return std::time(nullptr);
}

}  // namespace

struct ServicePage::Call {
  const Reply& form;
  const std::string& hostName;
  LogNote& note;

  // A parameter in UTF-8. Throws RuntimeError when the request lacks it.
  std::string Value(TextView name) const { return Utf8FromText(form.First(name)); }

  // A user name. None holds a blank; some requests carry names unescaped, and a form turns "+" into a blank.
  std::string User(TextView name) const {
    note.user = Utf8FromText(ReplaceAll(form.First(name), u" ", u"+"));
    return note.user;
  }

  // A parameter that was sent enciphered, without what the cipher drops.
  std::string Deciphered(TextView name) const { return Utf8FromText(EncryptParameter(form.First(name))); }

  std::int64_t Product() const { return static_cast<std::int64_t>(LeadingNumber(form.First(u"ProductID"))); }

  // An answer of one variable that may be printed.
  FormBody Result(std::string_view name, std::string_view value) const {
    note.result = value;
    return {name, value};
  }
};

ServicePage::Action ServicePage::Find(const std::string& action) {
  static const std::map<std::string_view, Action> actions = {
      {"EstablishConnection", &ServicePage::EstablishConnection},
      {"UserValidate", &ServicePage::UserValidate},
      {"PathFromRoot", &ServicePage::PathFromRoot},
      {"RenameFile", &ServicePage::RenameFile},
      {"FileUpload", &ServicePage::FileUpload},
      {"GetMaxUserQuota", &ServicePage::GetMaxUserQuota},
      {"GetTotalUsedQuota", &ServicePage::GetTotalUsedQuota},
      {"CanUploadFile", &ServicePage::CanUploadFile},
      {"DeleteFile", &ServicePage::DeleteFile},
      {"ListFiles", &ServicePage::ListFiles},
      {"GetMeKey", &ServicePage::GetMeKey},
      {"AddUser", &ServicePage::AddUser},
      {"DeleteUser", &ServicePage::DeleteUser},
      {"ValidUserID", &ServicePage::ValidUserID},
      {"SendMeMail", &ServicePage::SendMeMail},
      {"HardLimit", &ServicePage::HardLimit},
      {"SoftLimit", &ServicePage::SoftLimit},
      {"GetMGUIDForUser", &ServicePage::GetMGUIDForUser},
      {"GetCreationDateForMGUID", &ServicePage::GetCreationDateForMGUID},
      {"GetCurrentDateTimeFromServer", &ServicePage::GetCurrentDateTimeFromServer},
      {"ManagePassword", &ServicePage::ManagePassword},
      {"ReRegister", &ServicePage::ReRegister},
      {"BVAccountDetails", &ServicePage::BVAccountDetails},
      {"HasUserExpired", &ServicePage::HasUserExpired},
      {"PremiumAccountSize", &ServicePage::PremiumAccountSize},
  };
  const auto found = actions.find(action);
  return found == actions.end() ? nullptr : found->second;
}

std::string ServicePage::ActionOf(const Reply& form) {
  const auto* values = form.ErrorOccured() == 1 ? nullptr : form.GetValueByVariableName(u"ClientAction");
  if (!values || values->empty()) return {};
  const std::string action = Utf8FromText(EncryptParameter(values->front()));
  return Find(action) ? action : std::string();
}

FormBody ServicePage::Answer(const std::string& action, const Reply& form, const std::string& hostName,
                             LogNote& note) {
  const Action found = form.ErrorOccured() == 1 ? nullptr : Find(action);
  note.action = found ? action : "unknown";
  note.result = "error";
  if (!found) return Error();
  try {
    note.result = "ok";
    return (this->*found)(Call{form, hostName, note});
  } catch (const UnknownUser&) {
    note.result = "unknown-user";
  } catch (const RuntimeError&) {
    note.result = "malformed";
  }
  return Error();
}

FormBody ServicePage::EstablishConnection(const Call& call) {
  return call.Result("EstablishConnection", "TRUE");
}

FormBody ServicePage::UserValidate(const Call& call) {
  const std::string user = call.Deciphered(u"UserName");
  const std::string password = call.Deciphered(u"Password");
  const std::int64_t product = call.Product();
  call.note.user = user;
  const auto account = store_.FindByStrippedName(user);
  const bool fits = account && (account->product == 0 || account->product == product);
  return call.Result("UserAuthenticationStatus", BooleanText(fits && Strip(account->password) == password));
}

FormBody ServicePage::PathFromRoot(const Call& call) {
  return {"PathFromRoot", "/users/" + Known(call, u"Username").folder};
}

FormBody ServicePage::RenameFile(const Call& call) {
  const Account account = Known(call, u"Username");
  const Change change = store_.RenameFile(account, call.Value(u"OldFileName"), call.Value(u"NewFileName"));
  const bool isRenamed = change == Change::kDone || change == Change::kUnchanged;
  return call.Result("lRenameFileStatus", isRenamed ? kSuccess : kRenameRefused);
}

FormBody ServicePage::FileUpload(const Call& call) {
  const Account account = Known(call, u"Username");
  call.Value(u"FileSize");
  return {"FileURL", FileUrl(call, account, call.Value(u"FileName"))};
}

FormBody ServicePage::GetMaxUserQuota(const Call& call) {
  Known(call, u"UserName");
  return call.Result("MaxUserQuota", std::to_string(options_.quota));
}

FormBody ServicePage::GetTotalUsedQuota(const Call& call) {
  return call.Result("UsedQuota", std::to_string(store_.UsedBytes(Known(call, u"UserName"))));
}

FormBody ServicePage::CanUploadFile(const Call& call) {
  const Account account = Known(call, u"UserName");
  if (HasExpired(account)) return call.Result("CanUploadFile", kFailed);
  return call.Result("CanUploadFile", store_.UsedBytes(account) < options_.quota ? kSuccess : kNegative);
}

FormBody ServicePage::DeleteFile(const Call& call) {
  const Account account = Known(call, u"Username");
  const std::string name = call.Value(u"FileToBeDeleted");
  const bool isGone =
      store_.DeleteFile(account, name, false) == Change::kDone || store_.WasDeleted(account, name);
  return call.Result("DeleteStatus", BooleanText(isGone));
}

FormBody ServicePage::ListFiles(const Call& call) {
  const Account account = Known(call, u"Username");
  std::vector<std::string> names;
  std::vector<std::string> urls;
  std::vector<std::string> sizes;
  std::vector<std::string> dates;
  for (const StoredFile& file : store_.List(account)) {
    names.push_back(file.name);
    urls.push_back(FileUrl(call, account, file.name));
    sizes.push_back(std::to_string(file.size));
    dates.push_back(DateText(file.date));
  }
  call.note.result = std::to_string(names.size()) + "-files";
  FormBody answer;
  answer.Add("FileName", std::move(names)).Add("FileURL", std::move(urls));
  answer.Add("FileSize", std::move(sizes)).Add("FileDate", std::move(dates));
  return answer;
}

FormBody ServicePage::GetMeKey(const Call& call) {
  return {"GetKey", Known(call, u"UserName").password};
}

FormBody ServicePage::AddUser(const Call& call) {
  const std::string user = call.User(u"UserName");
  call.Value(u"MGUID");
  std::optional<Account> account;
  switch (store_.AddAccount(user, call.Product(), options_.hardLimit, account)) {
    case Addition::kTaken:
      return call.Result("AddUser", kExists);
    case Addition::kRefused:
      return call.Result("AddUser", kFailed);
    case Addition::kLimitReached:
      return call.Result("AddUser", kLimitReached);
    case Addition::kDone:
      break;
  }
  FormBody answer = call.Result("AddUser", kSuccess);
  answer.Add("BasePath", "\\users").Add("UserFolder", account->folder);
  answer.Add("Password", account->password).Add("MGUID", account->mguid);
  return answer;
}

FormBody ServicePage::DeleteUser(const Call& call) {
  const auto account = store_.FindByName(call.User(u"UserName"));
  if (!account || account->password != call.Value(u"Password")) return call.Result("DeleteUser", kNegative);
  store_.RemoveAccount(*account);
  return call.Result("DeleteUser", kSuccess);
}

FormBody ServicePage::ValidUserID(const Call& call) {
  return call.Result("ValidUser", BooleanText(store_.FindByName(call.User(u"UserName")).has_value()));
}

FormBody ServicePage::SendMeMail(const Call& call) {
  const auto account = store_.FindByName(call.User(u"UserName"));
  const bool isNew = NumberFromText(call.form.First(u"NewUser")) != 0;
  if (!account) return call.Result("SendMail", kNegative);
  store_.SendMail(
      account->name, isNew ? "Your new account" : "Your key",
      (isNew ? "Welcome. The key of your new account is\n\n    " : "You asked for your key. It is\n\n    ") +
          account->password + "\n");
  return call.Result("SendMail", kSuccess);
}

FormBody ServicePage::HardLimit(const Call& call) {
  return call.Result("HardLimit", std::to_string(options_.hardLimit));
}

FormBody ServicePage::SoftLimit(const Call& call) {
  return call.Result("SoftLimit", std::to_string(options_.softLimit));
}

FormBody ServicePage::GetMGUIDForUser(const Call& call) {
  return {"MGUID", Known(call, u"UserName").mguid};
}

FormBody ServicePage::GetCreationDateForMGUID(const Call& call) {
  return call.Result("CreationDate", DateText(Known(call, u"UserName").created));
}

FormBody ServicePage::GetCurrentDateTimeFromServer(const Call& call) {
  return call.Result("CurrentDate", DateText(Now()));
}

FormBody ServicePage::ManagePassword(const Call& call) {
  const auto account = store_.FindByStrippedName(Strip(call.User(u"Username")));
  const std::string password = call.Deciphered(u"Password");
  const std::string newPassword = call.Deciphered(u"NewPassword");
  // Nobody could log on with an empty password, and everybody could who sends none.
  if (!account || Strip(account->password) != password || newPassword.empty())
    return call.Result("UpdatePassword", kNegative);
  store_.SetPassword(*account, newPassword);
  return call.Result("UpdatePassword", kSuccess);
}

FormBody ServicePage::ReRegister(const Call& call) {
  const auto account = store_.FindByName(call.User(u"Username"));
  if (!account || account->password != call.Value(u"Password")) {
    call.note.result = "refused";
    return {"MGUID", ""};
  }
  store_.Restart(*account);
  return {"MGUID", account->mguid};
}

FormBody ServicePage::BVAccountDetails(const Call& call) {
  const auto account = store_.FindByMguid(call.Value(u"MGUID"));
  if (!account || account->name != call.User(u"Username")) throw UnknownUser{};
  FormBody answer("EmailAddress", account->name);
  answer.Add("ExpiryPeriod", std::to_string(options_.expireDays))
      .Add("StartDate", DateText(account->started));
  answer.Add("CurrentDate", DateText(Now())).Add("UsedQuota", std::to_string(store_.UsedBytes(*account)));
  answer.Add("Quota", std::to_string(options_.quota)).Add("ServiceLevelName", "Standard");
  return answer;
}

FormBody ServicePage::HasUserExpired(const Call& call) {
  return call.Result("HasUserExpired", HasExpired(Known(call, u"UserName")) ? kNegative : kSuccess);
}

FormBody ServicePage::PremiumAccountSize(const Call& call) {
  Known(call, u"UserName");
  // Clients read a 32-bit number.
  constexpr std::uint64_t kMost = std::numeric_limits<std::int32_t>::max();
  return call.Result("PremiumAccountSize", std::to_string(std::min(options_.quota, kMost)));
}

Account ServicePage::Known(const Call& call, TextView parameter) {
  auto account = store_.FindByName(call.User(parameter));
  if (!account) throw UnknownUser{};
  return *std::move(account);
}

bool ServicePage::HasExpired(const Account& account) const {
  return Now() >= account.started + options_.expireDays * kSecondsOfDay;
}

std::string ServicePage::FileUrl(const Call& call, const Account& account, std::string_view name) const {
  return std::string("http://")
      .append(call.hostName)
      .append("/users/")
      .append(account.folder)
      .append("/")
      .append(name);
}

}  // namespace tarnwick::hosting
