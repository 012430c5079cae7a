#include "platform/windows/UserProxy.h"

#include <vector>

#include "platform/windows/InternetHeaders.h"

namespace tarnwick {

std::wstring ProxyOf(std::wstring_view list, std::wstring_view scheme) {
  constexpr std::wstring_view kSeparators = L"; \t";
  std::wstring forAll;
  for (std::size_t at = 0; (at = list.find_first_not_of(kSeparators, at)) != std::wstring_view::npos;) {
    const std::wstring entry(list.substr(at, list.find_first_of(kSeparators, at) - at));
    at += entry.size();
    const std::size_t equals = entry.find(L'=');
    if (equals == std::wstring::npos && forAll.empty()) forAll = entry;
    if (equals == scheme.size() && _wcsnicmp(entry.c_str(), scheme.data(), equals) == 0)
      return entry.substr(equals + 1);
  }
  return forAll;
}

UserProxy GetUserProxy(std::wstring_view scheme) {
  // The texts follow the structure.
  std::vector<INTERNET_PROXY_INFO> info(64);
  for (int tries = 0; tries < 2; ++tries) {
    auto size = static_cast<DWORD>(info.size() * sizeof info.front());
    if (InternetQueryOptionW(nullptr, INTERNET_OPTION_PROXY, info.data(), &size)) {
      UserProxy proxy;
      // Wide in this call, whatever the structure declares.
      const auto* const server = reinterpret_cast<const wchar_t*>(info[0].lpszProxy);
      const auto* const bypass = reinterpret_cast<const wchar_t*>(info[0].lpszProxyBypass);
      if (info[0].dwAccessType != INTERNET_OPEN_TYPE_PROXY || !server) return proxy;
      proxy.server = ProxyOf(server, scheme);
      if (bypass) proxy.bypass = bypass;
      return proxy;
    }
    info.resize(size / sizeof info.front() + 1);
  }
  return {};
}

}  // namespace tarnwick
