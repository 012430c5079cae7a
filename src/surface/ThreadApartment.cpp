#include "surface/ThreadApartment.h"

#include "platform/windows/WindowsPlatform.h"

#include <map>
#include <memory>
#include <mutex>

#include "session/Apartment.h"
#include "surface/Module.h"

namespace tarnwick {

struct ThreadState {
  WindowsPlatform platform{module::Instance()};
  Apartment apartment{platform.View()};
  long holds = 0;
};

namespace {

std::mutex g_lock;

// By thread identifier. On the heap, because nothing may run when a process ends with states alive: the
// system's Internet library may be gone by then.
using ThreadStates = std::map<DWORD, std::unique_ptr<ThreadState>>;
ThreadStates* g_states = nullptr;

// Counts one more hold.
ThreadState* HoldStateOfThread() {
  const std::lock_guard guard(g_lock);
  if (!g_states) g_states = new ThreadStates;
  std::unique_ptr<ThreadState>& state = (*g_states)[GetCurrentThreadId()];
  if (!state) state = std::make_unique<ThreadState>();
  ++state->holds;
  return state.get();
}

}  // namespace

ApartmentHold::ApartmentHold() : state_(HoldStateOfThread()) {}

ApartmentHold::~ApartmentHold() {
  const std::lock_guard guard(g_lock);
  --state_->holds;
}

Apartment& ApartmentHold::Get() const {
  return state_->apartment;
}

void FreeApartmentOfThread() {
  const std::lock_guard guard(g_lock);
  if (!g_states) return;
  const auto state = g_states->find(GetCurrentThreadId());
  if (state == g_states->end()) return;
  // An object that outlived its thread still refers to the state; the identifier will come again, though.
  if (state->second->holds > 0) static_cast<void>(state->second.release());
  g_states->erase(state);
}

void FreeAllApartments() {
  delete g_states;
  g_states = nullptr;
}

}  // namespace tarnwick
