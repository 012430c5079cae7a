// The reply of the service page: variables by name, each an array of texts.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "base/KeyHash.h"
#include "base/SharedText.h"
#include "base/Text.h"

namespace tarnwick {

class Reply {
 public:
  // The values of one variable, in valid UTF-8; owned by the reply.
  class Values {
   public:
    std::size_t size() const { return places_.size(); }
    bool empty() const { return places_.empty(); }
    // `index` is less than size().
    std::string_view operator[](std::size_t index) const {
      return {body_ + places_[index].begin, places_[index].length};
    }
    std::string_view front() const { return (*this)[0]; }

   private:
    friend class Reply;
    // Half as long as a view: a long listing has four hundred thousand.
    struct Place {
      std::uint32_t begin, length;
    };
    const char* body_ = nullptr;
    std::vector<Place> places_;
  };

  // A failed exchange without variables.
  Reply() = default;
  Reply(Reply&&) = default;
  Reply& operator=(Reply&&) = default;

  // Reads an `application/x-www-form-urlencoded` body in UTF-8. A broken escape or invalid UTF-8 anywhere
  // makes the exchange a failed one, as do more than 1000 names, a body of 4 GiB, and a variable ErrorOccured
  // of 1.
  static Reply FromBody(std::string body);

  // 1 when the exchange failed, else 0.
  std::int32_t ErrorOccured() const { return failed_ ? 1 : 0; }

  // Every value that the server sent under `name` (letter case counts), in its order; a bare name has none.
  // Null when the name did not occur. Owned by the reply.
  const Values* GetValueByVariableName(TextView name) const;

  // A text that keeps the reply's bytes, of which `value` is a part.
  SharedText Shared(std::string_view value) const { return {body_, value}; }

  // Element 0 of the above. Throws run-time error 9 when there is none.
  Text First(TextView name) const;

 private:
  // The body, in which names and values are unescaped where they stand, and which those below point into.
  std::shared_ptr<const std::string> body_;
  std::unordered_map<std::string_view, Values, ProcessHash> variables_;
  bool failed_ = true;
};

}  // namespace tarnwick
