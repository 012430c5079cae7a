#include "session/Listing.h"

#include "support/PathHelpers.h"

namespace tarnwick {

void Listing::Forget() {
  all.Clear();
  isCurrent = isLoaded = false;
  copiesAskedAgain.clear();
}

Text Listing::AddressLike(const Text& address) const {
  // Every address contains an empty text, which a file has that the service listed without one.
  if (address.empty()) return {};
  if (all.Find(address)) return address;
  const std::string part = Wtf8FromText(address);
  const std::size_t position = all.PositionWhere(
      [&](const CUpload& record) { return record.FilePath.Bytes().find(part) != std::string_view::npos; });
  return position == 0 ? Text() : all.At(position)->FilePath;
}

void Listing::GiveName(const FileRecord& record, const Text& newName) {
  Text address = record->FilePath;
  address.resize(address.size() - FileNameFromUrl(address).size());
  address += newName;
  Change(record, [&](CUpload& values) {
    values.FileName = newName;
    values.FilePath = address;
  });
}

}  // namespace tarnwick
