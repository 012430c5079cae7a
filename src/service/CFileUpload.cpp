// Construction, the exchange that all operations use, session and FTP connection. The operations on files and
// on accounts are in CFileUploadFiles.cpp and CFileUploadAccounts.cpp.
#include "service/CFileUpload.h"

#include <algorithm>
#include <array>

#include "base/RuntimeError.h"
#include "platform/Internet.h"
#include "service/Log.h"
#include "service/modEnctyption.h"
#include "session/ProxySettings.h"
#include "session/ResourceStrings.h"
#include "support/HttpAddress.h"

namespace tarnwick {
namespace {

constexpr TextView kServicePage = u"BVServicePage.asp";
constexpr TextView kServiceFolder = u"/bv/bin";
constexpr TextView kFtpAgent = u"FileUploadClient";
constexpr std::uint16_t kFtpPort = 21;

// The FTP session speaks to the session's server as the session's user. Over TLS there is none, and what the
// log-on before left for it goes.
void SetFtpLogon(FtpState& ftp, const SessionValues& session) {
  if (session.IsSecure()) {
    ftp.host.clear();
    ftp.userName.clear();
    ftp.password = {};
    return;
  }
  const auto address = SplitHttpAddress(session.serverName);
  ftp.host = address ? address->host : Text();
  ftp.port = kFtpPort;
  ftp.userName = session.userName;
  ftp.password = session.password;
}

void RewriteForProxy(FtpState& ftp) {
  const Text port = TextFromNumber(ftp.port);
  switch (ftp.proxyStyle) {
    case ProxyStyle::kUserAtHostColonPort:
      ftp.userName += u"@" + ftp.host + u":" + port;
      break;
    case ProxyStyle::kUserAtHostBlankPort:
      ftp.userName += u"@" + ftp.host + u" " + port;
      break;
  }
  ftp.host = ftp.proxyHost;
}

}  // namespace

CFileUpload::CFileUpload(Apartment& apartment) : apartment_(apartment), channel_(apartment.platform.http) {
  LoadResourceLibrary(apartment_);
  Log(u"");
  Log(u"Start Logging for ORV2 BV Component");
  Log(u"Logging ORV2 BV component for tracking Password reminder mailer error");
}

CFileUpload::~CFileUpload() {
  DisconnectFromServer();
}

Reply CFileUpload::Ask(TextView requestName, TextView clientAction,
                       std::initializer_list<Parameter> parameters, std::int32_t sendFlag) {
  Request request = HTTPServer::CreateXLLDFRequest(requestName, kServicePage);
  HTTPServer::AddParameter(request, u"ClientAction", Encipher(clientAction));
  for (const Parameter& parameter : parameters)
    HTTPServer::AddParameter(request, parameter.name, parameter.value);
  return channel_.SendRequest(request, ServerUrl(apartment_.session.serverName) + Text(kServiceFolder),
                              sendFlag);
}

Text CFileUpload::AskForText(TextView requestName, TextView clientAction,
                             std::initializer_list<Parameter> parameters, std::int32_t sendFlag,
                             TextView variable, TextView onFailure) {
  const Reply reply = Ask(requestName, clientAction, parameters, sendFlag);
  if (reply.ErrorOccured() == 1) return Text(onFailure);
  return reply.First(variable);
}

std::int32_t CFileUpload::AskForNumber(TextView requestName, TextView clientAction,
                                       std::initializer_list<Parameter> parameters, std::int32_t sendFlag,
                                       TextView variable, std::int32_t onFailure) {
  return NumberFromText(
      AskForText(requestName, clientAction, parameters, sendFlag, variable, TextFromNumber(onFailure)));
}

void CFileUpload::SetHTTPServer(TextView serverName) {
  serverName_ = serverName;
  apartment_.session.SetServer(serverName);
}

const std::shared_ptr<CUpload>& CFileUpload::GetUploadObject() {
  if (!uploadObject_) uploadObject_ = std::make_shared<CUpload>();
  return uploadObject_;
}

bool CFileUpload::ConnectToServer(TextView szServer) {
  return ResultAsItStood(false, [&](bool& connected) {
    apartment_.session.SetServer(szServer);
    connected = BooleanFromText(
        AskForText(u"EstablishConnection", u"EstablishConnection", {}, 0, u"EstablishConnection", u"FALSE"));
  });
}

bool CFileUpload::LogonAs(TextView ProductID, TextView Username, TextView Password, TextView MGUID) {
  SessionValues& session = apartment_.session;
  // Copies first: the arguments may be views of the very values that are replaced.
  Text previousUser = session.userName;
  Secret previousPassword = session.password;
  const bool loggedOn = ResultAsItStood(false, [&](bool& result) {
    const Text user(Username);
    const Secret password{Text(Password)};
    const Text product(ProductID);
    session.mguid = Text(MGUID);
    session.userName = user;
    session.password = password;
    session.productNumber = NumberFromText(ProductID);
    if (!AskForLogon(product)) return;
    session.loggedOn = !session.IsSecure();
    // What was listed may be another user's.
    apartment_.listing.Forget();
    // The folder is the previous user's until a control prepares this one's.
    if (user != previousUser) apartment_.UserFolderPath.clear();
    SetFtpLogon(apartment_.ftp, session);
    LookUpFtpProxy();
    result = true;
  });
  if (!loggedOn) {
    session.userName = std::move(previousUser);
    session.password = std::move(previousPassword);
  }
  return loggedOn;
}

bool CFileUpload::AskForLogon(const Text& product) {
  const SessionValues& session = apartment_.session;
  const Text status = AskForText(u"ValidationRequest", u"UserValidate",
                                 {{u"UserName", Encipher(session.userName)},
                                  {u"Password", Encipher(session.password)},
                                  {u"ProductID", Text(product)},
                                  {u"MGUID", Text(session.mguid)}},
                                 0, u"UserAuthenticationStatus", u"FALSE");
  return LowerCase(status) == u"true";
}

void CFileUpload::LookUpFtpProxy() {
  FtpState& ftp = apartment_.ftp;
  std::optional<FtpProxy> proxy = ReadFtpProxy(apartment_.platform.registry);
  ftp.useProxy = proxy.has_value();
  if (!proxy) return;
  ftp.proxyHost = std::move(proxy->host);
  ftp.proxyPort = std::move(proxy->port);
  // Once per log-on: the rewritten values must not be rewritten again.
  if (apartment_.session.loggedOn) RewriteForProxy(ftp);
  apartment_.session.loggedOn = false;
}

bool CFileUpload::OpenSession() {
  return ResultAsItStood(false, [&](bool& open) {
    FtpState& ftp = apartment_.ftp;
    if (ftp.connection || !ftp.secureFolder.empty()) DisconnectFromServer();
    if (apartment_.session.IsSecure()) {
      // FTP would send the password in clear text.
      if (!AskForLogon(SessionProduct())) return;
      const Text path = GetFileUploadPath();
      if (!path.empty())
        ftp.secureFolder = ServerUrl(apartment_.session.serverName) + ReplaceAll(path, u"\\", u"/");
      open = true;
      return;
    }
    ftp.internet = apartment_.platform.internet.Open(kFtpAgent);
    if (!ftp.internet) return;
    LookUpFtpProxy();
    ftp.connection = ftp.internet->ConnectFtp(ftp.host, ftp.useProxy ? std::uint16_t{0} : ftp.port,
                                              ftp.userName, ftp.password);
    ftp.connected = ftp.connection != nullptr;
    if (!ftp.connected) return;
    const Text directory = GetFileUploadPath();
    ftp.connected = ftp.connection->SetDirectory(directory);
    if (ftp.connected) ftp.directory = directory;
    open = true;
  });
}

void CFileUpload::DisconnectFromServer() {
  ResultAsItStood(0, [&](int&) {
    FtpState& ftp = apartment_.ftp;
    if (ftp.connection) ftp.connection->Command(u"QUIT");
    // Closed whether or not the server took the farewell: a dead connection must not keep its handles.
    ftp.connection.reset();
    ftp.internet.reset();
    ftp.secureFolder.clear();
    ftp.connected = false;
  });
}

Text CFileUpload::GetFileUploadPath() {
  return ResultAsItStood(Text(), [&](Text& path) {
    path =
        AskForText(u"PathFromRoot", u"PathFromRoot",
                   {{u"ProductID", SessionProduct()}, {u"Username", SessionUser()}}, 0, u"PathFromRoot", u"");
  });
}

Text CFileUpload::GetUserBasePath() {
  return ResultAsItStood(Text(), [&](Text& url) {
    const Text server = ServerUrl(apartment_.session.serverName);
    if (!server.empty()) url = server + ReplaceAll(GetFileUploadPath(), u"\\", u"/");
  });
}

Text CFileUpload::Encipher(TextView value) {
  return EnCodeString(Secret(EncryptParameter(value)));
}

Text CFileUpload::EnCodeString(TextView szString) {
  constexpr TextView kEscaped = u"%+#&";
  constexpr std::array<TextView, 4> kEscapes = {u"%25", u"%2B", u"%23", u"%26"};
  const auto count =
      std::ranges::count_if(szString, [&](char16_t unit) { return kEscaped.find(unit) != TextView::npos; });
  Text escaped;
  // All at once, because it may be a password: a text that grows leaves what it was behind.
  escaped.reserve(szString.size() + 2 * static_cast<std::size_t>(count));
  for (const char16_t unit : szString) {
    const std::size_t which = kEscaped.find(unit);
    if (which == TextView::npos)
      escaped.push_back(unit);
    else
      escaped.append(kEscapes[which]);
  }
  return escaped;
}

}  // namespace tarnwick
