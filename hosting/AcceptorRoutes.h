// The acceptor pages, which put, move and remove the files and folders of one account.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "hosting/Exchange.h"
#include "hosting/Multipart.h"
#include "hosting/Options.h"
#include "hosting/Store.h"
#include "service/Reply.h"

namespace tarnwick::hosting {

// The number that a page answers, 0 for success; nullopt: the request is malformed.
using ErrorNumber = std::optional<std::int32_t>;

class AcceptorRoutes {
 public:
  // Both must outlive the object.
  AcceptorRoutes(Store& store, const Options& options) : store_(store), options_(options) {}

  static bool IsUpload(std::string_view page) { return page == "UploadAcceptor.asp"; }
  // A page that takes a form.
  static bool IsForm(std::string_view page);

  // Carries out what a form page was sent.
  ErrorNumber Answer(std::string_view page, const Reply& form, LogNote& note);

 private:
  friend class UploadRequest;
  std::optional<Account> Admit(std::string_view user, std::string_view password, std::string_view product,
                               LogNote& note);

  Store& store_;
  const Options& options_;
};

// One upload, taken as it arrives: the fields first, then the bytes, which go straight to the disk.
class UploadRequest {
 public:
  UploadRequest(AcceptorRoutes& routes, std::string_view contentType, LogNote& note);

  // Takes the next bytes of the body. False when they are malformed; the rest need not come.
  bool Take(std::string_view bytes);

  // After the last byte. Failures of disk or database throw.
  ErrorNumber Finish();

 private:
  bool BeginPart(const MultipartReader::Part& part);
  bool TakeContent(std::string_view bytes);

  AcceptorRoutes& routes_;
  LogNote& note_;
  std::optional<MultipartReader> reader_;
  std::vector<std::string> fields_;
  std::string fileName_;
  bool hasFile_ = false;
  std::int32_t refusal_ = 0;
  std::uint64_t room_ = 0;
  std::optional<Account> account_;
  std::unique_ptr<TemporaryFile> bytes_;
};

}  // namespace tarnwick::hosting
