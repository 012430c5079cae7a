#include "platform/windows/WindowsResolver.h"

#include <ws2tcpip.h>

#include <mutex>
#include <utility>

#include "base/RuntimeError.h"
#include "platform/windows/AnsiText.h"

namespace tarnwick {
namespace {

constexpr UINT kLookedUp = WM_APP;

using AddressesOwner = Owner<ADDRINFOW*, FreeAddrInfoW>;

std::vector<SocketAddress> AddressesOf(const std::wstring& host, const std::wstring& port) {
  ADDRINFOW hints = {};
  // Of each kind of address, and each only once.
  hints.ai_family = AF_UNSPEC;
  hints.ai_socktype = SOCK_STREAM;
  hints.ai_protocol = IPPROTO_TCP;
  ADDRINFOW* found = nullptr;
  if (GetAddrInfoW(host.c_str(), port.c_str(), &hints, &found) != 0) return {};
  const AddressesOwner owner(found);
  std::vector<SocketAddress> addresses;
  for (; found; found = found->ai_next)
    addresses.emplace_back(reinterpret_cast<const char*>(found->ai_addr), found->ai_addrlen);
  return addresses;
}

}  // namespace

SocketsOwner StartSockets() {
  WSADATA data = {};
  return SocketsOwner(WSAStartup(MAKEWORD(2, 2), &data) == 0);
}

struct WindowsResolver::Shared {
  std::wstring host;
  std::wstring port;
  // The worker's own, because the object may end before it.
  SocketsOwner started = StartSockets();
  // Not held while the system looks up.
  std::mutex lock;
  // Gets a message at the end; null when nobody waits for it any more.
  HWND window = nullptr;
  bool done = false;
  std::vector<SocketAddress> addresses;

  static void CALLBACK Run(PTP_CALLBACK_INSTANCE instance, void* context);
};

void CALLBACK WindowsResolver::Shared::Run(PTP_CALLBACK_INSTANCE, void* context) {
  const std::unique_ptr<std::shared_ptr<Shared>> share(static_cast<std::shared_ptr<Shared>*>(context));
  Shared& shared = **share;
  std::vector<SocketAddress> addresses = ResultAsItStood(
      std::vector<SocketAddress>(),
      [&](std::vector<SocketAddress>& found) { found = AddressesOf(shared.host, shared.port); });
  const std::lock_guard guard(shared.lock);
  shared.addresses = std::move(addresses);
  shared.done = true;
  if (shared.window) PostMessageW(shared.window, kLookedUp, 0, 0);
}

WindowsResolver::WindowsResolver()
    : window_([this](UINT message, WPARAM, LPARAM) {
        if (message != kLookedUp) return false;
        Take();
        return true;
      }) {}

WindowsResolver::~WindowsResolver() {
  Cancel();
}

void WindowsResolver::LookUp(TextView host, std::uint16_t port, Taker taker) {
  Cancel();
  taker_ = std::move(taker);
  shared_ = std::make_shared<Shared>();
  shared_->host = WideFromText(host);
  shared_->port = std::to_wstring(port);
  shared_->window = window_.Get();
  auto share = std::make_unique<std::shared_ptr<Shared>>(shared_);
  // This code stays loaded as long as the worker runs.
  HMODULE module = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT | GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS,
                     reinterpret_cast<const wchar_t*>(Shared::Run), &module);
  TP_CALLBACK_ENVIRON environment;
  InitializeThreadpoolEnvironment(&environment);
  SetThreadpoolCallbackRunsLong(&environment);
  SetThreadpoolCallbackLibrary(&environment, module);
  if (TrySubmitThreadpoolCallback(Shared::Run, share.get(), &environment)) {
    static_cast<void>(share.release());
  } else {
    shared_->done = true;
    PostMessageW(shared_->window, kLookedUp, 0, 0);
  }
  DestroyThreadpoolEnvironment(&environment);
}

void WindowsResolver::Cancel() {
  if (!shared_) return;
  const std::shared_ptr<Shared> shared = std::exchange(shared_, nullptr);
  const std::lock_guard guard(shared->lock);
  shared->window = nullptr;
}

// The message may be of a look-up that was given up, while the next one still runs.
void WindowsResolver::Take() {
  if (!shared_) return;
  std::vector<SocketAddress> addresses;
  {
    const std::lock_guard guard(shared_->lock);
    if (!shared_->done) return;
    addresses = std::move(shared_->addresses);
  }
  shared_ = nullptr;
  // The object may end in it.
  const Taker taker = std::exchange(taker_, nullptr);
  taker(std::move(addresses));
}

}  // namespace tarnwick
