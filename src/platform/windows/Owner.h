// Owners of system objects. Each closes what it holds, once; all of them are this one template.
#pragma once

#include <atomic>
#include <cstdint>
#include <type_traits>
#include <utility>

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {

// Number of system objects that owners of this module hold now: how tests see a leak. Wine: the system's own
// counters tell 0 always.
inline std::atomic<std::int32_t> ownedObjects{0};

// Holds a T, which Close(held) ends; a T of the value None holds nothing. None may be a number where the
// system's "nothing" is no null pointer.
template <typename T, auto Close, auto None = nullptr>
class Owner {
 public:
  Owner() = default;
  // Takes over `held`, which may be nothing.
  explicit Owner(T held) : held_(held) {
    if (*this) ++ownedObjects;
  }
  Owner(Owner&& other) noexcept : held_(std::exchange(other.held_, Nothing())) {}
  Owner& operator=(Owner&& other) noexcept {
    Owner(std::move(other)).Swap(*this);
    return *this;
  }
  ~Owner() {
    if (!*this) return;
    Close(held_);
    --ownedObjects;
  }

  explicit operator bool() const { return held_ != Nothing(); }
  T Get() const { return held_; }
  // Gives up what it holds without closing it.
  T Detach() {
    if (*this) --ownedObjects;
    return std::exchange(held_, Nothing());
  }

 private:
  static T Nothing() {
    if constexpr (std::is_null_pointer_v<decltype(None)>)
      return {};
    else
      return reinterpret_cast<T>(None);
  }
  void Swap(Owner& other) noexcept { std::swap(held_, other.held_); }

  T held_ = Nothing();
};

// INVALID_HANDLE_VALUE, which is no constant for the compiler.
inline constexpr std::intptr_t kInvalidHandle = -1;

using KeyOwner = Owner<HKEY, RegCloseKey>;
using LibraryOwner = Owner<HMODULE, FreeLibrary>;
using FileOwner = Owner<HANDLE, CloseHandle, kInvalidHandle>;
using FindOwner = Owner<HANDLE, FindClose, kInvalidHandle>;
// Of all other objects of the kernel, such as processes and events, whose "nothing" is null.
using HandleOwner = Owner<HANDLE, CloseHandle>;

// --- For drawing ---

using FontOwner = Owner<HFONT, DeleteObject>;
using BitmapOwner = Owner<HBITMAP, DeleteObject>;
using IconOwner = Owner<HICON, DestroyIcon>;
using BrushOwner = Owner<HBRUSH, DeleteObject>;
using PenOwner = Owner<HPEN, DeleteObject>;
using RegionOwner = Owner<HRGN, DeleteObject>;
using MemoryDcOwner = Owner<HDC, DeleteDC>;

// Owners of two values that end together.

// The device context of a window; of the screen for a null window.
struct WindowDc {
  HWND window;
  HDC dc;
  bool operator==(const WindowDc&) const = default;
};
inline void ReleaseWindowDc(const WindowDc& held) {
  ReleaseDC(held.window, held.dc);
}
using WindowDcOwner = Owner<WindowDc, ReleaseWindowDc>;
inline WindowDcOwner DcOf(HWND window) {
  const HDC dc = GetDC(window);
  return dc ? WindowDcOwner({window, dc}) : WindowDcOwner();
}

// The painting of a window, from its beginning to its end.
struct Painting {
  HWND window;
  PAINTSTRUCT paint;
  bool operator==(const Painting& other) const { return window == other.window; }
};
inline void EndPainting(const Painting& held) {
  EndPaint(held.window, &held.paint);
}
using PaintingOwner = Owner<Painting, EndPainting>;
[[nodiscard]] inline PaintingOwner Paint(HWND window) {
  Painting begun = {window, {}};
  BeginPaint(window, &begun.paint);
  return PaintingOwner(begun);
}

// What was selected before, and is selected again at the end.
struct Selection {
  HDC dc;
  HGDIOBJ before;
  bool operator==(const Selection&) const = default;
};
inline void EndSelection(const Selection& held) {
  SelectObject(held.dc, held.before);
}
using SelectionOwner = Owner<Selection, EndSelection>;
[[nodiscard]] inline SelectionOwner SelectInto(HDC dc, HGDIOBJ object) {
  return SelectionOwner({dc, SelectObject(dc, object)});
}

// The state of a device context, which comes back at the end.
struct SavedDc {
  HDC dc;
  int state;
  bool operator==(const SavedDc&) const = default;
};
inline void RestoreSavedDc(const SavedDc& held) {
  RestoreDC(held.dc, held.state);
}
using SavedDcOwner = Owner<SavedDc, RestoreSavedDc>;
[[nodiscard]] inline SavedDcOwner SaveStateOf(HDC dc) {
  return SavedDcOwner({dc, SaveDC(dc)});
}

}  // namespace tarnwick
