#include "transfer/ExchangeFailures.h"

#include "platform/HttpTransport.h"

namespace tarnwick {

TextView SecureFailureText(std::int32_t httpError) {
  switch (httpError) {
    case http_error::kCertificateDate:
      return u"The server's certificate has expired or is not valid yet.";
    case http_error::kCertificateName:
      return u"The server's certificate is made out for another name.";
    case http_error::kUnknownAuthority:
      return u"The server's certificate comes from an authority that this computer does not know.";
    case http_error::kSecureChannel:
      return u"There is no secure connection to the server.";
    default:
      return {};
  }
}

}  // namespace tarnwick
