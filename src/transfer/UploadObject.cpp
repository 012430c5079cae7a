#include "transfer/UploadObject.h"

#include <algorithm>
#include <limits>
#include <memory>
#include <random>
#include <string>

#include "base/RuntimeError.h"
#include "base/Secret.h"
#include "platform/FileSystem.h"
#include "platform/HttpTransport.h"
#include "support/PathHelpers.h"
#include "transfer/AcceptorPages.h"

namespace tarnwick {
namespace {

// New for each upload. The file's bytes are not searched for it, so no file may be made to hold it.
std::string NewBoundary() {
  std::random_device random;
  std::string boundary = "--tarnwick";
  for (int i = 0; i < 4; ++i) boundary.append("-").append(std::to_string(random()));
  return boundary;
}

// Whether the name can stand between quotes in a head. What cannot is refused by the page as well; it is met
// where a path names more than a file (a stream of it, for one).
bool CanBeQuoted(TextView name) {
  return std::none_of(name.begin(), name.end(),
                      [](char16_t unit) { return unit < 0x20 || unit == 0x7F || unit == u'"'; });
}

// The body of an upload: the fields, then the bytes of the file while they are read.
class UploadBody : public BodySource {
 public:
  UploadBody(FileSystem& files, TextView path, UploadEvents& events)
      : length_(files.Length(path)), file_(files.Open(path)), events_(events) {}

  const std::string& Boundary() const { return boundary_; }

  void AddField(std::string_view name, TextView value) {
    AddPartHead(name, {});
    head_.Append(SecretBytes(Utf8FromText(value)));
    head_.Append("\r\n");
  }
  // The last part. The name can be quoted.
  void AddFile(std::string_view name, TextView fileName) {
    AddPartHead(name,
                "; filename=\"" + Utf8FromText(fileName) + "\"\r\nContent-Type: application/octet-stream");
    tail_ = "\r\n--" + boundary_ + "--\r\n";
  }

  std::uint64_t Length() const override { return Head().size() + length_ + tail_.size(); }

  std::size_t Read(std::span<char> room) override {
    std::size_t filled = 0;
    while (filled < room.size()) {
      const std::span<char> rest = room.subspan(filled);
      const std::size_t count = ReadSome(rest);
      if (count == 0) break;
      filled += count;
      position_ += count;
    }
    return filled;
  }

  bool IsWanted() const override {
    if (!events_.IsWanted()) wasUnwanted_ = true;
    return !wasUnwanted_;
  }
  // Whether the transport was told to stop, which it is only while it can.
  bool WasUnwanted() const { return wasUnwanted_; }

  void Sent(std::uint64_t sent) override {
    // Of the file alone: the fields around it are no progress that a user would see.
    const std::uint64_t ofFile = std::min(sent - std::min<std::uint64_t>(sent, Head().size()), length_);
    const auto percent =
        static_cast<std::int32_t>(length_ == 0 ? (sent == 0 ? 0 : 100) : ofFile * 100 / length_);
    if (!started_) events_.UploadStarted();
    started_ = true;
    if (percent <= percent_) return;
    percent_ = percent;
    constexpr std::uint64_t kMost = std::numeric_limits<std::int32_t>::max();
    events_.UploadProgress(percent, static_cast<std::int32_t>(std::min(ofFile, kMost)));
  }

 private:
  void AddPartHead(std::string_view name, std::string_view more) {
    for (const std::string_view part : {std::string_view("--"), std::string_view(boundary_),
                                        std::string_view("\r\nContent-Disposition: form-data; name=\""), name,
                                        std::string_view("\""), more, std::string_view("\r\n\r\n")})
      head_.Append(part);
  }

  std::string_view Head() const { return head_; }

  std::size_t ReadSome(std::span<char> room) {
    const std::uint64_t afterFile = Head().size() + length_;
    if (position_ < Head().size()) return Copy(Head(), position_, room);
    if (position_ >= afterFile) {
      if (position_ == afterFile) ExpectEnd();
      return Copy(tail_, position_ - afterFile, room);
    }
    const std::uint64_t left = afterFile - position_;
    const std::size_t count =
        file_->Read(room.first(static_cast<std::size_t>(std::min<std::uint64_t>(room.size(), left))));
    // The file has become shorter: what was announced cannot be kept.
    if (count == 0) throw RuntimeError(error::kPathAccess);
    events_.FileBytes({room.data(), count});
    return count;
  }

  // The file has become longer: what was sent of it is not all of it.
  void ExpectEnd() {
    char more = 0;
    if (file_->Read({&more, 1}) != 0) throw RuntimeError(error::kPathAccess);
  }

  static std::size_t Copy(std::string_view text, std::uint64_t from, std::span<char> room) {
    return text.copy(room.data(), room.size(), static_cast<std::size_t>(from));
  }

  const std::string boundary_ = NewBoundary();
  SecretBytes head_;
  std::string tail_;
  const std::uint64_t length_;
  const std::unique_ptr<FileReader> file_;
  UploadEvents& events_;
  std::uint64_t position_ = 0;
  std::int32_t percent_ = -1;
  bool started_ = false;
  mutable bool wasUnwanted_ = false;
};

}  // namespace

void UploadObject::UploadFile(TextView localPath, TextView usersBaseUrl, TextView acceptorPath,
                              std::int32_t flag, TextView user, TextView password, TextView productGuid,
                              UploadEvents& events) {
  UploadBody body(platform_.files, localPath, events);
  const TextView fileName = FileNameFromPath(localPath);
  if (!CanBeQuoted(fileName)) throw RuntimeError(acceptor::kNameRefused);
  body.AddField("UsersBaseUrl", usersBaseUrl);
  body.AddField("Flag", TextFromNumber(flag));
  body.AddField("User", user);
  body.AddField("Password", password);
  body.AddField("ProductID", productGuid);
  body.AddFile("File", fileName);

  HttpPost post = AcceptorPost(usersBaseUrl, acceptorPath);
  const std::string contentType = "multipart/form-data; boundary=" + body.Boundary();
  post.contentType = contentType;
  events.Initializing();
  events.Connecting();
  if (!events.IsWanted()) throw RuntimeError(error::kInterrupted);
  const auto answer = platform_.http.PostStream(post, body, kMostAcceptorAnswerBytes);
  if (body.WasUnwanted()) throw RuntimeError(error::kInterrupted);
  events.ServerProcess();
  const std::int32_t number = ErrorNumberOf(answer);
  if (number == 0 || number == acceptor::kNothingChanged) events.UploadComplete();
  events.ActionComplete();
  if (number != 0) throw RuntimeError(number);
}

void UploadObject::DeleteFile(TextView usersBaseUrl, TextView name, TextView acceptorPath, TextView user,
                              TextView password, TextView productGuid) {
  PostAcceptorForm(platform_.http, usersBaseUrl, acceptorPath,
                   {{u"UsersBaseUrl", usersBaseUrl},
                    {u"FileName", name},
                    {u"User", user},
                    {u"Password", password},
                    {u"ProductID", productGuid}});
}

void UploadObject::RenameFile(TextView usersBaseUrl, TextView oldName, TextView newName,
                              TextView acceptorPath, TextView user, TextView password, TextView productGuid) {
  PostAcceptorForm(platform_.http, usersBaseUrl, acceptorPath,
                   {{u"UsersBaseUrl", usersBaseUrl},
                    {u"OldFileName", oldName},
                    {u"NewFileName", newName},
                    {u"User", user},
                    {u"Password", password},
                    {u"ProductID", productGuid}});
}

}  // namespace tarnwick
