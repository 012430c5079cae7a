#include "hosting/ServicePage.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <ctime>
#include <limits>
#include <map>

#include "base/RuntimeError.h"
#include "hosting/Names.h"
#include "service/modEnctyption.h"

namespace tarnwick::hosting {
namespace {

constexpr std::string_view kSuccess = "1001";
constexpr std::string_view kNegative = "1002";
constexpr std::string_view kExists = "1003";
constexpr std::string_view kFailed = "1004";
constexpr std::string_view kLimitReached = "1011";
constexpr std::string_view kRenameRefused = "1033";

// Ends an action with the answer to an unknown user.
struct UnknownUser {};

std::string BooleanText(bool value) {
  return value ? "TRUE" : "FALSE";
}

std::string DateText(std::int64_t seconds) {
  const std::time_t time = seconds;
  std::tm local{};
  localtime_r(&time, &local);
  std::array<char, 96> text{};
  std::snprintf(text.data(), text.size(), "%d/%d/%d %d:%02d:%02d %s", local.tm_mon + 1, local.tm_mday,
                local.tm_year + 1900, local.tm_hour % 12 == 0 ? 12 : local.tm_hour % 12, local.tm_min,
                local.tm_sec, local.tm_hour < 12 ? "AM" : "PM");
  return text.data();
}

std::int64_t Now() {
  return std::time(nullptr);
}

struct Call {
  Store& store;
  const Options& options;
  const Reply& form;
  const std::string& server;
  LogNote& note;

  // A parameter in UTF-8. Throws RuntimeError when the request lacks it.
  std::string Value(TextView name) const { return Utf8FromText(form.First(name)); }

  // A user name. None holds a blank; some requests carry names unescaped, and a form turns "+" into a blank.
  std::string User(TextView name) const {
    return note.user = Utf8FromText(ReplaceAll(form.First(name), u" ", u"+"));
  }

  // The account of a user name.
  Account Known(TextView name) const {
    auto account = store.FindByName(User(name));
    if (!account) throw UnknownUser{};
    return *std::move(account);
  }

  // A parameter that was sent enciphered, without what the cipher drops.
  std::string Deciphered(TextView name) const { return Utf8FromText(EncryptParameter(form.First(name))); }

  std::int64_t Product() const { return NumberFromText(form.First(u"ProductID")); }

  std::string FileUrl(const Account& account, const std::string& name) const {
    return server + "/users/" + account.folder + "/" + name;
  }

  bool HasExpired(const Account& account) const {
    constexpr std::int64_t kSecondsOfDay = 86400;
    return Now() >= account.started + options.expireDays * kSecondsOfDay;
  }

