// Passwords, and whatever a password can be read from, in memory that is overwritten before it goes back.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <string>
#include <string_view>
#include <utility>

namespace tarnwick {

// Overwrites a text, with what its memory still holds of longer ones before it; it is empty afterwards.
template <typename Unit>
void Wipe(std::basic_string<Unit>& text) noexcept {
  // A compiler leaves out a plain call, because nobody reads the memory any more.
  static void* (*const volatile fill)(void*, int, std::size_t) = std::memset;
  // Allocates nothing.
  text.resize(text.capacity());
  fill(text.data(), 0, text.size() * sizeof(Unit));
  text.clear();
}

// Wiped when it ends, is replaced or grows. What the system, the host and the stack hold of it is out of
// reach.
template <typename Unit>
class BasicSecret {
 public:
  using Value = std::basic_string<Unit>;
  using View = std::basic_string_view<Unit>;

  BasicSecret() = default;
  // Takes the text over, and wipes where it was: a short one stays behind when it is moved.
  BasicSecret(Value&& value) noexcept { Take(value); }
  BasicSecret(const BasicSecret& other) = default;
  BasicSecret(BasicSecret&& other) noexcept { Take(other.value_); }
  BasicSecret& operator=(BasicSecret other) noexcept {
    Take(other.value_);
    return *this;
  }
  ~BasicSecret() { Wipe(value_); }

  operator View() const noexcept { return value_; }
  bool IsEmpty() const noexcept { return value_.empty(); }

  // `more` is no part of it.
  void Append(View more) {
    if (value_.capacity() - value_.size() < more.size()) {
      Value larger;
      larger.reserve(std::max(2 * value_.capacity(), value_.size() + more.size()));
      larger.append(value_);
      Take(larger);
    }
    value_.append(more);
  }

 private:
  void Take(Value& value) noexcept {
    Wipe(value_);
    value_.swap(value);
    Wipe(value);
  }

  Value value_;
};

using Secret = BasicSecret<char16_t>;
using SecretBytes = BasicSecret<char>;

}  // namespace tarnwick
