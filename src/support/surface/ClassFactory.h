// The classes that hosts create.
#pragma once

#include <span>

#include "support/surface/Automation.h"

namespace tarnwick {

struct CreatableClass {
  const CLSID& id;
  // As in the ProgID, Tarnwick.NAME.
  const wchar_t* name;
  const wchar_t* description;
  // Number of the picture for tool boxes; 0 when the class is no control.
  int toolboxBitmap;
  // A new object with one reference; may throw.
  IUnknown* (*make)();
};

std::span<const CreatableClass> CreatableClasses();

// Factory of a class, as DllGetClassObject says; CLASS_E_CLASSNOTAVAILABLE when hosts cannot create it.
HRESULT GetClassFactory(REFCLSID classId, REFIID interfaceId, void** factory);

}  // namespace tarnwick
