#pragma once

#include "base/Text.h"

namespace tarnwick {

struct Apartment;

// Removes the first file of the name (a bare name, or the last part of an address) from the all-files list
// and, when it was there, from the shown-files list. Names are compared exactly, without the blanks around
// them. Pumps messages, so other code may change the lists meanwhile; the search then ends at the shorter
// end.
void RemoveFromTransferLists(Apartment& apartment, TextView name);

}  // namespace tarnwick
