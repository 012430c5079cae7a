// The classes that hosts create.
#pragma once

#include <span>

#include "surface/Automation.h"

namespace tarnwick {

struct CreatableClass {
  const CLSID& id;
  // As in the ProgID, Tarnwick.NAME.
  const wchar_t* name;
  const wchar_t* description;
  // Number of the picture for tool boxes; 0 when the class is no control.
  int toolboxBitmap;
  // A new object with one reference, for a control as part of `outer` when that is not null; may throw.
  IUnknown* (*make)(IUnknown* outer);

  bool IsControl() const { return toolboxBitmap != 0; }
};

std::span<const CreatableClass> CreatableClasses();

// Factory of a class, as DllGetClassObject says; CLASS_E_CLASSNOTAVAILABLE when hosts cannot create it.
HRESULT GetClassFactory(REFCLSID classId, REFIID interfaceId, void** factory);

}  // namespace tarnwick
