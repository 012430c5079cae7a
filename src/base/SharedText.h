// A text whose units stay where they were written, for as long as any text needs them.
#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <utility>

#include "base/Text.h"

namespace tarnwick {

// Copies share the units, which never change: another text replaces them. Units of many texts may stand in
// one block of memory, which then lives as long as the last of them.
class SharedText {
 public:
  SharedText() = default;
  // The units `text`, which `units` keeps.
  SharedText(std::shared_ptr<const char16_t[]> units, TextView text)
      : units_(std::move(units), text.data()), size_(text.size()) {}

  // Throws std::bad_alloc; the text is then unchanged.
  SharedText& operator=(TextView text) {
    auto units = std::make_shared_for_overwrite<char16_t[]>(text.size());
    std::copy(text.begin(), text.end(), units.get());
    units_ = std::move(units);
    size_ = text.size();
    return *this;
  }
  void clear() { *this = SharedText(); }

  // Where a text of the usual kind is wanted, this one is as good.
  operator TextView() const { return {units_.get(), size_}; }
  operator Text() const { return Text(TextView(*this)); }

  bool empty() const { return size_ == 0; }
  friend bool operator==(const SharedText& one, const SharedText& other) {
    return TextView(one) == TextView(other);
  }
  friend bool operator==(const SharedText& one, TextView other) { return TextView(one) == other; }

 private:
  std::shared_ptr<const char16_t[]> units_;
  std::size_t size_ = 0;
};

}  // namespace tarnwick
