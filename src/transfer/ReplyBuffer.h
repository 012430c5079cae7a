// What has arrived of a reply and is still wanted: bytes that are put where they stay, so that they are
// neither copied nor cleared on their way.
#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <span>
#include <string_view>
#include <utility>

namespace tarnwick {

class ReplyBuffer {
 public:
  std::string_view Bytes() const { return {bytes_.get(), size_}; }
  std::size_t Size() const { return size_; }

  // Where the next bytes go: at least one. Throws std::bad_alloc; what is there stays.
  std::span<char> Room() {
    if (size_ == capacity_) Reserve(std::max(kFirstRoom, 2 * capacity_));
    return {bytes_.get() + size_, capacity_ - size_};
  }
  // So many bytes were put into the room.
  void Add(std::size_t count) { size_ += count; }
  // Forgets the bytes and keeps the room.
  void Clear() { size_ = 0; }

  // Room for so many bytes in all. Throws like Room.
  void Reserve(std::size_t capacity) {
    if (capacity <= capacity_) return;
    auto larger = std::make_unique_for_overwrite<char[]>(capacity);
    std::copy_n(bytes_.get(), size_, larger.get());
    bytes_ = std::move(larger);
    capacity_ = capacity;
  }

 private:
  // As much as a header and a small picture need.
  static constexpr std::size_t kFirstRoom = std::size_t{64} << 10;

  std::unique_ptr<char[]> bytes_;
  std::size_t size_ = 0;
  std::size_t capacity_ = 0;
};

}  // namespace tarnwick
