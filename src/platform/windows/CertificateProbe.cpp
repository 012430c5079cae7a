#include "platform/windows/CertificateProbe.h"

#include <atomic>
#include <memory>
#include <utility>

#include "platform/HttpTransport.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/InternetOwner.h"
#include "platform/windows/ThreadPool.h"

namespace tarnwick {
namespace {

std::int32_t Probe(const std::wstring& host, std::uint16_t port) {
  const InternetOwner session(InternetOpenW(L"Tarnwick", INTERNET_OPEN_TYPE_PRECONFIG, nullptr, nullptr, 0));
  if (!session) return http_error::kSecureChannel;
  SetTimeouts(session.Get(), kProbeMs, kProbeMs);
  const InternetOwner connection(
      InternetConnectW(session.Get(), host.c_str(), port, nullptr, nullptr, INTERNET_SERVICE_HTTP, 0, 0));
  const InternetOwner request(HttpOpenRequestW(
      connection.Get(), L"HEAD", L"/", nullptr, nullptr, nullptr,
      INTERNET_FLAG_SECURE | INTERNET_FLAG_NO_AUTO_REDIRECT | INTERNET_FLAG_NO_COOKIES |
          INTERNET_FLAG_NO_CACHE_WRITE | INTERNET_FLAG_RELOAD | INTERNET_FLAG_NO_UI | INTERNET_FLAG_NO_AUTH,
      0));
  if (!request || HttpSendRequestW(request.Get(), nullptr, 0, nullptr, 0)) return http_error::kSecureChannel;
  switch (GetLastError()) {
    case ERROR_INTERNET_SEC_CERT_DATE_INVALID:
      return http_error::kCertificateDate;
    case ERROR_INTERNET_SEC_CERT_CN_INVALID:
      return http_error::kCertificateName;
    case ERROR_INTERNET_INVALID_CA:
    case ERROR_INTERNET_SEC_CERT_REV_FAILED:
    case ERROR_INTERNET_SEC_CERT_REVOKED:
    case ERROR_INTERNET_SEC_INVALID_CERT:
    case ERROR_INTERNET_SEC_CERT_ERRORS:
      return http_error::kUnknownAuthority;
    default:
      return http_error::kSecureChannel;
  }
}

}  // namespace

bool ProbeCertificate(const Text& host, std::uint16_t port, std::function<void(std::int32_t)> told) {
  return RunOnPool([wide = WideFromText(host), port, told = std::move(told)] { told(Probe(wide, port)); });
}

std::int32_t ProbedCertificate(const Text& host, std::uint16_t port) {
  // Lives until the probe has ended, which may be later.
  struct Answer {
    const HandleOwner ended{CreateEventW(nullptr, FALSE, FALSE, nullptr)};
    std::atomic<std::int32_t> error = http_error::kSecureChannel;
  };
  const auto answer = std::make_shared<Answer>();
  const bool begun = answer->ended && ProbeCertificate(host, port, [answer](std::int32_t error) {
                       answer->error = error;
                       SetEvent(answer->ended.Get());
                     });
  if (begun) WaitForSingleObject(answer->ended.Get(), kProbeMs);
  return answer->error;
}

}  // namespace tarnwick
