#include "hosting/AcceptorRoutes.h"

#include <array>
#include <exception>
#include <memory>
#include <string>
#include <vector>

#include "base/RuntimeError.h"
#include "transfer/AcceptorPages.h"

namespace tarnwick::hosting {
namespace {

constexpr std::int32_t kNothingChanged = -2147220891;
constexpr std::int32_t kNameRefused = -2147220881;  // or taken, or the quota exceeded
constexpr std::int32_t kFileNotThere = -2147220880;

// Of an upload. Who may upload is known before the first byte of the file.
constexpr std::array<std::string_view, 6> kUploadFields = {"UsersBaseUrl", "Flag",      "User",
                                                           "Password",     "ProductID", "File"};
constexpr std::size_t kUser = 2;
constexpr std::size_t kPassword = 3;
constexpr std::size_t kProduct = 4;
constexpr std::size_t kFile = 5;
constexpr std::size_t kLongestField = 16 * 1024;

std::int32_t NumberOf(Change change) {
  switch (change) {
    case Change::kDone:
      return 0;
    case Change::kUnchanged:
      return kNothingChanged;
    case Change::kNoAccount:
      return acceptor::kRefused;
    case Change::kFolderState:
      return acceptor::kFolderState;
    case Change::kNameRefused:
      return kNameRefused;
    case Change::kNotThere:
      break;
  }
  return kFileNotThere;
}

std::optional<Account> Admit(Store& store, std::string_view user, std::string_view password,
                             std::string_view product, LogNote& note) {
  note.user = user;
  if (LowerCase(TextFromUtf8(product).value_or(Text())) != LowerCase(kProductGuid)) return std::nullopt;
  auto account = store.FindByName(user);
  if (!account || account->password != password) return std::nullopt;
  return account;
}

// One upload as its parts arrive.
class Upload {
 public:
  Upload(Store& store, std::uint64_t quota, LogNote& note) : store_(store), quota_(quota), note_(note) {}

  // The next part. False when it is not the one that belongs there.
  bool Begin(const httplib::MultipartFormData& part) {
    if (fields_.size() == kUploadFields.size() || part.name != kUploadFields[fields_.size()]) return false;
    fields_.emplace_back();
    if (fields_.size() <= kFile) return true;
    fields_[kFile] = part.filename;
    for (const std::string& field : fields_)
      if (!TextFromUtf8(field)) return false;
    account_ = Admit(store_, fields_[kUser], fields_[kPassword], fields_[kProduct], note_);
    if (account_)
      Keep([&] { bytes_ = store_.BeginUpload(); });
    else
      refusal_ = acceptor::kRefused;
    return true;
  }

  // The next bytes of the part.
  bool Take(std::string_view bytes) {
    if (fields_.size() <= kFile) {
      fields_.back().append(bytes);
      return fields_.back().size() <= kLongestField;
    }
    // What is refused or failed anyway is read to its end, since clients send all before they listen, but not
    // kept.
    if (refusal_ != 0 || failure_) return true;
    if (bytes.size() > quota_ - bytes_->Size()) {
      refusal_ = kNameRefused;
      bytes_.reset();
      return true;
    }
    Keep([&] { bytes_->Append(bytes); });
    return true;
  }

  // After the last byte. Throws what failed on the way.
  ErrorNumber Finish() {
    if (fields_.size() <= kFile) return std::nullopt;
    if (failure_) std::rethrow_exception(failure_);
    if (refusal_ != 0) return refusal_;
    return NumberOf(store_.FinishUpload(*account_, fields_[kFile], quota_, *bytes_));
  }

 private:
  // Runs a step that writes to the disk.
  template <typename Step>
  void Keep(Step step) {
    try {
      step();
    } catch (const std::exception&) {
      failure_ = std::current_exception();
      bytes_.reset();
    }
  }

  Store& store_;
  std::uint64_t quota_;
  LogNote& note_;
  std::vector<std::string> fields_;  // the last one is the name of the file
  std::int32_t refusal_ = 0;
  std::exception_ptr failure_;
  std::optional<Account> account_;
  std::unique_ptr<TemporaryFile> bytes_;
};

}  // namespace

bool IsFormPage(std::string_view page) {
  return page == "DeleteAcceptor.asp" || page == "RenameAcceptor.asp" || page == "CreateFolderAcceptor.asp" ||
         page == "DeleteFolderAcceptor.asp";
}

ErrorNumber AnswerFormPage(Store& store, std::string_view page, const Reply& form, LogNote& note) {
  if (form.ErrorOccured() == 1) return std::nullopt;
  try {
    const auto value = [&](TextView name) { return Utf8FromText(form.First(name)); };
    value(u"UsersBaseUrl");
    const auto account = Admit(store, value(u"User"), value(u"Password"), value(u"ProductID"), note);
    if (page == "DeleteAcceptor.asp") {
      const std::string name = value(u"FileName");
      return account ? NumberOf(store.DeleteFile(*account, name, true)) : acceptor::kRefused;
    }
    if (page == "RenameAcceptor.asp") {
      const std::string oldName = value(u"OldFileName");
      const std::string newName = value(u"NewFileName");
      if (!account) return acceptor::kRefused;
      const Change change = store.RenameFile(*account, oldName, newName);
      return NumberOf(change == Change::kUnchanged ? Change::kNotThere : change);
    }
    const bool creates = page == "CreateFolderAcceptor.asp";
    if (value(u"Action") != (creates ? "5" : "6")) return std::nullopt;
    const std::string folder = value(u"Folder");
    if (!account || folder != account->folder) return acceptor::kRefused;
    return NumberOf(creates ? store.CreateFolder(*account) : store.DeleteFolder(*account));
  } catch (const RuntimeError&) {
    return std::nullopt;  // a field is missing
  }
}

ErrorNumber TakeUpload(Store& store, std::uint64_t quota, const httplib::Request& request,
                       const httplib::ContentReader& reader, LogNote& note) {
  if (!request.is_multipart_form_data()) return std::nullopt;
  Upload upload(store, quota, note);
  const bool isWhole = reader([&](const httplib::MultipartFormData& part) { return upload.Begin(part); },
                              [&](const char* bytes, std::size_t size) {
                                return upload.Take({bytes, size});
                              });
  return isWhole ? upload.Finish() : std::nullopt;
}

}  // namespace tarnwick::hosting
