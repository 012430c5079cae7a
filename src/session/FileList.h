// Records of files in an order, found by their addresses.
#pragma once

#include <cstddef>
#include <memory>
#include <vector>

#include "base/KeyIndex.h"
#include "base/Text.h"
#include "session/CUpload.h"

namespace tarnwick {

// A record is shared by all lists and controls that show it. It is changed by Listing::Change alone, so that
// each list goes on finding it.
using FileRecord = std::shared_ptr<const CUpload>;

// Positions count from 1, as hosts count. Addresses are compared exactly. A record without an address, or
// with one that an earlier record has, is found by its position only.
class FileList {
 public:
  std::size_t Count() const { return records_.size(); }
  bool IsEmpty() const { return records_.empty(); }
  auto begin() const { return records_.begin(); }
  auto end() const { return records_.end(); }

  // Throws run-time error 9 when `position` is not 1 to Count().
  const FileRecord& At(std::size_t position) const;
  // Null when there is none. Costs the same whatever the length of the list is; PositionOf walks through it.
  const CUpload* Find(TextView address) const { return FindBytes(Wtf8FromText(address)); }
  const CUpload* Find(const SharedText& address) const { return FindBytes(address.Bytes()); }
  // 0 when there is none.
  std::size_t PositionOf(TextView address) const;
  // Position of the first record for which `matches` is true, 0 when there is none.
  template <typename Matches>
  std::size_t PositionWhere(const Matches& matches) const {
    for (std::size_t i = 0; i < records_.size(); ++i)
      if (matches(*records_[i])) return i + 1;
    return 0;
  }

  // Appends. Throws run-time error 457 when the address is in use; the list is then unchanged.
  void Add(FileRecord record);
  // Puts the record at `position`, 1 to Count() + 1. Throws 9 for another position.
  void Insert(std::size_t position, FileRecord record);
  // Throws 9 like At.
  void Remove(std::size_t position);
  void Clear();

 private:
  friend struct Listing;

  const CUpload* FindBytes(std::string_view address) const {
    return address.empty() ? nullptr : addresses_.Find(address);
  }
  bool Holds(const CUpload& record) const;
  // Puts the record into the index of addresses, unless its own is empty or is there already.
  void Index(const CUpload& record);
  // Takes it out, if it is there; its address must not change before.
  void Unindex(const CUpload& record);

  std::vector<FileRecord> records_;
  KeyIndex<const CUpload, &CUpload::FilePath, std::string_view> addresses_;
};

}  // namespace tarnwick
