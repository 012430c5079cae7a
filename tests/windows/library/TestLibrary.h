// What the test build of the library exports beside what the library does.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oaidl.h>

#include <string>

namespace tarnwick::test {

// What the library holds at a moment.
struct Held {
  LONG allocations = 0;  // blocks of memory
  LONG objects = 0;      // system objects: handles, windows, GDI objects, timers, hooks
  bool operator==(const Held&) const = default;
};

// CountHeld
using CountHeld = void(STDMETHODCALLTYPE*)(Held* held);

// The test build of the library, loaded without the component runtime, which would keep references of its
// own.
class TestLibrary {
 public:
  TestLibrary() {
    wchar_t program[MAX_PATH] = {};
    GetModuleFileNameW(nullptr, program, MAX_PATH);
    // Of BUILD/tests/windows/com/PROGRAM.
    std::wstring build = program;
    for (int i = 0; i < 4; ++i) build.resize(build.rfind(L'\\'));
    module_ = LoadLibraryW((build + L"\\TarnwickTest.ocx").c_str());
  }
  ~TestLibrary() { FreeLibrary(module_); }
  TestLibrary(const TestLibrary&) = delete;
  TestLibrary& operator=(const TestLibrary&) = delete;

  HMODULE Module() const { return module_; }
  template <typename Export>
  Export Get(const char* name) const {
    return reinterpret_cast<Export>(reinterpret_cast<void*>(GetProcAddress(module_, name)));
  }

 private:
  HMODULE module_ = nullptr;
};

}  // namespace tarnwick::test
