#include "platform/windows/ThreadPool.h"

#include <memory>
#include <utility>

#include "platform/windows/WindowsHeaders.h"

namespace tarnwick {
namespace {

void CALLBACK Run(PTP_CALLBACK_INSTANCE, void* context) {
  const std::unique_ptr<std::function<void()>> work(static_cast<std::function<void()>*>(context));
  (*work)();
}

}  // namespace

bool RunOnPool(std::function<void()> work) {
  auto context = std::make_unique<std::function<void()>>(std::move(work));
  HMODULE self = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT | GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS,
                     reinterpret_cast<const wchar_t*>(Run), &self);
  TP_CALLBACK_ENVIRON environment;
  InitializeThreadpoolEnvironment(&environment);
  SetThreadpoolCallbackRunsLong(&environment);
  SetThreadpoolCallbackLibrary(&environment, self);
  const bool taken = TrySubmitThreadpoolCallback(Run, context.get(), &environment) != FALSE;
  DestroyThreadpoolEnvironment(&environment);
  if (taken) static_cast<void>(context.release());
  return taken;
}

}  // namespace tarnwick
