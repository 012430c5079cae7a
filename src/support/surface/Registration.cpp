#include "support/surface/Registration.h"

#include <comcat.h>
#include <olectl.h>

#include <string>

#include "platform/windows/Owner.h"
#include "support/surface/ClassFactory.h"
#include "support/surface/ComPtr.h"
#include "support/surface/Guard.h"
#include "support/surface/Module.h"
#include "support/surface/OleControl.h"
#include "support/surface/TypeLibrary.h"

namespace tarnwick {
namespace {

constexpr wchar_t kLibraryName[] = L"Tarnwick";
constexpr wchar_t kVersion[] = L"1.1";
constexpr WORD kMajor = 1;
constexpr WORD kMinor = 1;
constexpr LCID kLocale = 0x409;
#ifdef _WIN64
constexpr SYSKIND kSystem = SYS_WIN64;
constexpr wchar_t kTypeLibraryKey[] = L"\\1.1\\409\\win64";
// Where programs of the other kind look, on a system that runs both.
constexpr REGSAM kOtherView = KEY_WOW64_32KEY;
#else
constexpr SYSKIND kSystem = SYS_WIN32;
constexpr wchar_t kTypeLibraryKey[] = L"\\1.1\\409\\win32";
constexpr REGSAM kOtherView = KEY_WOW64_64KEY;
#endif

// A failure inside a registration, as its HRESULT.
void Check(LSTATUS status) {
  if (status != ERROR_SUCCESS) throw RuntimeError(HRESULT_FROM_WIN32(static_cast<DWORD>(status)));
}

std::wstring GuidText(const GUID& guid) {
  wchar_t text[39];
  StringFromGUID2(guid, text, 39);
  return text;
}

// Sets a value of a key below HKEY_CLASSES_ROOT, which is made when it is not there; null names the key's own
// value.
void SetValue(const std::wstring& key, const wchar_t* name, const std::wstring& value) {
  Check(RegSetKeyValueW(HKEY_CLASSES_ROOT, key.c_str(), name, REG_SZ, value.c_str(),
                        static_cast<DWORD>((value.size() + 1) * sizeof(wchar_t))));
}

// Removes a key with all below it; false when that fails for another reason than that there is none.
bool RemoveTree(const std::wstring& key) {
  const LSTATUS status = RegDeleteTreeW(HKEY_CLASSES_ROOT, key.c_str());
  return status == ERROR_SUCCESS || status == ERROR_FILE_NOT_FOUND;
}

// Whether there is a key below HKEY_CLASSES_ROOT, in the view that `view` selects.
bool KeyExists(const std::wstring& path, REGSAM view) {
  HKEY key = nullptr;
  if (RegOpenKeyExW(HKEY_CLASSES_ROOT, path.c_str(), 0, KEY_QUERY_VALUE | view, &key) != ERROR_SUCCESS)
    return false;
  const KeyOwner owner(key);
  return true;
}

struct Names {
  explicit Names(const CreatableClass& known)
      : classKey(L"CLSID\\" + GuidText(known.id)),
        general(std::wstring(kLibraryName) + L"." + known.name),
        versioned(general + L".1") {}
  std::wstring classKey;
  // ProgIDs: of whatever version is installed, and of this one.
  std::wstring general;
  std::wstring versioned;
};

// What containers look for in a control. It claims no safety for scripts of web pages: it deletes and uploads
// files.
void RegisterControl(const std::wstring& classKey, const std::wstring& path, int toolboxBitmap) {
  SetValue(classKey + L"\\Control", nullptr, {});
  SetValue(classKey + L"\\MiscStatus", nullptr, L"0");
  SetValue(classKey + L"\\MiscStatus\\1", nullptr, std::to_wstring(kControlMiscStatus));
  SetValue(classKey + L"\\ToolboxBitmap32", nullptr, path + L", " + std::to_wstring(toolboxBitmap));
  SetValue(classKey + L"\\Implemented Categories\\" + GuidText(CATID_Control), nullptr, {});
}

void RegisterClass(const CreatableClass& known, const std::wstring& path) {
  const Names names(known);
  const std::wstring classId = GuidText(known.id);
  SetValue(names.classKey, nullptr, known.description);
  SetValue(names.classKey + L"\\InprocServer32", nullptr, path);
  SetValue(names.classKey + L"\\InprocServer32", L"ThreadingModel", L"Apartment");
  SetValue(names.classKey + L"\\ProgID", nullptr, names.versioned);
  SetValue(names.classKey + L"\\VersionIndependentProgID", nullptr, names.general);
  SetValue(names.classKey + L"\\TypeLib", nullptr, GuidText(LIBID_Tarnwick));
  SetValue(names.classKey + L"\\Version", nullptr, kVersion);
  SetValue(names.classKey + L"\\Programmable", nullptr, {});
  if (known.toolboxBitmap != 0) RegisterControl(names.classKey, path, known.toolboxBitmap);
  SetValue(names.versioned, nullptr, known.description);
  SetValue(names.versioned + L"\\CLSID", nullptr, classId);
  SetValue(names.general, nullptr, known.description);
  SetValue(names.general + L"\\CLSID", nullptr, classId);
  SetValue(names.general + L"\\CurVer", nullptr, names.versioned);
}

}  // namespace

HRESULT Register() {
  const HRESULT result = Guarded([] {
    std::wstring path = module::Path();
    ComPtr<ITypeLib> library;
    HRESULT registered = LoadTypeLibEx(path.c_str(), REGKIND_NONE, library.Receive());
    if (SUCCEEDED(registered)) registered = RegisterTypeLib(library.Get(), path.data(), nullptr);
    if (FAILED(registered)) return registered;
    for (const CreatableClass& known : CreatableClasses()) RegisterClass(known, path);
    return S_OK;
  });
  if (FAILED(result)) Unregister();
  return result;
}

HRESULT Unregister() {
  return Guarded([] {
    bool gone = true;
    for (const CreatableClass& known : CreatableClasses()) {
      const Names names(known);
      gone &= RemoveTree(names.classKey);
      // The two kinds of programs of a 64-bit system share the names, but not the classes.
      if (KeyExists(names.classKey, kOtherView)) continue;
      for (const std::wstring& key : {names.general, names.versioned}) gone &= RemoveTree(key);
    }
    UnRegisterTypeLib(LIBID_Tarnwick, kMajor, kMinor, kLocale, kSystem);
    gone &= !KeyExists(L"TypeLib\\" + GuidText(LIBID_Tarnwick) + kTypeLibraryKey, 0);
    return gone ? S_OK : SELFREG_E_CLASS;
  });
}

}  // namespace tarnwick
