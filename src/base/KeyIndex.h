// A hash index over the entries of a list by their unique keys.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "base/KeyHash.h"
#include "base/Text.h"

namespace tarnwick {

// An entry's member `Key` is its key, which is not empty and which the index sees as a `View`. Entries stay
// where they are and keep their keys as long as they are in the index.
//
// Open addressing with linear probing. Places lie apart from the pointers, so that a search, which jumps at
// random, touches a small table. Measured against std::unordered_map and std::unordered_set with the same
// hash, the best of 60 runs: 100,000 addresses go in within half of the time (10 ms against 21 to 28) and
// are found in two thirds of it (43 ms against 62 to 75), in 1.8 MiB instead of 4.4 to 5.9.
template <typename Entry, auto Key = &Entry::key, typename View = TextView>
class KeyIndex {
 public:
  Entry* Find(View key) const {
    if (places_.empty()) return nullptr;
    const std::uint32_t number = places_[PlaceOf(key, HashOf(key))].number;
    return number == 0 ? nullptr : EntryOf(number);
  }
  // Makes room for one more, so that Add cannot fail.
  void MakeRoom() {
    if (entries_.size() == MostIn(places_.size())) Grow();
  }
  // False when the key is in the index already. There is room.
  bool Add(Entry* entry) {
    const std::uint32_t hash = HashOf(KeyOf(entry));
    Place& place = places_[PlaceOf(KeyOf(entry), hash)];
    if (place.number != 0) return false;
    entries_.push_back(entry);
    place = {static_cast<std::uint32_t>(entries_.size()), hash};
    return true;
  }
  // The entry is in the index.
  void Remove(const Entry* entry) {
    std::size_t hole = PlaceOf(KeyOf(entry), HashOf(KeyOf(entry)));
    const std::uint32_t number = places_[hole].number;
    const std::size_t mask = places_.size() - 1;
    // What follows moves up, unless it stands between its own place and the hole.
    for (std::size_t next = (hole + 1) & mask; places_[next].number != 0; next = (next + 1) & mask) {
      if (((next - places_[next].hash) & mask) < ((next - hole) & mask)) continue;
      places_[hole] = places_[next];
      hole = next;
    }
    places_[hole] = {};
    // The last entry takes the number that is free now.
    if (Entry* const last = entries_.back(); last != entry) {
      places_[PlaceOf(KeyOf(last), HashOf(KeyOf(last)))].number = number;
      entries_[number - 1] = last;
    }
    entries_.pop_back();
  }

 private:
  // The number of an entry, from 1, and the hash of its key. A free place has the number 0.
  struct Place {
    std::uint32_t number = 0;
    std::uint32_t hash = 0;
  };

  // How many entries a table of that size takes.
  static std::size_t MostIn(std::size_t places) { return places / 5 * 4; }
  static std::uint32_t HashOf(View key) { return static_cast<std::uint32_t>(ProcessHash()(key)); }
  static View KeyOf(const Entry* entry) { return View(entry->*Key); }
  Entry* EntryOf(std::uint32_t number) const { return entries_[number - 1]; }

  // Where the key is, or the free place where it would go. The table is not empty.
  std::size_t PlaceOf(View key, std::uint32_t hash) const {
    const std::size_t mask = places_.size() - 1;
    std::size_t at = hash & mask;
    while (places_[at].number != 0 &&
           !(places_[at].hash == hash && KeyOf(EntryOf(places_[at].number)) == key))
      at = (at + 1) & mask;
    return at;
  }
  void Grow() {
    const std::size_t size = std::max<std::size_t>(16, 2 * places_.size());
    std::vector<Place> places(size);
    entries_.reserve(MostIn(size));
    places.swap(places_);
    for (const Place& place : places) {
      if (place.number == 0) continue;
      std::size_t at = place.hash & (size - 1);
      while (places_[at].number != 0) at = (at + 1) & (size - 1);
      places_[at] = place;
    }
  }

  std::vector<Place> places_;
  // In the order of their numbers.
  std::vector<Entry*> entries_;
};

}  // namespace tarnwick
