// The list control and servers with faults: pictures of which each has one of its own while the listing is
// whole, and servers over TLS that are not safe.
#include "Form.h"

#include <fstream>

namespace tarnwick::test {
namespace {

// What all faulty pictures are, but the one that is sent byte by byte: that has only the first ones.
constexpr wchar_t kPicture[] = L"demo\\pictures\\rocket.jpg";
constexpr std::size_t kDripBytes = 300;

constexpr LONG kConnectAborted = 5;
constexpr LONG kSuccess = 32;
constexpr LONG kStopped = 45;
constexpr LONG kTimeout = 58;

LONG LastError(const Form& form) {
  FtpErrors error = {};
  form.list->get_m_LastError(&error);
  return static_cast<LONG>(error);
}

std::wstring LastReason(const Form& form) {
  Bstr reason;
  form.list->get_m_strLastErrorDesc(reason.Receive());
  return reason.Text();
}

// A download over the file of an earlier one, of which `left` is there then.
void ExpectDownload(Form& form, const std::wstring& name, const std::optional<std::string>& left, bool told) {
  CopyFileW(kPicture, name.c_str(), FALSE);
  EXPECT_EQ(form.Download(name.c_str()), L".\\" + name);
  EXPECT_TRUE(Contents(name) == left);
  EXPECT_EQ(form.events, told ? Lines{L"5555 "} : Lines());
  DeleteFileW(name.c_str());
}

TEST(ListControl, LeavesWholeFilesOrNoneWhateverTheServerDoes) {
  Form form;
  form.Open(L"*", TheServer().faulty);
  const std::optional<std::string> picture = Contents(kPicture);
  ASSERT_TRUE(picture);
  const std::optional<std::string> absent;
  // Over TLS it counts whether the file is whole, because anybody can end a connection.
  const bool secure = TheServer().IsSecure();
  const struct {
    const wchar_t* name;
    std::optional<std::string> left;  // in the local file
    bool told = false;                // with 5555
    bool arrives = true;              // anything at all
  } rows[] = {
      {L"refuse.jpg", absent, true, false},
      {L"reset-body.jpg", absent, true},
      // In the clear an orderly close ends the picture, whatever was said about it before.
      {L"cut.jpg", secure ? absent : picture->substr(0, picture->size() / 2), secure},
      {L"empty.jpg", ""},
      {L"length-999999.jpg", secure ? absent : picture, secure},
      {L"status-404.jpg", picture},
      {L"drip-2.jpg", picture->substr(0, kDripBytes)},
      // Names that need care on the way.
      {L"Bl\u00FCmchen.gif", Contents(L"demo\\pictures\\Bl\u00FCmchen.gif")},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.name);
    ExpectDownload(form, row.name, row.left, row.told);
    // The end of a connection may overtake what was sent before it and has to be deciphered.
    EXPECT_TRUE((secure && row.told) || form.progress.empty() != row.arrives);
    EXPECT_EQ(LastError(form) == kSuccess, !row.told);
    if (row.name == std::wstring(L"drip-2.jpg")) {
      // The head is no part of what is counted, and the host hears of the bytes as they come.
      EXPECT_GT(form.progress.size(), 20U);
      EXPECT_EQ(form.progress.back(), static_cast<int>(kDripBytes));
    }
  }
}

int ticks = 0;
void CALLBACK CountTick(HWND, UINT, UINT_PTR, DWORD) {
  ++ticks;
}

TEST(ListControl, GivesUpADownloadThatStalls) {
  if (Variable(L"TARNWICK_SLOW").empty()) GTEST_SKIP() << "takes 70 s, see scripts/test";
  const struct {
    std::wstring server;
    ULONGLONG seconds;
    Lines events;
  } rows[] = {{TheServer().faulty, 40, {}}, {Variable(L"TARNWICK_TLS_LISTING"), 20, {L"5555 "}}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.server);
    Form form;
    form.Open(L"*", row.server);
    form.Show();
    CopyFileW(kPicture, L"stall.jpg", FALSE);
    // The host's own window lives meanwhile.
    ticks = 0;
    SetTimer(form.frame, 1, 1000, CountTick);
    const ULONGLONG begin = GetTickCount64();
    EXPECT_EQ(form.Download(L"stall.jpg"), L".\\stall.jpg");
    const ULONGLONG time = GetTickCount64() - begin;
    KillTimer(form.frame, 1);
    EXPECT_GE(time, row.seconds * 1000 - 500);
    EXPECT_LE(time, row.seconds * 1000 + 4000);
    EXPECT_GE(static_cast<ULONGLONG>(ticks), row.seconds * 3 / 4);
    EXPECT_FALSE(Contents(L"stall.jpg"));
    EXPECT_EQ(form.events, row.events);
    EXPECT_EQ(LastError(form), kTimeout);
  }
  // A service request waits without messages.
  VARIANT_BOOL connected = VARIANT_TRUE;
  const ULONGLONG begin = GetTickCount64();
  NewClient()->ConnectToServer(Bstr(Variable(L"TARNWICK_TLS_STALL")), &connected);
  EXPECT_FALSE(connected);
  EXPECT_LE(GetTickCount64() - begin, 20'000U);
}

constexpr wchar_t kExpired[] = L"The server's certificate has expired or is not valid yet.";
constexpr wchar_t kOtherName[] = L"The server's certificate is made out for another name.";
constexpr wchar_t kUnknown[] =
    L"The server's certificate comes from an authority that this computer does not know.";

TEST(ListControl, SaysNothingToAnUnsafeServer) {
  const struct {
    const wchar_t* server;
    const wchar_t* reason;
  } rows[] = {{L"TARNWICK_TLS_EXPIRED", kExpired},
              {L"TARNWICK_TLS_WRONG_NAME", kOtherName},
              {L"TARNWICK_TLS_UNKNOWN", kUnknown},
              {L"TARNWICK_TLS_OLD", L"There is no secure connection to the server."}};
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.server);
    Form form;
    ComPtr<_CFileUpload> client;
    ASSERT_EQ(form.list->get_mobjFileupload(client.Receive()), S_OK);
    VARIANT_BOOL done = VARIANT_TRUE;
    client->ConnectToServer(Bstr(Variable(row.server)), &done);
    EXPECT_FALSE(done);
    IDispatch* files = nullptr;
    done = VARIANT_TRUE;
    client->ListFilesForUser(&files, &done);
    EXPECT_FALSE(done);
    ComPtr<IDispatch>::Adopt(files);

