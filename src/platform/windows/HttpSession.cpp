#include "platform/windows/HttpSession.h"

#include "platform/windows/UserProxy.h"

namespace tarnwick {
namespace {

// Takes over a text that the system has allocated.
std::wstring Taken(wchar_t* text) {
  const Owner<wchar_t*, GlobalFree> taken(text);
  return taken ? std::wstring(text) : std::wstring();
}

}  // namespace

HttpOwner OpenHttpSession(const std::wstring& url) {
  const auto open = [](DWORD access, const wchar_t* server, const wchar_t* bypass, DWORD flags) {
    return HttpOwner(WinHttpOpen(L"Tarnwick", access, server, bypass, flags));
  };
  const std::wstring scheme = url.substr(0, url.find(L':'));
  UserProxy proxy = GetUserProxy(scheme);
  WINHTTP_CURRENT_USER_IE_PROXY_CONFIG user = {};
  WinHttpGetIEProxyConfigForCurrentUser(&user);
  const std::wstring script = Taken(user.lpszAutoConfigUrl);
  const std::wstring known = Taken(user.lpszProxy);
  Taken(user.lpszProxyBypass);
  // Wine: auto-detection is reported as on, and no proxy, whatever is set. A proxy that only the user's
  // Internet settings name is taken as it stands there.
  if ((user.fAutoDetect || !script.empty()) && (proxy.server.empty() || !known.empty())) {
    if (HttpOwner found = open(WINHTTP_ACCESS_TYPE_AUTOMATIC_PROXY, nullptr, nullptr, WINHTTP_FLAG_ASYNC))
      return found;
    // Before Windows 8.1 it has to be asked for.
    WINHTTP_AUTOPROXY_OPTIONS options = {};
    if (user.fAutoDetect) {
      options.dwFlags |= WINHTTP_AUTOPROXY_AUTO_DETECT;
      options.dwAutoDetectFlags = WINHTTP_AUTO_DETECT_TYPE_DHCP | WINHTTP_AUTO_DETECT_TYPE_DNS_A;
    }
    if (!script.empty()) {
      options.dwFlags |= WINHTTP_AUTOPROXY_CONFIG_URL;
      options.lpszAutoConfigUrl = script.c_str();
    }
    WINHTTP_PROXY_INFO info = {};
    const HttpOwner asking = open(WINHTTP_ACCESS_TYPE_NO_PROXY, nullptr, nullptr, 0);
    if (WinHttpGetProxyForUrl(asking.Get(), url.c_str(), &options, &info)) {
      proxy.server = ProxyOf(Taken(info.lpszProxy), scheme);
      proxy.bypass = Taken(info.lpszProxyBypass);
    }
  }
  if (proxy.server.empty()) return open(WINHTTP_ACCESS_TYPE_NO_PROXY, nullptr, nullptr, WINHTTP_FLAG_ASYNC);
  return open(WINHTTP_ACCESS_TYPE_NAMED_PROXY, proxy.server.c_str(),
              proxy.bypass.empty() ? nullptr : proxy.bypass.c_str(), WINHTTP_FLAG_ASYNC);
}

}  // namespace tarnwick
