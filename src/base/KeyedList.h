// An ordered list whose items may have a unique key, the core of an automation collection.
#pragma once

#include <cstddef>
#include <memory>
#include <utility>
#include <vector>

#include "base/KeyIndex.h"
#include "base/RuntimeError.h"
#include "base/Text.h"

namespace tarnwick {

// Positions count from 1, as hosts count. Keys are compared exactly; an item without a key has the empty one.
template <typename Item>
class KeyedList {
 public:
  std::size_t Count() const { return entries_.size(); }

  // Appends. Throws run-time error 457 when the key is in use; the list is then unchanged.
  void Add(Item item, TextView key = {}) { Insert(Count() + 1, std::move(item), key); }

  // Puts the item at `position` (1 to Count() + 1). Throws 9 for another position, 457 like Add.
  void Insert(std::size_t position, Item item, TextView key = {}) {
    if (position < 1 || position > Count() + 1) throw RuntimeError(error::kSubscriptOutOfRange);
    if (!key.empty()) keys_.MakeRoom();
    const auto place = entries_.begin() + static_cast<std::ptrdiff_t>(position - 1);
    const auto entry = entries_.insert(place, std::make_unique<Entry>(Entry{std::move(item), Text(key)}));
    if (key.empty() || keys_.Add(entry->get())) return;
    entries_.erase(entry);
    throw RuntimeError(error::kDuplicateKey);
  }

  // Throws 9 when `position` is not 1 to Count().
  const Item& At(std::size_t position) const { return EntryAt(position).item; }

  // The item with that key; null when there is none.
  const Item* Find(TextView key) const {
    const Entry* found = key.empty() ? nullptr : keys_.Find(key);
    return found ? &found->item : nullptr;
  }

  // Position of the item with that key, 0 when there is none.
  std::size_t PositionOf(TextView key) const {
    const Entry* found = key.empty() ? nullptr : keys_.Find(key);
    if (!found) return 0;
    for (std::size_t i = 0; i < entries_.size(); ++i)
      if (entries_[i].get() == found) return i + 1;
    return 0;
  }

  // Removes an item and returns it. Throws 9 like At.
  Item Take(std::size_t position) {
    const Entry& gone = EntryAt(position);
    if (!gone.key.empty()) keys_.Remove(&gone);
    const auto entry = entries_.begin() + static_cast<std::ptrdiff_t>(position - 1);
    Item item = std::move((*entry)->item);
    entries_.erase(entry);
    return item;
  }

 private:
  struct Entry {
    Item item;
    Text key;
  };

  const Entry& EntryAt(std::size_t position) const {
    if (position < 1 || position > Count()) throw RuntimeError(error::kSubscriptOutOfRange);
    return *entries_[position - 1];
  }

  std::vector<std::unique_ptr<Entry>> entries_;
  KeyIndex<Entry> keys_;
};

}  // namespace tarnwick
