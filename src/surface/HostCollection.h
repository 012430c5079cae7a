// A collection that a host hands in: any automation object with Add, Count, Item and Remove.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleauto.h>

#include "base/Text.h"
#include "platform/windows/ComPtr.h"

namespace tarnwick {

class HostCollection {
 public:
  // The collection in `collection`, whose code runs; when that is null, a new one of ours, which is handed
  // back through it.
  explicit HostCollection(IDispatch** collection);

  // Appends `item`, with `key` unless that is empty; without the key when the collection takes none. Runs the
  // collection's code, which is the host's. Throws a run-time error with the number of the collection's error
  // when it refuses.
  void Add(IUnknown* item, TextView key) const;

 private:
  ComPtr<IDispatch> collection_;
  DISPID add_ = DISPID_UNKNOWN;
};

}  // namespace tarnwick
