// The state that all objects of one thread apartment share. It is handed to constructors; nothing of it is a
// global of the core. Objects are apartment-threaded, so it needs no lock.
#pragma once

#include <cstdint>
#include <map>
#include <memory>

#include "base/Secret.h"
#include "base/Text.h"
#include "platform/Platform.h"
#include "session/Listing.h"
#include "session/SessionValues.h"
#include "support/ScrollHookState.h"

namespace tarnwick {

class FtpConnection;
class InternetSession;
class ResourceLibrary;

// How an FTP proxy learns the server behind it.
enum class ProxyStyle { kUserAtHostColonPort, kUserAtHostBlankPort };

struct FtpState {
  FtpState();
  ~FtpState();

  Text host;
  std::uint16_t port = 21;
  Text userName;
  Secret password;
  Text proxyHost;
  Text proxyPort;
  ProxyStyle proxyStyle = ProxyStyle::kUserAtHostColonPort;
  bool useProxy = false;
  // The connection is open and its directory is the user's folder.
  bool connected = false;
  Text directory;
  // Address of the user's folder while a session over TLS is open, which has no FTP connection; else empty.
  Text secureFolder;
  // The connection goes first when the state ends.
  std::unique_ptr<InternetSession> internet;
  std::unique_ptr<FtpConnection> connection;
};

// The browser's proxy for picture downloads.
struct ProxyValues {
  // Empty when no proxy is used.
  Text ProxyHost;
  Text ProxyPort;
  // The setting as it stood in the registry.
  Text ProxyServerSetting;
};

struct Apartment {
  explicit Apartment(const Platform& systemPlatform);
  ~Apartment();

  const Platform platform;
  SessionValues session;
  FtpState ftp;
  ProxyValues proxy;

  // Working folder of the user without a trailing separator; empty until it is prepared.
  Text UserFolderPath;

  Listing listing;

  // How often a local copy was made, moved or removed for an upload, a rename or a delete, by its path in
  // lower case. Bytes that were asked for before such a change are not the file's any more.
  std::map<Text, std::uint32_t> copyChanges;
  std::uint32_t ChangesOfCopy(TextView path) const {
    const auto changes = copyChanges.find(LowerCase(path));
    return changes == copyChanges.end() ? 0 : changes->second;
  }
  void CopyChanged(TextView path) { ++copyChanges[LowerCase(path)]; }

  bool abortTransfer = false;
  // How often transfers were told to stop. One that sees another number than at its beginning ends.
  std::uint32_t aborts = 0;
  // A drag that began in one of the controls is under way.
  bool dragIsOurs = false;

  ScrollHookState scrollHook;

  // The host product's strings, tried once; null when there are none.
  std::unique_ptr<ResourceLibrary> resourceLibrary;
  bool resourceLibraryTried = false;
};

}  // namespace tarnwick
