#include "transfer/HttpAddress.h"

#include <algorithm>

namespace tarnwick {
namespace {

template <typename Keep>
std::string Escape(TextView text, Keep keep) {
  constexpr std::string_view kHex = "0123456789ABCDEF";
  const std::string bytes = Utf8FromText(text);
  std::string escaped;
  escaped.reserve(bytes.size());
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

}  // namespace

std::optional<HttpAddress> SplitHttpAddress(TextView address) {
  if (std::any_of(address.begin(), address.end(), [](char16_t unit) { return unit < 0x20 || unit == 0x7F; }))
    return std::nullopt;
  const std::size_t pathStart = std::min(address.find(u'/'), address.size());
  TextView host = address.substr(0, pathStart);
  HttpAddress parts;
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
  if (host.empty() || host.find(u' ') != TextView::npos) return std::nullopt;
  parts.host = host;
  return parts;
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
