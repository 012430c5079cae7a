#include "surface/Registration.h"

#include <comcat.h>
#include <olectl.h>

#include <string>

#include "platform/windows/Owner.h"
#include "surface/ClassFactory.h"
#include "surface/Guard.h"
#include "surface/Module.h"
#include "surface/OleControl.h"
#include "surface/TypeLibrary.h"

namespace tarnwick {
namespace {

constexpr wchar_t kLibraryName[] = L"Tarnwick";
constexpr wchar_t kVersion[] = L"1.1";
// Below the type library's key, its file under its own locale and, for hosts that ask by theirs, under none.
constexpr const wchar_t* kLocaleKeys[] = {L"\\1.1\\409\\", L"\\1.1\\0\\"};
// Subkeys of these for programs of this bitness and of the other one, and the registry view of the other one:
// a 64-bit system runs both.
#ifdef _WIN64
constexpr wchar_t kFileKey[] = L"win64";
constexpr wchar_t kOtherFileKey[] = L"win32";
constexpr REGSAM kOtherView = KEY_WOW64_32KEY;
#else
constexpr wchar_t kFileKey[] = L"win32";
constexpr wchar_t kOtherFileKey[] = L"win64";
constexpr REGSAM kOtherView = KEY_WOW64_64KEY;
#endif

// The system's own marshalers: by the type library, and of IDispatch.
constexpr wchar_t kTypeLibraryMarshaler[] = L"{00020424-0000-0000-C000-000000000046}";
constexpr wchar_t kDispatchMarshaler[] = L"{00020420-0000-0000-C000-000000000046}";

struct Interface {
  const IID& id;
  const wchar_t* name;
  const wchar_t* marshaler;
};
const Interface kInterfaces[] = {
    {IID__CFileUpload, L"_CFileUpload", kTypeLibraryMarshaler},
    {IID__CUpload, L"_CUpload", kTypeLibraryMarshaler},
    {IID__CBVAccount, L"_CBVAccount", kTypeLibraryMarshaler},
    {IID__CRegistry, L"_CRegistry", kTypeLibraryMarshaler},
    {IID__ctrlListImage, L"_ctrlListImage", kTypeLibraryMarshaler},
    {IID__ctrlThumbNailView, L"_ctrlThumbNailView", kTypeLibraryMarshaler},
    {DIID___ctrlListImage, L"__ctrlListImage", kDispatchMarshaler},
    {DIID___ctrlThumbNailView, L"__ctrlThumbNailView", kDispatchMarshaler},
};

// A failure inside a registration, as its HRESULT.
void Check(LSTATUS status) {
  if (status != ERROR_SUCCESS) throw RuntimeError(HRESULT_FROM_WIN32(static_cast<DWORD>(status)));
}

std::wstring GuidText(const GUID& guid) {
  wchar_t text[39];
  StringFromGUID2(guid, text, 39);
  return text;
}

// The classes of all users or of the current one. A view says for which kind of programs; 0 is this one's.
// Wine: registry views work only for keys that are named from the root on.
class Classes {
 public:
  explicit Classes(Scope scope) : root_(scope == Scope::kUser ? HKEY_CURRENT_USER : HKEY_LOCAL_MACHINE) {}

  // Sets a value of a key, which is made when it is not there; null names the key's own value.
  void SetValue(const std::wstring& path, const wchar_t* name, const std::wstring& value,
                REGSAM view = 0) const {
    HKEY key = nullptr;
    Check(RegCreateKeyExW(root_, Full(path).c_str(), 0, nullptr, 0, KEY_SET_VALUE | view, nullptr, &key,
                          nullptr));
    const KeyOwner owner(key);
    Check(RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(value.c_str()),
                         static_cast<DWORD>((value.size() + 1) * sizeof(wchar_t))));
  }

  bool Has(const std::wstring& path, REGSAM view = 0) const {
    return static_cast<bool>(Open(path, KEY_QUERY_VALUE | view));
  }

  // Removes a key with all below it; false when that fails for another reason than that there is none.
  bool Remove(const std::wstring& path, REGSAM view = 0) const {
    const KeyOwner key = Open(path, KEY_ALL_ACCESS | view);
    if (!key) return !Has(path, view);
    return RegDeleteTreeW(key.Get(), nullptr) == ERROR_SUCCESS &&
           RegDeleteKeyExW(root_, Full(path).c_str(), view, 0) == ERROR_SUCCESS;
  }

  // Removes a key that has neither keys nor values below it.
  void RemoveIfEmpty(const std::wstring& path, REGSAM view = 0) const {
    const KeyOwner key = Open(path, KEY_QUERY_VALUE | view);
    DWORD keys = 1;
    DWORD values = 1;
    if (key &&
        RegQueryInfoKeyW(key.Get(), nullptr, nullptr, nullptr, &keys, nullptr, nullptr, &values, nullptr,
                         nullptr, nullptr, nullptr) == ERROR_SUCCESS &&
        keys == 0 && values == 0)
      RegDeleteKeyExW(root_, Full(path).c_str(), view, 0);
  }

 private:
  static std::wstring Full(const std::wstring& path) { return L"Software\\Classes\\" + path; }

  KeyOwner Open(const std::wstring& path, REGSAM access) const {
    HKEY key = nullptr;
    RegOpenKeyExW(root_, Full(path).c_str(), 0, access, &key);
    return KeyOwner(key);
  }

