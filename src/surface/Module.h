// The library as the component runtime sees it: what keeps it loaded, and its type library.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleauto.h>

#include <string>

#include "platform/windows/ComPtr.h"

namespace tarnwick {

namespace module {

// The library's own handle; set once when it is loaded.
HINSTANCE Instance();
void SetInstance(HINSTANCE instance);

// Full path of the library's file; empty on failure.
std::wstring Path();

// Whatever holds the library counts itself here: objects and locks.
void Hold();
void LetGo();
bool IsHeld();

// Description of an interface of ours, from the type library inside the library's file; null when that cannot
// be read. It is kept as long as anything holds the library.
ComPtr<ITypeInfo> TypeInfo(REFIID interfaceId) noexcept;

}  // namespace module

}  // namespace tarnwick
