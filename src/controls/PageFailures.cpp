#include "controls/PageFailures.h"

#include "transfer/AcceptorPages.h"
#include "transfer/FtpErrors.h"

namespace tarnwick {

Failure NumberedFailure(std::int32_t ftpError, TextView words, std::int32_t number) {
  return {ftpError, Text(words) + u" (" + TextFromNumber(number) + u")"};
}

Failure PageFailure(std::int32_t number, bool nameTaken) {
  switch (number) {
    case acceptor::kUnspecified:
      return NumberedFailure(ftp_error::kConnectionLost,
                             u"The connection was lost, or the server gave no usable answer.", number);
    case acceptor::kRefused:
      return NumberedFailure(ftp_error::kNotLoggedOn, u"The server refused the user name or the password.",
                             number);
    case acceptor::kFolderState:
      return NumberedFailure(ftp_error::kUnavailable, u"The account has no folder on the server.", number);
    case acceptor::kNotThere:
      return NumberedFailure(ftp_error::kUnavailable, u"The file was not found.", number);
    case acceptor::kNameRefused:
      return NumberedFailure(
          ftp_error::kNameNotAllowed,
          nameTaken ? u"The account has a file of that name." : u"The file's name is not allowed.", number);
    default:
      return NumberedFailure(ftp_error::kNotTaken, u"The server refused.", number);
  }
}

}  // namespace tarnwick