    const Bstr all(L"*");
    BSTR filter = all;
    EXPECT_EQ(static_cast<unsigned>(form.list->Init(&filter, &done)), 0x800A03ECU);
    EXPECT_EQ(LastDescription(), row.reason);
    EXPECT_EQ(LastError(form), kConnectAborted);
    EXPECT_EQ(LastReason(form), row.reason);
  }
}

TEST(ListControl, FetchesOnlyWhatIsSafeInASecureSession) {
  Form form;
  form.Open(L"*", Variable(L"TARNWICK_TLS_LISTING"));
  const std::optional<std::string> absent;
  const struct {
    const wchar_t* name;
    std::optional<std::string> left;  // in the local file
    LONG error;
    const wchar_t* reason;
  } rows[] = {
      {L"rose.jpg", Contents(L"demo\\pictures\\rose.jpg"), kSuccess, L""},
      {L"expired.jpg", absent, kConnectAborted, kExpired},
      {L"wrong_name.jpg", absent, kConnectAborted, kOtherName},
      {L"unknown.jpg", absent, kConnectAborted, kUnknown},
      // A server in the clear has it. What cannot even begin leaves what was there.
      {L"coffee.jpg", Contents(kPicture), kStopped,
       L"The file's address is not a secure one, as this session needs it."},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.name);
    ExpectDownload(form, row.name, row.left, row.error != kSuccess);
    EXPECT_EQ(LastError(form), row.error);
    EXPECT_EQ(LastReason(form), row.reason);
  }
}

TEST(ListControl, FetchesOverIpv6) {
  for (const wchar_t* name : {L"TARNWICK_IPV6", L"TARNWICK_TLS_IPV6"}) {
    SCOPED_TRACE(testing::Message() << name);
    const std::wstring server = Variable(name);
    if (server.empty()) GTEST_SKIP() << "this machine has no IPv6";
    Form form;
    form.Open(L"*", server);
    ExpectDownload(form, L"rose.jpg", Contents(L"demo\\pictures\\rose.jpg"), false);
  }
}

// In an event, of which the first comes before the first byte and others in the middle.
TEST(ListControl, StopsAnUploadWithoutATrace) {
  Form form;
  form.Open(L"*");
  form.Show();
  std::ofstream("stop test.jpg", std::ios::binary) << std::string(std::size_t{32} << 20, 'x');
  for (const bool closes : {false, true}) {
    for (const int at : {0, 40}) {
      SCOPED_TRACE(testing::Message() << closes << " at " << at);
      form.events.clear();
      form.progress.clear();
      int stoppedAt = -1;
      form.onEvent = [&](int) {
        // Not every percent is told.
        if (stoppedAt >= 0 || form.progress.empty() || form.progress.back() < at) return;
        stoppedAt = form.progress.back();
        if (closes)
          form.container->Close();
        else
          Call(Object(form.list.Get(), L"mobjFileupload").Get(), L"AbortFileTransfer", {VariantOf(LONG{1})});
      };
      const ULONGLONG begin = GetTickCount64();
      EXPECT_FALSE(form.Upload(L".\\stop test.jpg"));
      EXPECT_LT(GetTickCount64() - begin, 10'000U);
      EXPECT_TRUE(form.events.empty());
      EXPECT_EQ(form.progress.back(), stoppedAt);
      EXPECT_LT(stoppedAt, 100);
      EXPECT_EQ(LastError(form), kStopped);
      form.onEvent = nullptr;
      if (closes) {
        // Another container takes it up.
        using WayIn = ControlContainer::WayIn;
        ASSERT_EQ(form.container->TakeUp(*form.list, at == 0 ? WayIn::kSteps : WayIn::kQuickActivate), S_OK);
        form.Show();
      }
      // The server is asked again.
      form.Open(L"*");
      VARIANT_BOOL absent = VARIANT_FALSE;
      form.list->CheckIfFileDoesNotExist(Bstr(L"stop test.jpg"), &absent);
      EXPECT_TRUE(absent);
    }
  }
  DeleteFileW(L"stop test.jpg");
}

}  // namespace
}  // namespace tarnwick::test
