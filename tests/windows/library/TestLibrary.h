// What the test build of the library exports beside what the library does.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oaidl.h>

namespace tarnwick::test {

// What the library holds at a moment.
struct Held {
  LONG allocations = 0;  // blocks of memory
  LONG objects = 0;      // system objects: handles, windows, GDI objects, timers, hooks
  bool operator==(const Held&) const = default;
};

// MakeRegistry: a CRegistry, which the library makes for no host.
using MakeRegistry = HRESULT(STDMETHODCALLTYPE*)(IDispatch** registry);
// CountHeld
using CountHeld = void(STDMETHODCALLTYPE*)(Held* held);

}  // namespace tarnwick::test
