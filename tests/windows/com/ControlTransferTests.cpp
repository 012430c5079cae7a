// Downloads of the list control from a server on which each of some pictures has a fault of its own; the
// listing is whole.
#include "Form.h"

#include <fstream>

namespace tarnwick::test {
namespace {

// What all faulty pictures are, but the one that is sent byte by byte: that has only the first ones.
constexpr wchar_t kPicture[] = L"demo\\pictures\\rocket.jpg";
constexpr std::size_t kDripBytes = 300;

constexpr LONG kSuccess = 32;
constexpr LONG kStopped = 45;
constexpr LONG kTimeout = 58;

LONG LastError(const Form& form) {
  FtpErrors error = {};
  form.list->get_m_LastError(&error);
  return static_cast<LONG>(error);
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
    CopyFileW(kPicture, row.name, FALSE);  // of an earlier download
    EXPECT_EQ(form.Download(row.name), std::wstring(L".\\") + row.name);
    EXPECT_TRUE(Contents(row.name) == row.left);
    EXPECT_EQ(form.events, row.told ? Lines{L"5555 "} : Lines());
    // The end of a connection may overtake what was sent before it and has to be deciphered.
    EXPECT_TRUE((secure && row.told) || form.progress.empty() != row.arrives);
    EXPECT_EQ(LastError(form) == kSuccess, !row.told);
    if (row.name == std::wstring(L"drip-2.jpg")) {
      // The head is no part of what is counted, and the host hears of the bytes as they come.
      EXPECT_GT(form.progress.size(), 20U);
      EXPECT_EQ(form.progress.back(), static_cast<int>(kDripBytes));
    }
    DeleteFileW(row.name);
  }
}

int ticks = 0;
void CALLBACK CountTick(HWND, UINT, UINT_PTR, DWORD) {
  ++ticks;
}

TEST(ListControl, GivesUpADownloadThatStalls) {
  wchar_t slow[8] = L"";
  if (GetEnvironmentVariableW(L"TARNWICK_SLOW", slow, 8) == 0) GTEST_SKIP() << "takes 40 s, see scripts/test";
  Form form;
  form.Open(L"*", TheServer().faulty);
  form.Show();
  CopyFileW(kPicture, L"stall.jpg", FALSE);
  // The host's own window lives meanwhile.
  SetTimer(form.frame, 1, 1000, CountTick);
  const ULONGLONG begin = GetTickCount64();
  EXPECT_EQ(form.Download(L"stall.jpg"), L".\\stall.jpg");
  const ULONGLONG time = GetTickCount64() - begin;
  KillTimer(form.frame, 1);
  EXPECT_GE(time, 39'500U);
  EXPECT_LE(time, 44'000U);
  EXPECT_GE(ticks, 30);
  EXPECT_FALSE(Contents(L"stall.jpg"));
  EXPECT_TRUE(form.events.empty());
  EXPECT_EQ(LastError(form), kTimeout);
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
