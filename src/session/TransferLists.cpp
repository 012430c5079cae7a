#include "session/TransferLists.h"

#include <algorithm>

#include "session/Apartment.h"
#include "support/PathHelpers.h"

namespace tarnwick {
namespace {

bool RemoveFirst(FileList& list, MessagePump& pump, TextView name, bool yieldPerItem) {
  const std::size_t count = list.Count();
  for (std::size_t i = 1; i <= std::min(count, list.Count()); ++i) {
    const FileRecord record = list.At(i);
    if (yieldPerItem) pump.Yield();
    if (Trim(Text(record->FileName)) != name) continue;
    pump.Yield();
    // The list may have moved while messages were handled; what goes is the record that matched.
    for (std::size_t at = 1; at <= list.Count(); ++at) {
      if (list.At(at) != record) continue;
      list.Remove(at);
      break;
    }
    return true;
  }
  return false;
}

}  // namespace

void RemoveFromTransferLists(Apartment& apartment, TextView name) {
  const Text wanted(Trim(FileNameFromUrl(name)));
  MessagePump& pump = apartment.platform.pump;
  if (RemoveFirst(apartment.listing.all, pump, wanted, true))
    RemoveFirst(apartment.listing.shown, pump, wanted, false);
}

}  // namespace tarnwick
