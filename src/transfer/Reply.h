// The reply of the service page: variables by name, each an array of texts.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "base/Text.h"

namespace tarnwick {

class Reply {
 public:
  // A failed exchange without variables.
  Reply() = default;
  Reply(Reply&&) = default;
  Reply& operator=(Reply&&) = default;

  // Reads an `application/x-www-form-urlencoded` body in UTF-8. A broken escape or invalid UTF-8 anywhere
  // makes the exchange a failed one, as do more than 1000 names, and a variable ErrorOccured of 1.
  static Reply FromBody(std::string_view body);

  // 1 when the exchange failed, else 0.
  std::int32_t ErrorOccured() const { return failed_ ? 1 : 0; }

  // Every value that the server sent under `name` (letter case counts), in its order; a bare name has none.
  // Null when the name did not occur. Owned by the reply.
  const std::vector<TextView>* GetValueByVariableName(TextView name) const;

  // Element 0 of the above. Throws run-time error 9 when there is none.
  TextView First(TextView name) const;

 private:
  // All texts in one piece, which the views below point into: a listing has four of them for each file.
  std::vector<char16_t> texts_;
  std::unordered_map<TextView, std::vector<TextView>> variables_;
  bool failed_ = true;
};

}  // namespace tarnwick
