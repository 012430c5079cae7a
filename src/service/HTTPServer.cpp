#include "service/HTTPServer.h"

#include <string>
#include <utility>

#include "platform/HttpTransport.h"
#include "support/HttpAddress.h"
#include "transfer/AcceptorPages.h"

namespace tarnwick {
namespace {

constexpr std::size_t kMostReplyBytes = std::size_t{64} << 20;

void AppendPair(SecretBytes& form, TextView name, TextView value) {
  if (!form.IsEmpty()) form.Append("&");
  form.Append(EscapeUnprintable(name));
  form.Append("=");
  form.Append(SecretBytes(EscapeUnprintable(value)));
}

}  // namespace

Request HTTPServer::CreateXLLDFRequest(TextView requestName, TextView page) {
  return Request{Text(requestName), Text(page), {}};
}

void HTTPServer::AddParameter(Request& request, TextView name, TextView value) {
  request.parameters.emplace_back(name, Secret(Text(value)));
}

Reply HTTPServer::SendRequest(const Request& request, TextView url, std::int32_t sendFlag) {
  const auto address = SplitUrl(url);
  if (!address) return {};

  SecretBytes body;
  for (const auto& [name, value] : request.parameters) AppendPair(body, name, value);

  HttpPost post;
  post.secure = address->secure;
  post.host = address->host;
  post.port = address->port;
  post.target = EscapeUnprintable(address->path + u"/" + request.page) +
                "?Request=" + EscapeUnprintable(request.name) + "&Flag=" + std::to_string(sendFlag);
  post.contentType = "application/x-www-form-urlencoded; charset=utf-8";
  post.body = body;
  auto answer = http_.Post(post, kMostReplyBytes);
  if (!answer || answer->status != 200) return {};
  return Reply::FromBody(std::move(answer->body));
}

void HTTPServer::FolderActionWithEvents(TextView usersBaseUrl, TextView folder, TextView acceptorPath,
                                        std::int32_t action, TextView user, TextView password,
                                        TextView productGuid) {
  const Text actionText = TextFromNumber(action);
  PostAcceptorForm(http_, usersBaseUrl, acceptorPath,
                   {{u"UsersBaseUrl", usersBaseUrl},
                    {u"Folder", folder},
                    {u"Action", actionText},
                    {u"User", user},
                    {u"Password", password},
                    {u"ProductID", productGuid}});
}

}  // namespace tarnwick
