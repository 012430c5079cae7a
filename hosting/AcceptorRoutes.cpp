#include "hosting/AcceptorRoutes.h"

#include <algorithm>
#include <array>
#include <map>

#include "hosting/Names.h"
#include "support/RuntimeError.h"
#include "transfer/AcceptorPages.h"

namespace tarnwick::hosting {
namespace {

constexpr std::int32_t kNothingChanged = -2147220891;
constexpr std::int32_t kNameRefused = -2147220881;  // or taken, or the quota exceeded
constexpr std::int32_t kFileNotThere = -2147220880;

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

}  // namespace

bool AcceptorRoutes::IsForm(std::string_view page) {
  return page == "DeleteAcceptor.asp" || page == "RenameAcceptor.asp" || page == "CreateFolderAcceptor.asp" ||
         page == "DeleteFolderAcceptor.asp";
}

ErrorNumber AcceptorRoutes::Answer(std::string_view page, const Reply& form, LogNote& note) {
  if (form.ErrorOccured() == 1) return std::nullopt;
  try {
    const auto value = [&](TextView name) { return Utf8FromText(form.First(name)); };
    value(u"UsersBaseUrl");
    const auto account = Admit(value(u"User"), value(u"Password"), value(u"ProductID"), note);
    if (page == "DeleteAcceptor.asp") {
      const std::string name = value(u"FileName");
      return account ? NumberOf(store_.DeleteFile(*account, name, true)) : acceptor::kRefused;
    }
    if (page == "RenameAcceptor.asp") {
      const std::string oldName = value(u"OldFileName");
      const std::string newName = value(u"NewFileName");
      if (!account) return acceptor::kRefused;
      const Change change = store_.RenameFile(*account, oldName, newName);
      return NumberOf(change == Change::kUnchanged ? Change::kNotThere : change);
    }
    const bool creates = page == "CreateFolderAcceptor.asp";
    if (value(u"Action") != (creates ? "5" : "6")) return std::nullopt;
    const std::string folder = value(u"Folder");
    if (!account || folder != account->folder) return acceptor::kRefused;
    return NumberOf(creates ? store_.CreateFolder(*account) : store_.DeleteFolder(*account));
  } catch (const RuntimeError&) {
    return std::nullopt;  // a field is missing
  }
}

std::optional<Account> AcceptorRoutes::Admit(std::string_view user, std::string_view password,
                                             std::string_view product, LogNote& note) {
  note.user = user;
  if (LowerCase(TextFromUtf8(product).value_or(Text())) != LowerCase(kProductGuid)) return std::nullopt;
  auto account = store_.FindByName(user);
  if (!account || account->password != password) return std::nullopt;
  return account;
}

UploadRequest::UploadRequest(AcceptorRoutes& routes, std::string_view contentType, LogNote& note)
    : routes_(routes), note_(note) {
  if (const auto boundary = MultipartReader::BoundaryOf(contentType))
    reader_.emplace(
        *boundary, [this](const MultipartReader::Part& part) { return BeginPart(part); },
        [this](std::string_view bytes) { return TakeContent(bytes); });
}

bool UploadRequest::Take(std::string_view bytes) {
  return reader_ && reader_->Take(bytes);
}

ErrorNumber UploadRequest::Finish() {
  if (!reader_ || !reader_->IsComplete() || !hasFile_) return std::nullopt;
  if (!TextFromUtf8(fileName_)) return std::nullopt;
  if (refusal_ != 0) return refusal_;
  return NumberOf(routes_.store_.FinishUpload(*account_, fileName_, routes_.options_.quota, *bytes_));
}

bool UploadRequest::BeginPart(const MultipartReader::Part& part) {
  // The order is fixed, so that who may upload is known before the first byte of the file.
  if (hasFile_ || part.name != kUploadFields[fields_.size()]) return false;
  if (fields_.size() < kFile) {
    fields_.emplace_back();
    return true;
  }
  if (!part.fileName) return false;
  if (std::any_of(fields_.begin(), fields_.end(),
                  [](const std::string& field) { return !TextFromUtf8(field); }))
    return false;
  hasFile_ = true;
  fileName_ = *part.fileName;
  account_ = routes_.Admit(fields_[kUser], fields_[kPassword], fields_[kProduct], note_);
  if (!account_) {
    refusal_ = acceptor::kRefused;
  } else if (!routes_.store_.HasFolder(*account_)) {
    refusal_ = acceptor::kFolderState;
  } else if (IsRefusedFileName(fileName_)) {
    refusal_ = kNameRefused;
  } else {
    room_ = routes_.store_.RoomFor(*account_, fileName_, routes_.options_.quota);
    bytes_ = routes_.store_.BeginUpload();
  }
  return true;
}

bool UploadRequest::TakeContent(std::string_view bytes) {
  if (!hasFile_) {
    fields_.back().append(bytes);
    return fields_.back().size() <= kLongestField;
  }
  // What is refused anyway is read to its end, since clients send all before they listen, but not kept.
  if (refusal_ != 0) return true;
  if (bytes.size() > room_ - bytes_->Size()) {
    refusal_ = kNameRefused;
    bytes_.reset();
    return true;
  }
  bytes_->Append(bytes);
  return true;
}

}  // namespace tarnwick::hosting
