// Why a page of the server, or the upload to one, did not do what it was asked to, in the words of
// m_strLastErrorDesc.
#pragma once

#include <cstdint>

#include "base/Text.h"

namespace tarnwick {

// An FtpErrors value and its text.
struct Failure {
  std::int32_t ftpError = 0;
  Text description;
};

// Puts the number that the page or the component gave behind the words, in brackets.
Failure NumberedFailure(std::int32_t ftpError, TextView words, std::int32_t number);

// What an acceptor number means. The page tells a name that is not allowed and one that another file has by
// one number; `nameTaken` is whether it is the latter.
Failure PageFailure(std::int32_t number, bool nameTaken);

}  // namespace tarnwick
