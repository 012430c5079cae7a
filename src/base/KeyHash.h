// A hash of texts that come from elsewhere: whoever chooses the texts cannot know which of them collide.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "base/Text.h"

namespace tarnwick {

struct HashKey {
  std::uint64_t low = 0;
  std::uint64_t high = 0;
};

// SipHash-1-3.
std::uint64_t KeyedHash(std::string_view bytes, const HashKey& key);

// The same with a key of this process, drawn at random.
struct ProcessHash {
  std::size_t operator()(std::string_view bytes) const;
  std::size_t operator()(TextView text) const {
    return (*this)({reinterpret_cast<const char*>(text.data()), text.size() * sizeof(char16_t)});
  }
};

}  // namespace tarnwick
