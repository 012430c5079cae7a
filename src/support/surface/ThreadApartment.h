// The shared state of the calling thread's apartment.
#pragma once

namespace tarnwick {

struct Apartment;

// The calling thread's state, made on the first call. It outlives all objects of the thread.
Apartment& ApartmentOfThread();

// Objects of ours that use the state count themselves, so that it is never freed below them.
void HoldApartment();
void LetGoOfApartment();

// For the library's entry point: frees the state of the calling thread, which ends, unless an object was left
// behind; frees the state of every thread, when the library is unloaded.
void FreeApartmentOfThread();
void FreeAllApartments();

}  // namespace tarnwick
