#include "transfer/Reply.h"

#include <algorithm>
#include <optional>

#include "base/RuntimeError.h"

namespace tarnwick {
namespace {

// The service knows a few dozen; each name costs much more memory than its bytes.
constexpr std::size_t kMostVariables = 1000;

int HexDigit(char digit) {
  if (digit >= '0' && digit <= '9') return digit - '0';
  if (digit >= 'A' && digit <= 'F') return digit - 'A' + 10;
  if (digit >= 'a' && digit <= 'f') return digit - 'a' + 10;
  return -1;
}

// Unescapes names and values one after the other into room that is made once.
class Unescaper {
 public:
  // `texts` keeps its address; it has room for a character for each byte.
  Unescaper(std::vector<char16_t>& texts, std::size_t bytes) : texts_(texts) { texts_.reserve(bytes); }

  // nullopt when an escape is broken or the bytes are not UTF-8.
  std::optional<TextView> Unescape(std::string_view escaped) {
    const std::size_t begin = texts_.size();
    bool ascii = true;
    for (std::size_t i = 0; i < escaped.size(); ++i) {
      int byte = static_cast<unsigned char>(escaped[i]);
      if (byte == '+') {
        byte = ' ';
      } else if (byte == '%') {
        if (escaped.size() - i < 3) return std::nullopt;
        const int high = HexDigit(escaped[i + 1]);
        const int low = HexDigit(escaped[i + 2]);
        if (high < 0 || low < 0) return std::nullopt;
        byte = high * 16 + low;
        i += 2;
      }
      ascii = ascii && byte < 0x80;
      texts_.push_back(static_cast<char16_t>(byte));
    }
    if (!ascii) {
      const std::string bytes(texts_.begin() + static_cast<std::ptrdiff_t>(begin), texts_.end());
      const std::optional<Text> text = TextFromUtf8(bytes);
      if (!text) return std::nullopt;
      // Never longer than the bytes were.
      texts_.resize(begin);
      texts_.insert(texts_.end(), text->begin(), text->end());
    }
    return TextView(texts_.data() + begin, texts_.size() - begin);
  }

 private:
  std::vector<char16_t>& texts_;
};

}  // namespace

Reply Reply::FromBody(std::string_view body) {
  if (body.ends_with("\r\n")) body.remove_suffix(2);
  Reply reply;
  Unescaper unescaper(reply.texts_, body.size());
  // Arrays come in a row, so the name seldom changes.
  std::string_view lastName;
  std::vector<TextView>* values = nullptr;
  while (!body.empty()) {
    const std::string_view piece = body.substr(0, body.find('&'));
    body.remove_prefix(std::min(piece.size() + 1, body.size()));
    if (piece.empty()) continue;
    const std::size_t equals = piece.find('=');
    if (const std::string_view name = piece.substr(0, equals); !values || name != lastName) {
      const std::optional<TextView> variable = unescaper.Unescape(name);
      if (!variable) return {};
      values = &reply.variables_[*variable];
      if (reply.variables_.size() > kMostVariables) return {};
      lastName = name;
    }
    if (equals == std::string_view::npos) continue;
    const std::optional<TextView> value = unescaper.Unescape(piece.substr(equals + 1));
    if (!value) return {};
    values->push_back(*value);
  }
  const auto error = reply.variables_.find(u"ErrorOccured");
  reply.failed_ = error != reply.variables_.end() && !error->second.empty() && error->second.front() == u"1";
  return reply;
}

const std::vector<TextView>* Reply::GetValueByVariableName(TextView name) const {
  const auto variable = variables_.find(name);
  return variable == variables_.end() ? nullptr : &variable->second;
}

TextView Reply::First(TextView name) const {
  const std::vector<TextView>* values = GetValueByVariableName(name);
  if (!values || values->empty()) throw RuntimeError(error::kSubscriptOutOfRange);
  return values->front();
}

}  // namespace tarnwick
