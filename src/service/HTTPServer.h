// The request component: carries one request to the service page and reads its reply, and calls the acceptor
// pages for folders.
//
// Wire form of an exchange: an HTTP POST to PATH/PAGE?Request=NAME&Flag=FLAG whose body is name=value joined
// by "&", in the order of adding. Values come escaped or enciphered, so the only further escape is %XX
// (upper-case hex) for each byte of the UTF-8 form outside 0x21 to 0x7E.
#pragma once

#include <cstdint>
#include <utility>
#include <vector>

#include "base/Secret.h"
#include "base/Text.h"
#include "transfer/Reply.h"

namespace tarnwick {

class HttpTransport;

// A request that is being composed.
struct Request {
  Text name;
  Text page;
  // Some of the values are passwords, so all are wiped.
  std::vector<std::pair<Text, Secret>> parameters;
};

class HTTPServer {
 public:
  // `http` outlives the object.
  explicit HTTPServer(HttpTransport& http) : http_(http) {}

  // A new request without parameters, addressed to `page`.
  static Request CreateXLLDFRequest(TextView requestName, TextView page);

  static void AddParameter(Request& request, TextView name, TextView value);

  // Sends the request. `url` is the server's followed by the folder of the page. Never throws for what the
  // network does: a failed exchange, which one without a server is too, is a reply whose ErrorOccured is 1.
  Reply SendRequest(const Request& request, TextView url, std::int32_t sendFlag);

  // Asks the acceptor page for `action` on `folder` (a bare name). Throws a run-time error with the page's
  // error number, see PostAcceptorForm.
  void FolderActionWithEvents(TextView usersBaseUrl, TextView folder, TextView acceptorPath,
                              std::int32_t action, TextView user, TextView password, TextView productGuid);

 private:
  HttpTransport& http_;
};

}  // namespace tarnwick
