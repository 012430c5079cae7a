// The acceptor pages of the hosting server, through which files and folders are put, moved and removed.
#pragma once

#include <initializer_list>
#include <string>
#include <string_view>
#include <utility>

#include "base/Text.h"
#include "platform/HttpTransport.h"

namespace tarnwick {

// Identifies this product to the acceptor pages.
inline constexpr TextView kProductGuid = u"4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E";

// Error numbers of the pages.
namespace acceptor {
inline constexpr std::int32_t kNothingChanged = -2147220891;  // the same bytes were there already
inline constexpr std::int32_t kNameRefused = -2147220881;     // name refused or taken, or quota exceeded
inline constexpr std::int32_t kNotThere = -2147220880;        // the file to delete or rename
inline constexpr std::int32_t kRefused = -2147220878;         // user name, password or product identifier
inline constexpr std::int32_t kFolderState = -2147220840;  // to delete: not there; to create: there already
inline constexpr std::int32_t kUnspecified = -2147467259;  // no usable answer
}  // namespace acceptor

// "http://SERVER/users/" or "https://SERVER/users/", from a server name as the host gave it. For what cannot
// be a server's name it is an address without a server, and so goes nowhere.
Text UsersBaseUrl(TextView server);

// "/httpupload/PAGE".
Text AcceptorPath(TextView page);

struct AcceptorField {
  TextView name;
  TextView value;
};

// A post to the page on the server that `usersBaseUrl` names, without a body. Throws acceptor::kUnspecified
// when the address names none.
HttpPost AcceptorPost(TextView usersBaseUrl, TextView acceptorPath);

// What the page answered: 0 when it succeeded, else its error number; kUnspecified when there is no usable
// answer.
std::int32_t ErrorNumberOf(const std::optional<HttpAnswer>& answer);

// An acceptor page says one number; anything longer than this is no answer of its.
inline constexpr std::size_t kMostAcceptorAnswerBytes = 64 * 1024;

// Posts the fields, in their order, to the page on the server that `usersBaseUrl` names. Returns when the
// page answered that it succeeded; else throws a run-time error with the page's error number, kUnspecified
// when there is no usable answer.
void PostAcceptorForm(HttpTransport& http, TextView usersBaseUrl, TextView acceptorPath,
                      std::initializer_list<AcceptorField> fields);

}  // namespace tarnwick
