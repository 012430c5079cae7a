// What the library exports.
#include "platform/windows/WindowsHeaders.h"

#include <olectl.h>

#include "controls/windows/ControlWindow.h"
#include "controls/windows/PageAccessible.h"
#include "surface/ClassFactory.h"
#include "surface/Guard.h"
#include "surface/Module.h"
#include "surface/Registration.h"
#include "surface/ThreadApartment.h"

BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID reserved) {
  switch (reason) {
    case DLL_PROCESS_ATTACH:
      tarnwick::module::SetInstance(instance);
      break;
    case DLL_THREAD_DETACH:
      tarnwick::FreeApartmentOfThread();
      break;
    case DLL_PROCESS_DETACH:
      // Not when the process ends: other libraries that the states use may be gone already.
      if (!reserved) tarnwick::FreeAllApartments();
      break;
    default:
      break;
  }
  return TRUE;
}

STDAPI DllGetClassObject(REFCLSID classId, REFIID interfaceId, LPVOID* factory) {
  return tarnwick::GetClassFactory(classId, interfaceId, factory);
}

STDAPI DllCanUnloadNow() {
  return tarnwick::Guarded([] {
    const bool inUse = tarnwick::module::IsHeld() || tarnwick::ControlWindow::AnyLeft() ||
                       tarnwick::PageAccessible::AnyLeft();
    return inUse ? S_FALSE : S_OK;
  });
}

STDAPI DllRegisterServer() {
  return tarnwick::Register(tarnwick::Scope::kMachine);
}

STDAPI DllUnregisterServer() {
  return tarnwick::Unregister(tarnwick::Scope::kMachine);
}

// "user" registers for the current user alone, without an administrator; an empty line for all.
STDAPI DllInstall(BOOL install, LPCWSTR commandLine) {
  using tarnwick::Scope;
  const bool user = commandLine && _wcsicmp(commandLine, L"user") == 0;
  if (!user && commandLine && *commandLine != L'\0') return E_INVALIDARG;
  const Scope scope = user ? Scope::kUser : Scope::kMachine;
  return install ? tarnwick::Register(scope) : tarnwick::Unregister(scope);
}
