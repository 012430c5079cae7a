// The server's listing, which all controls of an apartment show.
#pragma once

#include <memory>
#include <set>
#include <utility>

#include "base/Text.h"
#include "session/FileList.h"

namespace tarnwick {

struct Listing {
  // What the service lists, and the part of it that the thumbnails' filter shows.
  FileList all;
  FileList shown;
  // Of the thumbnails.
  Text filter = u"*";
  // The list control has listed the account into `all`, and nothing was renamed since: its next Init need not
  // ask the service.
  bool isCurrent = false;
  // Nor need the next Init of the thumbnails. A rename leaves this flag as it is.
  bool isLoaded = false;
  // Addresses of the files whose copies were fetched again since the listing, because of their length.
  std::set<Text> copiesAskedAgain;

  // Empties the list of all files. Nobody may take what comes into it afterwards, such as one uploaded file,
  // for the whole account, so both flags go in the same step.
  void Forget();
  // Address of the record that has exactly that one, else of the first whose address contains it; empty when
  // there is none.
  Text AddressLike(const Text& address) const;
  // change(record) changes a record that may be in both lists, in one or in none.
  template <typename ChangeRecord>
  void Change(const FileRecord& record, const ChangeRecord& change) {
    CUpload values = *record;
    change(values);
    // Nothing fails from here on, so that no list loses a record.
    all.addresses_.MakeRoom();
    shown.addresses_.MakeRoom();
    FileList* const lists[] = {all.Holds(*record) ? &all : nullptr, shown.Holds(*record) ? &shown : nullptr};
    for (FileList* list : lists)
      if (list) list->Unindex(*record);
    // All records are made as ones that may change.
    *std::const_pointer_cast<CUpload>(record) = std::move(values);
    for (FileList* list : lists)
      if (list) list->Index(*record);
  }
  // Gives a record another name, and its address that name at the end.
  void GiveName(const FileRecord& record, const Text& newName);
};

}  // namespace tarnwick
