#include "session/FileList.h"

#include <utility>

#include "base/RuntimeError.h"

namespace tarnwick {

const FileRecord& FileList::At(std::size_t position) const {
  if (position < 1 || position > Count()) throw RuntimeError(error::kSubscriptOutOfRange);
  return records_[position - 1];
}

std::size_t FileList::PositionOf(TextView address) const {
  const CUpload* const found = Find(address);
  return found ? PositionWhere([&](const CUpload& record) { return &record == found; }) : 0;
}

void FileList::Add(FileRecord record) {
  addresses_.MakeRoom();
  records_.push_back(std::move(record));
  const CUpload& added = *records_.back();
  if (added.FilePath.empty() || addresses_.Add(&added)) return;
  records_.pop_back();
  throw RuntimeError(error::kDuplicateKey);
}

void FileList::Insert(std::size_t position, FileRecord record) {
  if (position < 1 || position > Count() + 1) throw RuntimeError(error::kSubscriptOutOfRange);
  addresses_.MakeRoom();
  const auto place = records_.begin() + static_cast<std::ptrdiff_t>(position - 1);
  Index(**records_.insert(place, std::move(record)));
}

void FileList::Remove(std::size_t position) {
  Unindex(*At(position));
  records_.erase(records_.begin() + static_cast<std::ptrdiff_t>(position - 1));
}

void FileList::Clear() {
  addresses_ = {};
  records_.clear();
}

bool FileList::Holds(const CUpload& record) const {
  return PositionWhere([&](const CUpload& held) { return &held == &record; }) != 0;
}

void FileList::Index(const CUpload& record) {
  if (record.FilePath.empty()) return;
  addresses_.MakeRoom();
  addresses_.Add(&record);
}

void FileList::Unindex(const CUpload& record) {
  if (Find(record.FilePath) == &record) addresses_.Remove(&record);
}

}  // namespace tarnwick
