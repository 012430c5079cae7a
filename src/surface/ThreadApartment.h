// The shared state of the calling thread's apartment.
#pragma once

namespace tarnwick {

struct Apartment;
struct ThreadState;

// Keeps the state of the thread that makes it, which is made with the first one. Objects that use the state
// have one as a member, before whatever uses it.
class ApartmentHold {
 public:
  ApartmentHold();
  ~ApartmentHold();
  ApartmentHold(const ApartmentHold&) = delete;
  ApartmentHold& operator=(const ApartmentHold&) = delete;

  Apartment& Get() const;

 private:
  ThreadState* const state_;
};

// For the library's entry point: frees the state of the calling thread, which ends, unless an object was left
// behind; frees the state of every thread, when the library is unloaded.
void FreeApartmentOfThread();
void FreeAllApartments();

}  // namespace tarnwick
