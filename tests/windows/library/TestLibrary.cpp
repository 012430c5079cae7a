#include "TestLibrary.h"

#include <atomic>
#include <cstdlib>
#include <new>

#include "platform/windows/Owner.h"

namespace {

std::atomic<LONG> allocations{0};

}  // namespace

// All memory of the library comes from here.
void* operator new(std::size_t size) {
  void* const block = std::malloc(size == 0 ? 1 : size);
  if (!block) throw std::bad_alloc();
  ++allocations;
  return block;
}
void operator delete(void* block) noexcept {
  if (!block) return;
  --allocations;
  std::free(block);
}
void operator delete(void* block, std::size_t) noexcept {
  operator delete(block);
}

extern "C" void STDMETHODCALLTYPE CountHeld(tarnwick::test::Held* held) {
  *held = {allocations, tarnwick::ownedObjects};
}
