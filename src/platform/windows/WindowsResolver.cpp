#include "platform/windows/WindowsResolver.h"

#include <ws2tcpip.h>

#include <mutex>
#include <utility>

#include "base/RuntimeError.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/ThreadPool.h"

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

  void Work();
};

void WindowsResolver::Shared::Work() {
  std::vector<SocketAddress> found =
      ResultAsItStood(std::vector<SocketAddress>(),
                      [&](std::vector<SocketAddress>& result) { result = AddressesOf(host, port); });
  const std::lock_guard guard(lock);
  addresses = std::move(found);
  done = true;
  if (window) PostMessageW(window, kLookedUp, 0, 0);
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
  if (RunOnPool([shared = shared_] { shared->Work(); })) return;
  shared_->done = true;
  PostMessageW(shared_->window, kLookedUp, 0, 0);
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
