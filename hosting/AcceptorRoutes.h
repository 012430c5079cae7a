// The acceptor pages, which put, move and remove the files and folders of one account.
#pragma once

#include <httplib.h>

#include <cstdint>
#include <optional>
#include <string_view>

#include "hosting/LogNote.h"
#include "hosting/Store.h"
#include "transfer/Reply.h"

namespace tarnwick::hosting {

// The number that a page answers, 0 for success; nullopt: the request is malformed.
using ErrorNumber = std::optional<std::int32_t>;

inline constexpr std::string_view kUploadPage = "UploadAcceptor.asp";

// Whether this is one of the pages that take a form.
bool IsFormPage(std::string_view page);

// Carries out what a form page was sent.
ErrorNumber AnswerFormPage(Store& store, std::string_view page, const Reply& form, LogNote& note);

// Reads an upload to its end, its bytes straight to the disk, and puts them into their place. What is
// malformed is not read to its end.
ErrorNumber TakeUpload(Store& store, std::uint64_t quota, const httplib::Request& request,
                       const httplib::ContentReader& reader, LogNote& note);

}  // namespace tarnwick::hosting
