#include "LoopbackServer.h"
// LoopbackServer.h comes first: see there.
#include <gtest/gtest.h>

#include <winhttp.h>

#include "platform/windows/UserProxy.h"
#include "platform/windows/WindowsHttpTransport.h"

namespace tarnwick {
namespace {

using End = LoopbackServer::End;

constexpr std::size_t kBound = 20;

std::optional<HttpAnswer> PostTo(std::uint16_t port, std::string target = "/", std::string_view body = "a=1",
                                 Text host = u"127.0.0.1") {
  // Short time-outs, so that the silent cases end soon.
  WindowsHttpTransport http(5000, 1000);
  HttpPost post;
  post.host = std::move(host);
  post.port = port;
  post.target = std::move(target);
  post.contentType = "application/x-www-form-urlencoded; charset=utf-8";
  post.body = body;
  return http.Post(post, kBound);
}

// Gets an answer over a connection that stays open, and in whatever the system keeps such ones.
bool KeepConnection(std::uint16_t port) {
  const HINTERNET session = WinHttpOpen(L"other", WINHTTP_ACCESS_TYPE_NO_PROXY, nullptr, nullptr, 0);
  const HINTERNET connection = WinHttpConnect(session, L"127.0.0.1", port, 0);
  const HINTERNET request = WinHttpOpenRequest(connection, L"GET", L"/", nullptr, nullptr, nullptr, 0);
  char body[2];
  DWORD read = 0;
  const bool done = WinHttpSendRequest(request, nullptr, 0, nullptr, 0, 0, 0) &&
                    WinHttpReceiveResponse(request, nullptr) &&
                    WinHttpReadData(request, body, sizeof body, &read) && read == sizeof body;
  for (const HINTERNET handle : {request, connection, session}) WinHttpCloseHandle(handle);
  return done;
}

TEST(WindowsHttpTransport, SendsWhatItWasGivenUnchanged) {
  // The printable characters, and escapes that a careless client would undo or redo.
  std::string target = "/a//b/c%20d%zz%2F%25/";
  for (char character = 0x21; character < 0x7F; ++character)
    if (character != '\\') target += character;  // which some versions of the system turn round
  target += "?Request=x&Flag=0&y=%2e?/%41";
  std::string body("a=1&b=\0\xFF\r\n\r\n", 12);
  body += std::string(100'000, 'x');
  LoopbackServer server({{"HTTP/1.1 200 OK\r\nContent-Length: 2\r\n\r\nok"}});
  const auto answer = PostTo(server.Port(), target, body);
  ASSERT_TRUE(answer);
  EXPECT_EQ(answer->status, 200);
  EXPECT_EQ(answer->body, "ok");

  ASSERT_EQ(server.Requests().size(), 1U);
  const std::string& request = server.Requests()[0];
  const std::size_t headEnd = request.find("\r\n\r\n");
  const std::string head = request.substr(0, headEnd + 2);
  EXPECT_EQ(head.substr(0, head.find("\r\n")), "POST " + target + " HTTP/1.1");
  EXPECT_EQ(request.substr(headEnd + 4), body);
  for (const std::string& line :
       {"Host: 127.0.0.1:" + std::to_string(server.Port()),
        std::string("Content-Type: application/x-www-form-urlencoded; charset=utf-8"),
        "Content-Length: " + std::to_string(body.size()), std::string("Connection: close")})
    EXPECT_NE(head.find("\r\n" + line + "\r\n"), std::string::npos) << line << " in\n" << head;
  EXPECT_EQ(head.find("Cookie"), std::string::npos);
}

TEST(WindowsHttpTransport, CollectsWholeAnswersOnly) {
  const struct {
    const char* name;
    const char* answer;  // after the protocol
    End end;
    int status;  // -1 when there is to be no answer
    const char* body;
  } kCases[] = {
      {"empty", " 200 OK\r\nConnection: close\r\nContent-Length: 0\r\n\r\n", End::kSilence, 200, ""},
      {"chunks",
       " 200 OK\r\nConnection: close\r\nTransfer-Encoding: "
       "chunked\r\n\r\n3\r\nabc\r\n2;x=y\r\nde\r\n0\r\n\r\n",
       End::kSilence, 200, "abcde"},
      {"cut chunk", " 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nabc", End::kClose, -1, ""},
      {"until the end", " 200 OK\r\n\r\nabc", End::kClose, 200, "abc"},
      {"redirect", " 302 Found\r\nLocation: /else\r\nContent-Length: 2\r\n\r\nto", End::kClose, 302, "to"},
      {"log-on wanted", " 401 No\r\nWWW-Authenticate: Basic realm=\"x\"\r\nContent-Length: 0\r\n\r\n",
       End::kClose, 401, ""},
      {"just the bound", " 200 OK\r\n\r\n12345678901234567890", End::kClose, 200, "12345678901234567890"},
      {"over the bound", " 200 OK\r\nContent-Length: 21\r\n\r\n", End::kSilence, -1, ""},
      {"over the bound, unannounced", " 200 OK\r\n\r\n123456789012345678901", End::kClose, -1, ""},
      {"cut body", " 200 OK\r\nContent-Length: 9\r\n\r\nabc", End::kClose, -1, ""},
      {"nothing", "", End::kClose, -1, ""},
      {"reset", "", End::kReset, -1, ""},
      {"silence in the body", " 200 OK\r\nContent-Length: 9\r\n\r\nabc", End::kSilence, -1, ""},
  };
  for (const auto& item : kCases) {
    SCOPED_TRACE(item.name);
    LoopbackServer server({{*item.answer ? std::string("HTTP/1.1") + item.answer : "", item.end}});
    const DWORD begin = GetTickCount();
    const auto answer = PostTo(server.Port());
    EXPECT_LT(GetTickCount() - begin, 20'000U);
    EXPECT_EQ(answer ? answer->status : -1, item.status);
    EXPECT_EQ(answer ? answer->body : "", item.body);
    // Neither a redirect followed nor a post sent again.
    EXPECT_EQ(server.Requests().size(), 1U);
  }
}

// Whatever the answers say, and although somebody else in the process keeps a connection to the server.
TEST(WindowsHttpTransport, HasAConnectionForEachPost) {
  const std::string version = "HTTP/1.1 200 OK\r\n";
  const std::string rest = "Content-Length: 2\r\n\r\nok";
  LoopbackServer server(
      {{version + rest, End::kSilence},
       {version + rest, End::kSilence},
       {version + "Connection: keep-alive\r\nKeep-Alive: timeout=60\r\n" + rest, End::kReset},
       {version + "Connection: keep-alive\r\n" + rest}});
  EXPECT_TRUE(KeepConnection(server.Port()));
  for (int i = 0; i < 3; ++i) {
    EXPECT_TRUE(PostTo(server.Port())) << i;
    Sleep(50);
  }
  ASSERT_EQ(server.Requests().size(), 4U);
  for (int i = 1; i < 4; ++i) EXPECT_EQ(server.Requests()[i].substr(0, 5), "POST ") << i;
}

TEST(WindowsHttpTransport, GoesThroughTheUsersProxy) {
  const struct {
    const wchar_t* list;
    const wchar_t* server;
  } lists[] = {{L"", L""},
               {L"a:1", L"a:1"},
               {L"http=a:1", L"a:1"},
               {L"a:1;HTTP=b:2 https=c:3", L"b:2"},
               {L"ftp=a:1;https=b:2", L""}};
  for (const auto& row : lists) EXPECT_EQ(ProxyOf(row.list, L"http"), row.server) << row.list;

  LoopbackServer server({{"HTTP/1.1 200 OK\r\nContent-Length: 2\r\n\r\nok"}});
  constexpr wchar_t kKey[] = L"Software\\Microsoft\\Windows\\CurrentVersion\\Internet Settings";
  const auto set = [&](DWORD enabled, const std::wstring& list) {
    RegSetKeyValueW(HKEY_CURRENT_USER, kKey, L"ProxyEnable", REG_DWORD, &enabled, sizeof enabled);
    RegSetKeyValueW(HKEY_CURRENT_USER, kKey, L"ProxyServer", REG_SZ, list.c_str(),
                    static_cast<DWORD>((list.size() + 1) * sizeof(wchar_t)));
  };
  set(1, L"ftp=127.0.0.1:1;http=127.0.0.1:" + std::to_wstring(server.Port()));
  EXPECT_TRUE(PostTo(8080, "/a?b", "a=1", u"pictures.invalid"));
  set(0, L"");
  EXPECT_TRUE(server.Requests().at(0).starts_with("POST http://pictures.invalid:8080/a?b HTTP/1.1\r\n"))
      << server.Requests()[0];
}

}  // namespace
}  // namespace tarnwick
