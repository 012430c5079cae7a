// Owners of system objects. Each closes what it holds, once; all of them are this one template.
#pragma once

#include <atomic>
#include <cstdint>
#include <utility>

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

// Number of system objects that owners of this module hold now. The system's own counters are not to be had
// everywhere, so this is how tests and diagnostics see a leak.
inline std::atomic<std::int32_t> ownedObjects{0};

// Kind names the type `Handle`, the value None() that means "nothing" and the function Close(handle).
template <typename Kind>
class Owner {
 public:
  using Handle = typename Kind::Handle;

  Owner() = default;
  // Takes over `handle`, which may be None().
  explicit Owner(Handle handle) : handle_(handle) {
    if (*this) ++ownedObjects;
  }
  Owner(Owner&& other) noexcept : handle_(std::exchange(other.handle_, Kind::None())) {}
  Owner& operator=(Owner&& other) noexcept {
    Owner(std::move(other)).Swap(*this);
    return *this;
  }
  ~Owner() {
    if (!*this) return;
    Kind::Close(handle_);
    --ownedObjects;
  }

  explicit operator bool() const { return handle_ != Kind::None(); }
  Handle Get() const { return handle_; }
  // Gives up what it holds without closing it.
  Handle Detach() {
    if (*this) --ownedObjects;
    return std::exchange(handle_, Kind::None());
  }

 private:
  void Swap(Owner& other) noexcept { std::swap(handle_, other.handle_); }

  Handle handle_ = Kind::None();
};

struct RegistryKeyKind {
  using Handle = HKEY;
  static Handle None() { return nullptr; }
  static void Close(Handle handle) { RegCloseKey(handle); }
};
using KeyOwner = Owner<RegistryKeyKind>;

struct LibraryKind {
  using Handle = HMODULE;
  static Handle None() { return nullptr; }
  static void Close(Handle handle) { FreeLibrary(handle); }
};
using LibraryOwner = Owner<LibraryKind>;

struct FileKind {
  using Handle = HANDLE;
  static Handle None() { return INVALID_HANDLE_VALUE; }
  static void Close(Handle handle) { CloseHandle(handle); }
};
using FileOwner = Owner<FileKind>;

struct FindKind {
  using Handle = HANDLE;
  static Handle None() { return INVALID_HANDLE_VALUE; }
  static void Close(Handle handle) { FindClose(handle); }
};
using FindOwner = Owner<FindKind>;

struct FontKind {
  using Handle = HFONT;
  static Handle None() { return nullptr; }
  static void Close(Handle handle) { DeleteObject(handle); }
};
using FontOwner = Owner<FontKind>;

}  // namespace tarnwick
