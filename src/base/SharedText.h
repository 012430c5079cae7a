// A text whose bytes stay where they are, for as long as any text needs them.
#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include "base/Text.h"

namespace tarnwick {

// Copies share the bytes, which never change: another text replaces them. Bytes of many texts may stand in
// one block of memory, such as the reply with a listing, which then lives as long as the last of them. They
// are WTF-8; each use as units makes a copy, because most texts of a listing are never used so.
class SharedText {
 public:
  SharedText() = default;
  // The text of `bytes`, which `owner` keeps.
  SharedText(std::shared_ptr<const std::string> owner, std::string_view bytes)
      : bytes_(std::move(owner), bytes.data()), size_(bytes.size()) {}

  // Throws std::bad_alloc; the text is then unchanged.
  SharedText& operator=(TextView text) {
    const auto bytes = std::make_shared<const std::string>(Wtf8FromText(text));
    return *this = SharedText(bytes, *bytes);
  }
  void clear() { *this = SharedText(); }

  operator Text() const { return TextFromWtf8(Bytes()); }
  // Owned by this text and its copies.
  std::string_view Bytes() const { return {bytes_.get(), size_}; }
  explicit operator std::string_view() const { return Bytes(); }
  bool empty() const { return size_ == 0; }

  friend bool operator==(const SharedText& one, const SharedText& other) {
    return one.Bytes() == other.Bytes();
  }
  friend bool operator==(const SharedText& one, TextView other) {
    const std::string_view bytes = one.Bytes();
    const auto same = [](char byte, char16_t unit) { return unit < 0x80 && byte == static_cast<char>(unit); };
    const auto [byte, unit] = std::mismatch(bytes.begin(), bytes.end(), other.begin(), other.end(), same);
    if (byte == bytes.end() || unit == other.end()) return byte == bytes.end() && unit == other.end();
    // No units are made for most names of a list that is searched.
    return *unit >= 0x80 && Text(one) == other;
  }

 private:
  std::shared_ptr<const char> bytes_;
  std::size_t size_ = 0;
};

}  // namespace tarnwick
