#include "support/HttpAddress.h"

#include <algorithm>

#include "base/Secret.h"

namespace tarnwick {
namespace {

constexpr TextView kPlainScheme = u"http://";
constexpr TextView kSecureScheme = u"https://";

template <typename Keep>
std::string Escape(TextView text, Keep keep) {
  constexpr std::string_view kHex = "0123456789ABCDEF";
  const SecretBytes secret(Utf8FromText(text));
  const std::string_view bytes = secret;
  const auto kept = static_cast<std::size_t>(std::count_if(
      bytes.begin(), bytes.end(), [&](char byte) { return keep(static_cast<unsigned char>(byte)); }));
  std::string escaped;
  // All at once: it may be a password, and a text that grows leaves what it was behind.
  escaped.reserve(3 * bytes.size() - 2 * kept);
  for (const char character : bytes) {
    const auto byte = static_cast<unsigned char>(character);
    if (keep(byte))
      escaped.push_back(character);
    else
      escaped.append({'%', kHex[byte >> 4], kHex[byte & 0xF]});
  }
  return escaped;
}

bool IsLetterOrDigit(unsigned char byte) {
  return (byte >= '0' && byte <= '9') || (byte >= 'A' && byte <= 'Z') || (byte >= 'a' && byte <= 'z');
}

// Whether `host` ("name", "1.2.3.4", "[::1]") can stand between a scheme and a port.
bool CanBeHost(TextView host) {
  if (!host.starts_with(u'[')) return !host.empty() && host.find_first_of(u" @\\?#[]") == TextView::npos;
  if (!host.ends_with(u']')) return false;
  const TextView number = host.substr(1, host.size() - 2);
  return number.find(u':') != TextView::npos &&
         number.find_first_not_of(u"0123456789ABCDEFabcdef:.") == TextView::npos;
}

std::optional<HttpAddress> Split(TextView address, bool secure) {
  if (std::any_of(address.begin(), address.end(), [](char16_t unit) { return unit < 0x20 || unit == 0x7F; }))
    return std::nullopt;
  const std::size_t pathStart = std::min(address.find(u'/'), address.size());
  TextView host = address.substr(0, pathStart);
  HttpAddress parts;
  parts.secure = secure;
  parts.port = secure ? 443 : 80;
  parts.path = address.substr(pathStart);
  // The colons inside an IPv6 literal's brackets belong to the host.
  const std::size_t colon =
      host.find(u':', host.starts_with(u'[') ? std::min(host.find(u']'), host.size()) : 0);
  if (colon != TextView::npos) {
    const TextView digits = host.substr(colon + 1);
    if (digits.empty() || digits.find_first_not_of(u"0123456789") != TextView::npos) return std::nullopt;
    unsigned port = 0;
    for (const char16_t digit : digits) port = std::min(port * 10 + (digit - u'0'), 65536U);
    if (port < 1 || port > 65535) return std::nullopt;
    parts.port = static_cast<std::uint16_t>(port);
    host = host.substr(0, colon);
  }
  if (!CanBeHost(host)) return std::nullopt;
  parts.host = host;
  return parts;
}

}  // namespace

std::optional<HttpAddress> SplitHttpAddress(TextView address) {
  return Split(address, false);
}

std::optional<HttpAddress> SplitUrl(TextView url) {
  if (IsSecureUrl(url)) return Split(url.substr(kSecureScheme.size()), true);
  return Split(url.starts_with(kPlainScheme) ? url.substr(kPlainScheme.size()) : url, false);
}

bool IsSecureUrl(TextView url) {
  return LowerCase(url.substr(0, kSecureScheme.size())) == kSecureScheme;
}

Text ServerUrl(TextView serverName) {
  if (!IsSecureUrl(serverName))
    return serverName.empty() || SplitHttpAddress(serverName) ? Text(kPlainScheme).append(serverName)
                                                              : Text();
  const TextView name = serverName.substr(kSecureScheme.size());
  const auto address = Split(name, true);
  return address && address->path.empty() ? Text(kSecureScheme).append(name) : Text();
}

std::string EscapeUnprintable(TextView text) {
  return Escape(text, [](unsigned char byte) { return byte >= 0x21 && byte <= 0x7E; });
}

std::string EscapeFormValue(TextView text) {
  return Escape(text, [](unsigned char byte) {
    return IsLetterOrDigit(byte) || byte == '-' || byte == '.' || byte == '_' || byte == '~';
  });
}

}  // namespace tarnwick