  const HKEY root_;
};

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
void RegisterControl(const Classes& classes, const std::wstring& classKey, const std::wstring& path,
                     int toolboxBitmap) {
  classes.SetValue(classKey + L"\\Control", nullptr, {});
  classes.SetValue(classKey + L"\\MiscStatus", nullptr, L"0");
  classes.SetValue(classKey + L"\\MiscStatus\\1", nullptr, std::to_wstring(kControlMiscStatus));
  classes.SetValue(classKey + L"\\ToolboxBitmap32", nullptr, path + L", " + std::to_wstring(toolboxBitmap));
  classes.SetValue(classKey + L"\\Implemented Categories\\" + GuidText(CATID_Control), nullptr, {});
}

void RegisterClass(const Classes& classes, const CreatableClass& known, const std::wstring& path) {
  const Names names(known);
  const std::wstring classId = GuidText(known.id);
  classes.SetValue(names.classKey, nullptr, known.description);
  classes.SetValue(names.classKey + L"\\InprocServer32", nullptr, path);
  classes.SetValue(names.classKey + L"\\InprocServer32", L"ThreadingModel", L"Apartment");
  classes.SetValue(names.classKey + L"\\ProgID", nullptr, names.versioned);
  classes.SetValue(names.classKey + L"\\VersionIndependentProgID", nullptr, names.general);
  classes.SetValue(names.classKey + L"\\TypeLib", nullptr, GuidText(LIBID_Tarnwick));
  classes.SetValue(names.classKey + L"\\Version", nullptr, kVersion);
  classes.SetValue(names.classKey + L"\\Programmable", nullptr, {});
  if (known.IsControl()) RegisterControl(classes, names.classKey, path, known.toolboxBitmap);
  classes.SetValue(names.versioned, nullptr, known.description);
  classes.SetValue(names.versioned + L"\\CLSID", nullptr, classId);
  classes.SetValue(names.general, nullptr, known.description);
  classes.SetValue(names.general + L"\\CLSID", nullptr, classId);
  classes.SetValue(names.general + L"\\CurVer", nullptr, names.versioned);
}

std::wstring LibraryKey() {
  return L"TypeLib\\" + GuidText(LIBID_Tarnwick);
}

std::wstring KeyOf(const Interface& known) {
  return L"Interface\\" + GuidText(known.id);
}

// Writes what RegisterTypeLib writes, also for one user. Wine: RegisterTypeLibForUser registers for all
// users.
void RegisterTypeLibrary(const Classes& classes, const std::wstring& path) {
  const std::wstring version = LibraryKey() + L"\\" + kVersion;
  classes.SetValue(version, nullptr, kLibraryName);
  for (const wchar_t* locale : kLocaleKeys) classes.SetValue(LibraryKey() + locale + kFileKey, nullptr, path);
  classes.SetValue(version + L"\\FLAGS", nullptr, L"0");
  classes.SetValue(version + L"\\HELPDIR", nullptr, path.substr(0, path.rfind(L'\\')));
  // Programs of both kinds call one another.
  for (const REGSAM view : {REGSAM{0}, kOtherView})
    for (const Interface& known : kInterfaces) {
      const std::wstring key = KeyOf(known);
      classes.SetValue(key, nullptr, known.name, view);
      classes.SetValue(key + L"\\ProxyStubClsid", nullptr, known.marshaler, view);
      classes.SetValue(key + L"\\ProxyStubClsid32", nullptr, known.marshaler, view);
      classes.SetValue(key + L"\\TypeLib", nullptr, GuidText(LIBID_Tarnwick), view);
      classes.SetValue(key + L"\\TypeLib", L"Version", kVersion, view);
    }
}

bool UnregisterTypeLibrary(const Classes& classes) {
  bool gone = true;
  // The file for the other kind of programs has the same interfaces.
  if (classes.Has(LibraryKey() + kLocaleKeys[0] + kOtherFileKey)) {
    for (const wchar_t* locale : kLocaleKeys) gone &= classes.Remove(LibraryKey() + locale + kFileKey);
    return gone;
  }
  gone &= classes.Remove(LibraryKey());
  for (const REGSAM view : {REGSAM{0}, kOtherView})
    for (const Interface& known : kInterfaces) gone &= classes.Remove(KeyOf(known), view);
  return gone;
}

}  // namespace

HRESULT Register(Scope scope) {
  const HRESULT result = Guarded([&] {
    const Classes classes(scope);
    const std::wstring path = module::Path();
    RegisterTypeLibrary(classes, path);
    for (const CreatableClass& known : CreatableClasses()) RegisterClass(classes, known, path);
    return S_OK;
  });
  if (FAILED(result)) Unregister(scope);
  return result;
}

HRESULT Unregister(Scope scope) {
  return Guarded([&] {
    const Classes classes(scope);
    bool gone = UnregisterTypeLibrary(classes);
    for (const CreatableClass& known : CreatableClasses()) {
      const Names names(known);
      gone &= classes.Remove(names.classKey);
      // The two kinds of programs share the names, but not the classes.
      if (classes.Has(names.classKey, kOtherView)) continue;
      for (const std::wstring& key : {names.general, names.versioned}) gone &= classes.Remove(key);
    }
    // A user who has no other class of his own had none of these before. Of all users they are the system's.
    for (const REGSAM view : {REGSAM{0}, kOtherView})
      for (const wchar_t* key : {L"CLSID", L"Interface", L"TypeLib", L"Wow6432Node"})
        if (scope == Scope::kUser) classes.RemoveIfEmpty(key, view);
    return gone ? S_OK : SELFREG_E_CLASS;
  });
}

}  // namespace tarnwick
