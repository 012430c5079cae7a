#include "session/ProxySettings.h"

#include "base/RuntimeError.h"
#include "session/Apartment.h"
#include "support/RegistryValues.h"

namespace tarnwick {
namespace {

constexpr TextView kInternetSettings =
    u"\\HKEY_CURRENT_USER\\Software\\Microsoft\\Windows\\CurrentVersion\\Internet Settings";
constexpr TextView kProxyEnable = u"ProxyEnable";
constexpr TextView kProxyServer = u"ProxyServer";

}  // namespace

Text GetProxySettings(Apartment& apartment) {
  const RegistryValues settings(apartment.platform.registry, kInternetSettings);
  const RegistryValues::Value enable = settings.Get(kProxyEnable);
  const bool enabled =
      (enable.type == RegistryType::kNumber && enable.number == 1) ||
      (enable.type == RegistryType::kBinary && (enable.text.starts_with(u'\1') || enable.text == u"1"));
  if (!enabled) return apartment.proxy.ProxyHost = {};

  const Text server = settings.Get(kProxyServer).text;
  apartment.proxy.ProxyServerSetting = server;
  const std::vector<TextView> pieces = Split(server, u':');
  apartment.proxy.ProxyHost = pieces[0];
  if (pieces.size() < 2) throw RuntimeError(error::kSubscriptOutOfRange);
  apartment.proxy.ProxyPort = pieces[1];
  return apartment.proxy.ProxyHost;
}

std::optional<FtpProxy> ReadFtpProxy(Registry& registry) {
  return ResultAsItStood(std::optional<FtpProxy>(), [&](std::optional<FtpProxy>& proxy) {
    const RegistryValues settings(registry, kInternetSettings);
    const RegistryValues::Value enable = settings.Get(kProxyEnable);
    const bool enabled = enable.type == RegistryType::kNumber
                             ? enable.number == 1
                             : enable.text == u"1" || enable.text.starts_with(u'\1');
    if (!enabled) return;

    const Text server = LowerCase(settings.Get(kProxyServer).text);
    TextView address = server;
    if (server.find(u"ftp") != Text::npos) {
      address = {};
      for (const TextView entry : Split(server, u';')) {
        const std::vector<TextView> sides = Split(entry, u'=');
        if (sides.size() == 2 && Trim(sides[0]) == u"ftp") address = Trim(sides[1]);
      }
    }
    const std::vector<TextView> pieces = Split(address, u':');
    if (pieces[0].empty()) return;
    proxy = FtpProxy{Text(pieces[0]), pieces.size() > 1 ? Text(pieces[1]) : Text()};
  });
}

}  // namespace tarnwick
