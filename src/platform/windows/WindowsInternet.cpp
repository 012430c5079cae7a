#include "platform/windows/WindowsInternet.h"

#include <algorithm>
#include <array>
#include <string>
#include <utility>

#include "base/Secret.h"
#include "platform/HttpTransport.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/InternetOwner.h"
#include "platform/windows/StagedFile.h"

namespace tarnwick {
namespace {

// 255 characters with their terminator, as hosts know the current folder.
constexpr DWORD kDirectoryRoom = 255;

// ANSI form of what goes into a command line. nullopt as well for a control character, which could end the
// line and begin another command.
std::optional<std::string> Argument(TextView text) {
  if (std::any_of(text.begin(), text.end(), [](char16_t unit) { return unit < 0x20 || unit == 0x7F; }))
    return std::nullopt;
  return AnsiFromText(text);
}

class WindowsFtpConnection : public FtpConnection {
 public:
  explicit WindowsFtpConnection(InternetOwner connection) : connection_(std::move(connection)) {}

  bool SetDirectory(TextView path) override {
    const auto ansiPath = Argument(path);
    return ansiPath && FtpSetCurrentDirectoryA(connection_.Get(), ansiPath->c_str());
  }

  std::optional<Text> Directory() override {
    std::array<char, kDirectoryRoom> path{};
    DWORD size = kDirectoryRoom;
    if (!FtpGetCurrentDirectoryA(connection_.Get(), path.data(), &size)) return std::nullopt;
    // Up to the terminator: Wine and Windows differ in whether the returned size counts it.
    return TextFromAnsi({path.data(), std::find(path.begin(), path.end(), '\0')});
  }

  bool GetFile(TextView serverFile, TextView localFile) override {
    const auto ansiServerFile = Argument(serverFile);
    // The code page must hold the target although the call gets another name of its folder: a fetch must not
    // succeed or fail by where its temporary name happens to be.
    if (!ansiServerFile || ansiServerFile->empty() || !Argument(localFile)) return false;
    StagedFile staged(WideFromText(localFile));
    staged.Close();
    const auto ansiStaged = AnsiFromText(TextFromWide(staged.Path()));
    if (!ansiStaged || ansiStaged->empty()) return false;
    return FtpGetFileA(connection_.Get(), ansiServerFile->c_str(), ansiStaged->c_str(), FALSE, 0,
                       FTP_TRANSFER_TYPE_BINARY, 0) &&
           staged.Commit();
  }

  bool Command(TextView command) override {
    const auto ansiCommand = Argument(command);
    return ansiCommand &&
           FtpCommandA(connection_.Get(), FALSE, FTP_TRANSFER_TYPE_ASCII, ansiCommand->c_str(), 0, nullptr);
  }

 private:
  InternetOwner connection_;
};

class WindowsInternetSession : public InternetSession {
 public:
  explicit WindowsInternetSession(InternetOwner session) : session_(std::move(session)) {}

  std::unique_ptr<FtpConnection> ConnectFtp(TextView host, std::uint16_t port, TextView userName,
                                            TextView password) override {
    const auto ansiHost = Argument(host);
    const auto ansiUser = Argument(userName);
    auto ansiPassword = Argument(password);
    if (!ansiHost || ansiHost->empty() || !ansiUser || !ansiPassword) return nullptr;
    InternetOwner connection(InternetConnectA(session_.Get(), ansiHost->c_str(), port, ansiUser->c_str(),
                                              ansiPassword->c_str(), INTERNET_SERVICE_FTP, 0, 0));
    Wipe(*ansiPassword);
    if (!connection) return nullptr;
    return std::make_unique<WindowsFtpConnection>(std::move(connection));
  }

 private:
  InternetOwner session_;
};

}  // namespace

std::unique_ptr<InternetSession> WindowsInternet::Open(TextView agent) {
  const auto ansiAgent = Argument(agent);
  if (!ansiAgent) return nullptr;
  InternetOwner session(InternetOpenA(ansiAgent->c_str(), INTERNET_OPEN_TYPE_DIRECT, nullptr, nullptr, 0));
  if (!session) return nullptr;
  SetTimeouts(session.Get(), kConnectTimeoutMs, kSilenceTimeoutMs);
  return std::make_unique<WindowsInternetSession>(std::move(session));
}

}  // namespace tarnwick