  // An answer of one variable that may be printed.
  FormBody Result(std::string_view name, std::string_view value) const {
    note.result = value;
    return {name, value};
  }
};

// Every other action needs the number of the host's product.
bool NeedsNoProduct(std::string_view action) {
  return action == "EstablishConnection" || action == "GetCurrentDateTimeFromServer" ||
         action == "HasUserExpired" || action == "PremiumAccountSize";
}

FormBody UserValidate(const Call& call) {
  const std::string user = call.note.user = call.Deciphered(u"UserName");
  const std::string password = call.Deciphered(u"Password");
  const std::int64_t product = call.Product();
  const auto account = call.store.FindByStrippedName(user);
  const bool fits = account && (account->product == 0 || account->product == product);
  return call.Result("UserAuthenticationStatus", BooleanText(fits && Strip(account->password) == password));
}

FormBody RenameFile(const Call& call) {
  const Account account = call.Known(u"Username");
  const Change change =
      call.store.RenameFile(account, call.Value(u"OldFileName"), call.Value(u"NewFileName"));
  const bool isRenamed = change == Change::kDone || change == Change::kUnchanged;
  return call.Result("lRenameFileStatus", isRenamed ? kSuccess : kRenameRefused);
}

FormBody FileUpload(const Call& call) {
  const Account account = call.Known(u"Username");
  call.Value(u"FileSize");
  return {"FileURL", call.FileUrl(account, call.Value(u"FileName"))};
}

FormBody CanUploadFile(const Call& call) {
  const Account account = call.Known(u"UserName");
  if (call.HasExpired(account)) return call.Result("CanUploadFile", kFailed);
  return call.Result("CanUploadFile",
                     call.store.UsedBytes(account) < call.options.quota ? kSuccess : kNegative);
}

FormBody DeleteFile(const Call& call) {
  const Account account = call.Known(u"Username");
  const std::string name = call.Value(u"FileToBeDeleted");
  const bool isGone =
      call.store.DeleteFile(account, name, false) == Change::kDone || call.store.WasDeleted(account, name);
  return call.Result("DeleteStatus", BooleanText(isGone));
}

FormBody ListFiles(const Call& call) {
  const Account account = call.Known(u"Username");
  std::vector<std::string> names;
  std::vector<std::string> urls;
  std::vector<std::string> sizes;
  std::vector<std::string> dates;
  for (const StoredFile& file : call.store.List(account)) {
    names.push_back(file.name);
    urls.push_back(call.FileUrl(account, file.name));
    sizes.push_back(std::to_string(file.size));
    dates.push_back(DateText(file.date));
  }
  call.note.result = std::to_string(names.size()) + "-files";
  FormBody answer;
  answer.Add("FileName", std::move(names)).Add("FileURL", std::move(urls));
  answer.Add("FileSize", std::move(sizes)).Add("FileDate", std::move(dates));
  return answer;
}

FormBody AddUser(const Call& call) {
  const std::string user = call.note.user = call.Value(u"UserName");  // escaped: a blank is none of ours
  call.Value(u"MGUID");
  std::optional<Account> account;
  switch (call.store.AddAccount(user, call.Product(), call.options.hardLimit, account)) {
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

FormBody DeleteUser(const Call& call) {
  const auto account = call.store.FindByName(call.User(u"UserName"));
  const std::string password = call.Value(u"Password");
  if (!account || account->password != password) return call.Result("DeleteUser", kNegative);
  call.store.RemoveAccount(*account);
  return call.Result("DeleteUser", kSuccess);
}

FormBody SendMeMail(const Call& call) {
  const auto account = call.store.FindByName(call.User(u"UserName"));
  const bool isNew = NumberFromText(call.form.First(u"NewUser")) != 0;
  if (!account) return call.Result("SendMail", kNegative);
  call.store.SendMail(
      account->name, isNew ? "Your new account" : "Your key",
      (isNew ? "Welcome. The key of your new account is\n\n    " : "You asked for your key. It is\n\n    ") +
          account->password + "\n");
  return call.Result("SendMail", kSuccess);
}

FormBody ManagePassword(const Call& call) {
  const auto account = call.store.FindByStrippedName(Strip(call.User(u"Username")));
  const std::string password = call.Deciphered(u"Password");
  const std::string newPassword = call.Deciphered(u"NewPassword");
  // Nobody could log on with an empty password, and everybody could who sends none.
  if (!account || Strip(account->password) != password || newPassword.empty())
    return call.Result("UpdatePassword", kNegative);
  call.store.SetPassword(*account, newPassword);
  return call.Result("UpdatePassword", kSuccess);
}

FormBody ReRegister(const Call& call) {
  const auto account = call.store.FindByName(call.User(u"Username"));
  const std::string password = call.Value(u"Password");
  if (!account || account->password != password) {
    call.note.result = "refused";
    return {"MGUID", ""};
  }
  call.store.Restart(*account);
  return {"MGUID", account->mguid};
}

FormBody BVAccountDetails(const Call& call) {
  const auto account = call.store.FindByMguid(call.Value(u"MGUID"));
  const std::string user = call.User(u"Username");
  if (!account || account->name != user) throw UnknownUser{};
  FormBody answer("EmailAddress", account->name);
  answer.Add("ExpiryPeriod", std::to_string(call.options.expireDays));
  answer.Add("StartDate", DateText(account->started)).Add("CurrentDate", DateText(Now()));
  answer.Add("UsedQuota", std::to_string(call.store.UsedBytes(*account)));
  answer.Add("Quota", std::to_string(call.options.quota)).Add("ServiceLevelName", "Standard");
  return answer;
}

FormBody PremiumAccountSize(const Call& call) {
  call.Known(u"UserName");
  // Clients read a 32-bit number.
  constexpr std::uint64_t kMost = std::numeric_limits<std::int32_t>::max();
  return call.Result("PremiumAccountSize", std::to_string(std::min(call.options.quota, kMost)));
}

using Action = FormBody (*)(const Call&);

Action Find(const std::string& action) {
  static const std::map<std::string_view, Action> actions = {
      {"EstablishConnection", [](const Call& call) { return call.Result("EstablishConnection", "TRUE"); }},
      {"UserValidate", UserValidate},
      {"PathFromRoot",
       [](const Call& call) { return FormBody("PathFromRoot", "/users/" + call.Known(u"Username").folder); }},
      {"RenameFile", RenameFile},
      {"FileUpload", FileUpload},
      {"GetMaxUserQuota",
       [](const Call& call) {
         call.Known(u"UserName");
         return call.Result("MaxUserQuota", std::to_string(call.options.quota));
       }},
      {"GetTotalUsedQuota",
       [](const Call& call) {
         return call.Result("UsedQuota", std::to_string(call.store.UsedBytes(call.Known(u"UserName"))));
       }},
      {"CanUploadFile", CanUploadFile},
      {"DeleteFile", DeleteFile},
      {"ListFiles", ListFiles},
      {"GetMeKey", [](const Call& call) { return FormBody("GetKey", call.Known(u"UserName").password); }},
      {"AddUser", AddUser},
      {"DeleteUser", DeleteUser},
      {"ValidUserID",
       [](const Call& call) {
         const bool isThere = call.store.FindByName(call.User(u"UserName")).has_value();
         return call.Result("ValidUser", BooleanText(isThere));
       }},
      {"SendMeMail", SendMeMail},
      {"HardLimit",
       [](const Call& call) { return call.Result("HardLimit", std::to_string(call.options.hardLimit)); }},
      {"SoftLimit",
       [](const Call& call) { return call.Result("SoftLimit", std::to_string(call.options.softLimit)); }},
      {"GetMGUIDForUser", [](const Call& call) { return FormBody("MGUID", call.Known(u"UserName").mguid); }},
      {"GetCreationDateForMGUID",
       [](const Call& call) {
         return call.Result("CreationDate", DateText(call.Known(u"UserName").created));
       }},
      {"GetCurrentDateTimeFromServer",
       [](const Call& call) { return call.Result("CurrentDate", DateText(Now())); }},
      {"ManagePassword", ManagePassword},
      {"ReRegister", ReRegister},
      {"BVAccountDetails", BVAccountDetails},
      {"HasUserExpired",
       [](const Call& call) {
         return call.Result("HasUserExpired",
                            call.HasExpired(call.Known(u"UserName")) ? kNegative : kSuccess);
       }},
      {"PremiumAccountSize", PremiumAccountSize},
  };
  const auto found = actions.find(action);
  return found == actions.end() ? nullptr : found->second;
}

}  // namespace

std::string ServicePage::ActionOf(const Reply& form) {
  const auto* values = form.ErrorOccured() == 1 ? nullptr : form.GetValueByVariableName(u"ClientAction");
  if (!values || values->empty()) return {};
  const std::string action = Utf8FromText(EncryptParameter(form.First(u"ClientAction")));
  return Find(action) ? action : std::string();
}

FormBody ServicePage::Answer(const std::string& action, const Reply& form, const std::string& server,
                             LogNote& note) const {
  const Action found = Find(action);
  note.action = found ? action : "unknown";
  note.result = found ? "ok" : "error";
  try {
    if (found) {
      const Call call{store_, options_, form, server, note};
      if (!NeedsNoProduct(action)) call.Value(u"ProductID");
      return found(call);
    }
  } catch (const UnknownUser&) {
    note.result = "unknown-user";
  } catch (const RuntimeError&) {
    note.result = "malformed";
  }
  return {"ErrorOccured", "1"};
}

}  // namespace tarnwick::hosting
