#include "transfer/Reply.h"

#include <utf8.h>

#include <algorithm>
#include <array>
#include <optional>
#include <utility>

#include "base/RuntimeError.h"

namespace tarnwick {
namespace {

// The service knows a few dozen; each name costs much more memory than its bytes.
constexpr std::size_t kMostVariables = 1000;

// Values of the hexadecimal digits, -1 for all other bytes.
constexpr auto kHexDigits = [] {
  std::array<short, 256> digits{};
  digits.fill(-1);
  for (unsigned i = 0; i < 10; ++i) digits['0' + i] = static_cast<short>(i);
  for (unsigned i = 0; i < 6; ++i) digits['A' + i] = digits['a' + i] = static_cast<short>(10 + i);
  return digits;
}();

// Unescapes what `escaped`, a part of `body`, says, at its place: it never gets longer. nullopt when an
// escape is broken or the bytes are not UTF-8.
std::optional<std::string_view> Unescape(std::string& body, std::string_view escaped) {
  char* const begin = body.data() + (escaped.data() - body.data());
  char* end = begin;
  unsigned seen = 0;
  for (std::size_t i = 0; i < escaped.size(); ++i) {
    unsigned byte = static_cast<unsigned char>(escaped[i]);
    if (byte == '+') {
      byte = ' ';
    } else if (byte == '%') {
      if (escaped.size() - i < 3) return std::nullopt;
      const int high = kHexDigits[static_cast<unsigned char>(escaped[i + 1])];
      const int low = kHexDigits[static_cast<unsigned char>(escaped[i + 2])];
      if (high < 0 || low < 0) return std::nullopt;
      byte = static_cast<unsigned>(high * 16 + low);
      i += 2;
    }
    seen |= byte;
    *end++ = static_cast<char>(byte);
  }
  const std::string_view bytes(begin, static_cast<std::size_t>(end - begin));
  if (seen >= 0x80 && !utf8::is_valid(bytes)) return std::nullopt;
  return bytes;
}

}  // namespace

Reply Reply::FromBody(std::string body) {
  Reply reply;
  reply.body_ = std::make_unique<std::string>(std::move(body));
  std::string_view rest = *reply.body_;
  if (rest.ends_with("\r\n")) rest.remove_suffix(2);
  // Arrays come in a row, so the name seldom changes. Empty when the next one is to be looked up anyway.
  std::string_view lastName;
  Values* values = nullptr;
  while (!rest.empty()) {
    const std::string_view piece = rest.substr(0, rest.find('&'));
    rest.remove_prefix(std::min(piece.size() + 1, rest.size()));
    if (piece.empty()) continue;
    const std::size_t equals = piece.find('=');
    if (const std::string_view name = piece.substr(0, equals); lastName.empty() || name != lastName) {
      const std::optional<std::string_view> variable = Unescape(*reply.body_, name);
      if (!variable) return {};
      values = &reply.variables_[*variable];
      if (reply.variables_.size() > kMostVariables) return {};
      // What had escapes is overwritten, and would pass for another name.
      lastName = variable->size() == name.size() ? *variable : std::string_view();
    }
    if (equals == std::string_view::npos) continue;
    const std::optional<std::string_view> value = Unescape(*reply.body_, piece.substr(equals + 1));
    if (!value) return {};
    values->push_back(*value);
  }
  const auto error = reply.variables_.find("ErrorOccured");
  reply.failed_ = error != reply.variables_.end() && !error->second.empty() && error->second.front() == "1";
  return reply;
}

const Reply::Values* Reply::GetValueByVariableName(TextView name) const {
  const auto variable = variables_.find(Utf8FromText(name));
  return variable == variables_.end() ? nullptr : &variable->second;
}

Text Reply::First(TextView name) const {
  const Values* values = GetValueByVariableName(name);
  if (!values || values->empty()) throw RuntimeError(error::kSubscriptOutOfRange);
  return TextFromUtf8(values->front()).value();
}

}  // namespace tarnwick
