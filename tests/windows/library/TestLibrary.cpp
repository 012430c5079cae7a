#include "TestLibrary.h"

#include <atomic>
#include <cstdlib>
#include <new>

#include "platform/windows/Owner.h"
#include "platform/windows/WindowsRegistry.h"
#include "support/CRegistry.h"
#include "surface/DualObject.h"
#include "surface/Guard.h"
#include "surface/TypeLibrary.h"

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

namespace tarnwick::test {
namespace {

class CRegistryObject final : public DualObject<_CRegistry> {
 public:
  STDMETHODIMP setBaseRegKey(REG_HIVES* regHive, BSTR* regSubKeys) override {
    if (!regHive || !regSubKeys) return E_POINTER;
    return Done([&] { registry_.setBaseRegKey(static_cast<std::uint32_t>(*regHive), ViewOf(*regSubKeys)); });
  }
  STDMETHODIMP getRegSetting(BSTR* RegNameValue, BSTR* Subkey, REG_KEYTYPE* Datatype, BSTR* result) override {
    if (!RegNameValue) return E_POINTER;
    return AnsweredText(result, [&] {
      auto type = static_cast<std::uint32_t>(Datatype ? *Datatype : 0);
      Text text = registry_.getRegSetting(ViewOf(*RegNameValue), ViewOf(Subkey), type);
      if (Datatype) *Datatype = static_cast<REG_KEYTYPE>(type);
      return text;
    });
  }

 private:
  WindowsRegistry system_;
  CRegistry registry_{system_};
};

}  // namespace
}  // namespace tarnwick::test

extern "C" HRESULT STDMETHODCALLTYPE MakeRegistry(IDispatch** registry) {
  return tarnwick::Guarded([&] {
    *registry = new tarnwick::test::CRegistryObject;
    return S_OK;
  });
}

extern "C" void STDMETHODCALLTYPE CountHeld(tarnwick::test::Held* held) {
  *held = {allocations, tarnwick::ownedObjects};
}
