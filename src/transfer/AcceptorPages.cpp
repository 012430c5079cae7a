#include "transfer/AcceptorPages.h"

#include "base/RuntimeError.h"
#include "base/Secret.h"
#include "platform/HttpTransport.h"
#include "support/HttpAddress.h"
#include "transfer/Reply.h"

namespace tarnwick {
std::int32_t ErrorNumberOf(const std::optional<HttpAnswer>& answer) {
  return ResultAsItStood(acceptor::kUnspecified, [&](std::int32_t& number) {
    if (!answer || answer->status != 200) return;
    number = NumberFromText(Reply::FromBody(answer->body).First(u"ErrorNumber"));
  });
}

HttpPost AcceptorPost(TextView usersBaseUrl, TextView acceptorPath) {
  auto address = SplitUrl(usersBaseUrl);
  if (!address) throw RuntimeError(acceptor::kUnspecified);
  HttpPost post;
  post.secure = address->secure;
  post.host = std::move(address->host);
  post.port = address->port;
  post.target = EscapeUnprintable(acceptorPath);
  return post;
}

Text UsersBaseUrl(TextView server) {
  return ServerUrl(server) + u"/users/";
}

Text AcceptorPath(TextView page) {
  return Text(u"/httpupload/").append(page);
}

void PostAcceptorForm(HttpTransport& http, TextView usersBaseUrl, TextView acceptorPath,
                      std::initializer_list<AcceptorField> fields) {
  HttpPost post = AcceptorPost(usersBaseUrl, acceptorPath);
  SecretBytes body;
  for (const AcceptorField& field : fields) {
    if (!body.IsEmpty()) body.Append("&");
    body.Append(EscapeFormValue(field.name));
    body.Append("=");
    body.Append(SecretBytes(EscapeFormValue(field.value)));
  }
  post.contentType = "application/x-www-form-urlencoded; charset=utf-8";
  post.body = body;
  const std::int32_t number = ErrorNumberOf(http.Post(post, kMostAcceptorAnswerBytes));
  if (number != 0) throw RuntimeError(number);
}

}  // namespace tarnwick
