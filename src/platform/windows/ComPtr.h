// A counted reference to a COM object.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <unknwn.h>

#include <utility>

namespace tarnwick {

template <typename Interface>
class ComPtr {
 public:
  ComPtr() = default;

  // Shares: adds a reference of its own. Null is fine.
  explicit ComPtr(Interface* pointer) : pointer_(pointer) {
    if (pointer_) pointer_->AddRef();
  }
  ComPtr(const ComPtr& other) : ComPtr(other.pointer_) {}
  ComPtr(ComPtr&& other) noexcept : pointer_(std::exchange(other.pointer_, nullptr)) {}
  ComPtr& operator=(ComPtr other) noexcept {
    std::swap(pointer_, other.pointer_);
    return *this;
  }
  ~ComPtr() {
    if (pointer_) pointer_->Release();
  }

  // Takes over the caller's reference; adds none.
  static ComPtr Adopt(Interface* pointer) {
    ComPtr owner;
    owner.pointer_ = pointer;
    return owner;
  }

  Interface* Get() const { return pointer_; }
  Interface* operator->() const { return pointer_; }
  Interface& operator*() const { return *pointer_; }
  explicit operator bool() const { return pointer_ != nullptr; }

  // Gives the reference to the caller; the object is empty afterwards.
  Interface* Detach() { return std::exchange(pointer_, nullptr); }

  // For calls that return a new reference through a pointer: drops what is held and receives.
  Interface** Receive() {
    *this = {};
    return &pointer_;
  }
  void** ReceiveVoid() { return reinterpret_cast<void**>(Receive()); }

 private:
  Interface* pointer_ = nullptr;
};

}  // namespace tarnwick
