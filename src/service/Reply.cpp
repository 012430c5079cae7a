#include "service/Reply.h"

#include <algorithm>
#include <optional>

#include "support/RuntimeError.h"

namespace tarnwick {
namespace {

int HexDigit(char digit) {
  if (digit >= '0' && digit <= '9') return digit - '0';
  if (digit >= 'A' && digit <= 'F') return digit - 'A' + 10;
  if (digit >= 'a' && digit <= 'f') return digit - 'a' + 10;
  return -1;
}

// Unescapes one name or value; nullopt when an escape is broken or the bytes are not UTF-8.
std::optional<Text> Unescape(std::string_view escaped) {
  std::string bytes;
  bytes.reserve(escaped.size());
  for (std::size_t i = 0; i < escaped.size(); ++i) {
    if (escaped[i] == '+') {
      bytes.push_back(' ');
    } else if (escaped[i] != '%') {
      bytes.push_back(escaped[i]);
    } else {
      if (escaped.size() - i < 3) return std::nullopt;
      const int high = HexDigit(escaped[i + 1]);
      const int low = HexDigit(escaped[i + 2]);
      if (high < 0 || low < 0) return std::nullopt;
      bytes.push_back(static_cast<char>(high * 16 + low));
      i += 2;
    }
  }
  return TextFromUtf8(bytes);
}

}  // namespace

Reply Reply::FromBody(std::string_view body) {
  if (body.ends_with("\r\n")) body.remove_suffix(2);
  Reply reply;
  while (!body.empty()) {
    const std::string_view piece = body.substr(0, body.find('&'));
    body.remove_prefix(std::min(piece.size() + 1, body.size()));
    if (piece.empty()) continue;
    const std::size_t equals = piece.find('=');
    const std::optional<Text> name = Unescape(piece.substr(0, equals));
    if (!name) return {};
    std::vector<Text>& values = reply.variables_[*name];
    if (equals == std::string_view::npos) continue;
    std::optional<Text> value = Unescape(piece.substr(equals + 1));
    if (!value) return {};
    values.push_back(*std::move(value));
  }
  const auto error = reply.variables_.find(u"ErrorOccured");
  reply.failed_ = error != reply.variables_.end() && !error->second.empty() && error->second.front() == u"1";
  return reply;
}

const std::vector<Text>* Reply::GetValueByVariableName(TextView name) const {
  const auto variable = variables_.find(Text(name));
  return variable == variables_.end() ? nullptr : &variable->second;
}

const Text& Reply::First(TextView name) const {
  const std::vector<Text>* values = GetValueByVariableName(name);
  if (!values || values->empty()) throw RuntimeError(error::kSubscriptOutOfRange);
  return values->front();
}

}  // namespace tarnwick
