#include "surface/Module.h"

#include <mutex>
#include <utility>
#include <vector>

namespace tarnwick::module {
namespace {

HINSTANCE g_instance = nullptr;

std::mutex g_lock;
long g_holds = 0;

// Few interfaces, so a list is the fastest map. On the heap, because nothing may run when a process ends with
// objects alive: the component runtime may be gone by then.
using TypeInfos = std::vector<std::pair<IID, ComPtr<ITypeInfo>>>;
TypeInfos* g_typeInfos = nullptr;

}  // namespace

HINSTANCE Instance() {
  return g_instance;
}

void SetInstance(HINSTANCE instance) {
  g_instance = instance;
}

std::wstring Path() {
  std::wstring path(MAX_PATH, L'\0');
  for (;;) {
    const DWORD length = GetModuleFileNameW(g_instance, path.data(), static_cast<DWORD>(path.size()));
    if (length < path.size()) {
      path.resize(length);
      return path;
    }
    path.resize(path.size() * 2);
  }
}

void Hold() {
  const std::lock_guard guard(g_lock);
  ++g_holds;
}

void LetGo() {
  TypeInfos* unused = nullptr;
  {
    const std::lock_guard guard(g_lock);
    if (--g_holds == 0) unused = std::exchange(g_typeInfos, nullptr);
  }
  delete unused;
}

bool IsHeld() {
  const std::lock_guard guard(g_lock);
  return g_holds > 0;
}

ComPtr<ITypeInfo> TypeInfo(REFIID interfaceId) noexcept try {
  const std::lock_guard guard(g_lock);
  if (!g_typeInfos) g_typeInfos = new TypeInfos;
  for (const auto& [known, info] : *g_typeInfos)
    if (known == interfaceId) return info;

  ComPtr<ITypeLib> library;
  ComPtr<ITypeInfo> info;
  if (FAILED(LoadTypeLibEx(Path().c_str(), REGKIND_NONE, library.Receive())) ||
      FAILED(library->GetTypeInfoOfGuid(interfaceId, info.Receive())))
    return {};
  g_typeInfos->emplace_back(interfaceId, info);
  return info;
} catch (...) {
  // No memory: it is as if the description could not be read.
  return {};
}

}  // namespace tarnwick::module
