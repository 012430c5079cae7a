// The form body of an answer.
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tarnwick::hosting {

inline constexpr const char* kFormType = "application/x-www-form-urlencoded; charset=utf-8";

class FormBody {
 public:
  FormBody() = default;
  FormBody(std::string_view name, std::string_view value) { Add(name, value); }

  // Appends a variable with one value, in UTF-8.
  FormBody& Add(std::string_view name, std::string_view value) {
    return Add(name, std::vector{std::string(value)});
  }

  // Appends an array; one without elements is present and empty.
  FormBody& Add(std::string_view name, std::vector<std::string> values) {
    variables_.emplace_back(name, std::move(values));
    return *this;
  }

  const std::vector<std::pair<std::string, std::vector<std::string>>>& Variables() const {
    return variables_;
  }

  // The escaped form.
  std::string Text() const;

 private:
  std::vector<std::pair<std::string, std::vector<std::string>>> variables_;
};

}  // namespace tarnwick::hosting
