#include "hosting/FormBody.h"

#include "base/Text.h"
#include "support/HttpAddress.h"

namespace tarnwick::hosting {
namespace {

std::string Escape(std::string_view value) {
  return EscapeFormValue(TextFromUtf8(value).value_or(tarnwick::Text()));
}

}  // namespace

std::string FormBody::Text() const {
  std::string body;
  const auto piece = [&]() -> std::string& { return body.empty() ? body : body.append("&"); };
  for (const auto& [name, values] : variables_) {
    if (values.empty()) piece().append(Escape(name));
    for (const std::string& value : values) piece().append(Escape(name)).append("=").append(Escape(value));
  }
  return body;
}

}  // namespace tarnwick::hosting
