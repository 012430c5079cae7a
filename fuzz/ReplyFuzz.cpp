// Whatever the service page answers: the reply holds what the body says, variable by variable, or nothing.
#include <charconv>
#include <cstdint>
#include <cstdlib>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "transfer/Reply.h"

namespace {

using namespace tarnwick;

// One name or value after the other, each with memory of its own.
std::optional<Text> Decoded(std::string_view escaped) {
  std::string bytes;
  for (std::size_t i = 0; i < escaped.size(); ++i) {
    unsigned char byte = static_cast<unsigned char>(escaped[i] == '+' ? ' ' : escaped[i]);
    if (byte == '%') {
      const std::string_view digits = escaped.substr(i + 1, 2);
      const char* const end = digits.data() + digits.size();
      if (digits.size() < 2 || std::from_chars(digits.data(), end, byte, 16).ptr != end) return std::nullopt;
      i += 2;
    }
    bytes.push_back(static_cast<char>(byte));
  }
  return TextFromUtf8(bytes);
}

using Variables = std::map<Text, std::vector<Text>>;

std::optional<Variables> Parsed(std::string_view body) {
  if (body.ends_with("\r\n")) body.remove_suffix(2);
  Variables variables;
  for (std::size_t at = 0; at < body.size();) {
    const std::string_view piece = body.substr(at, body.find('&', at) - at);
    at += piece.size() + 1;
    if (piece.empty()) continue;
    const std::size_t equals = piece.find('=');
    const std::optional<Text> name = Decoded(piece.substr(0, equals));
    if (!name) return std::nullopt;
    std::vector<Text>& values = variables[*name];
    if (equals == std::string_view::npos) continue;
    const std::optional<Text> value = Decoded(piece.substr(equals + 1));
    if (!value) return std::nullopt;
    values.push_back(*value);
  }
  return variables;
}

void Check(bool holds) {
  if (!holds) std::abort();
}

}  // namespace

// The input is the body.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string_view body(reinterpret_cast<const char*>(data), size);
  const Reply reply = Reply::FromBody(std::string(body));
  const std::optional<Variables> expected = Parsed(body);
  if (!expected) {
    Check(reply.ErrorOccured() == 1);
    return 0;
  }
  const auto error = expected->find(u"ErrorOccured");
  const bool failed = error != expected->end() && !error->second.empty() && error->second.front() == u"1";
  Check(reply.ErrorOccured() == (failed ? 1 : 0));
  for (const auto& [name, values] : *expected) {
    const Reply::Values* const found = reply.GetValueByVariableName(name);
    Check(found && found->size() == values.size());
    for (std::size_t i = 0; i < values.size(); ++i) Check(TextFromUtf8((*found)[i]) == values[i]);
    if (!values.empty()) Check(reply.First(name) == values.front());
  }
  return 0;
}
