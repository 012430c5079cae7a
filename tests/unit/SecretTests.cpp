// That no password stays in memory. Every block that is freed while a test watches is searched.
#include "base/Secret.h"

#include <gtest/gtest.h>
#include <malloc.h>

#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "controls/listimage/ctrlListImage.h"
#include "fakes/FakeHost.h"
#include "fakes/FakeListView.h"
#include "fakes/FakePlatform.h"
#include "fakes/FakeTransfers.h"
#include "service/CFileUpload.h"
#include "service/modEnctyption.h"
#include "transfer/UploadObject.h"

#ifdef __SANITIZE_ADDRESS__
// GCC comes without the header that declares them.
extern "C" int __sanitizer_install_malloc_and_free_hooks(void (*allocated)(const volatile void*, std::size_t),
                                                         void (*freed)(const volatile void*));
extern "C" std::size_t __sanitizer_get_allocated_size(const volatile void* block);
#endif

namespace tarnwick {
namespace {

struct Pattern {
  std::string bytes;
  // Whether a request held it: else nobody would see that it is none.
  bool sent = false;
};

struct MemoryWatch {
  std::vector<Pattern> patterns;
  // Blocks that held one when they were freed.
  int found = 0;
  bool on = false;
  // What is freed is a double's, as the system's copies would be.
  bool elsewhere = false;
} watch;

bool HoldsPattern(const void* memory, std::size_t size) noexcept {
  const std::string_view bytes(static_cast<const char*>(memory), size);
  return std::ranges::any_of(watch.patterns, [&](const Pattern& pattern) {
    return bytes.find(pattern.bytes) != std::string_view::npos;
  });
}

void OnFree(void* block, std::size_t size) noexcept {
  if (!block) return;
  if (watch.on && !watch.elsewhere && HoldsPattern(block, size)) ++watch.found;
  // Memory that is not written when it is used again must not count for its next owner, not even what held
  // the patterns themselves while they were made. The tests are not optimised, so this stays.
  std::memset(block, 0, size);
}

// In all its forms. The end is what a shorter one that is written over it would leave, the beginning is what
// a text that grows leaves.
void LookFor(TextView password) {
  constexpr std::size_t kUnits = 6;
  for (const Text& form : {Text(password), EncryptParameter(password)}) {
    for (const Text& part : {form.substr(0, kUnits), form.substr(form.size() - kUnits)}) {
      ASSERT_EQ(part.find(u'#'), Text::npos) << "would be escaped";
      watch.patterns.push_back({std::string(reinterpret_cast<const char*>(part.data()), 2 * part.size())});
      watch.patterns.push_back({Utf8FromText(part)});
    }
  }
}

// Short ones lie inside the objects that hold them, long ones in blocks of their own.
constexpr TextView kShort = u"Ulmen7x";
constexpr TextView kLong = u"Rosmarin4Lindenblatt5Wacholderbeere";
constexpr TextView kRefused = u"Espenlaub4Weidenkorb";
constexpr TextView kKey = u"Haselnuss1Holunder";

// Takes all that it is asked for, but for the refused password, and keeps nothing.
struct ContentServer : HttpTransport {
  const std::string answer =
      "CanUploadFile=1001&DeleteStatus=TRUE&lRenameFileStatus=1001&UpdatePassword=1001"
      "&DeleteUser=1001&AddUser=1001&ValidUser=TRUE&SendMail=1001&UserFolder=f&MGUID=m"
      "&BasePath=b&FileName=a.jpg&FileURL=http%3A%2F%2Fh%2Fu%2Fa.jpg&FileSize=3"
      "&FileDate=d&UserAuthenticationStatus=TRUE&GetKey=" +
      Utf8FromText(kKey) + "&Password=" + Utf8FromText(kKey);
  const std::string refused = Utf8FromText(EncryptParameter(kRefused));

  int pages = 0;

  std::optional<HttpAnswer> Post(const HttpPost& post, std::size_t) override {
    watch.elsewhere = true;
    if (post.target.starts_with("/httpupload/")) ++pages;
    for (Pattern& pattern : watch.patterns)
      if (post.body.find(pattern.bytes) != std::string_view::npos) pattern.sent = true;
    const bool isRefused = post.body.find(refused) != std::string_view::npos;
    HttpAnswer whole{200, post.target.starts_with("/httpupload/") ? "ErrorNumber=0"
                          : isRefused                             ? "UserAuthenticationStatus=FALSE"
                                                                  : answer};
    watch.elsewhere = false;
    return whole;
  }
  std::optional<HttpAnswer> PostStream(const HttpPost& post, BodySource& source, std::size_t most) override {
    std::string body(static_cast<std::size_t>(source.Length()), '\0');
    body.resize(source.Read(body));
    source.Sent(body.size());
    HttpPost whole = post;
    whole.body = body;
    auto taken = Post(whole, most);
    std::ranges::fill(body, '\0');
    return taken;
  }
  std::optional<int> Get(const HttpGet&, std::uint64_t, const Sink&) override { return std::nullopt; }
  std::int32_t LastFailure() const override { return 0; }
};

TEST(Secrets, AreWipedWhenTheyEndAreReplacedOrGrow) {
  watch.patterns.clear();
  for (const TextView password : {kShort, kLong, kRefused, kKey}) LookFor(password);
  Text taken(kShort);
  // No std::move: what it was moved from is looked at, as memory.
  const Secret owner(static_cast<Text&&>(taken));
  EXPECT_FALSE(HoldsPattern(&taken, sizeof(Text))) << "what a secret was made of";
  FakePlatform fake;
  fake.registry.InternetSettings()[u"ProxyEnable"] = FakeRegistry::Number(0);
  fake.files.files[u"C:\\a.jpg"] = {3, 0, "abc"};
  ContentServer server;
  Transcript log;
  FakeHost host{log};
  FakeListView view{log};
  FakeDownloader downloader{log, fake.files};
  watch.found = 0;
  watch.on = true;
  auto apartment = std::make_unique<Apartment>(
      Platform{fake.registry, server, fake.internet, fake.files, fake.strings, fake.pump});
  const auto holdsNone = [&](const char* after) {
    EXPECT_EQ(watch.found, 0) << after;
    watch.found = 0;
  };
  {
    UploadObject uploader(apartment->platform);
    ctrlListImage control({*apartment, host, uploader, downloader}, view);
    const auto client = std::make_shared<CFileUpload>(*apartment);
    control.mobjFileupload = client;
    apartment->session.serverName = u"h";
    EXPECT_TRUE(client->LogonAs(u"7", u"anna", kLong, u""));
    holdsNone("log-on");
    EXPECT_TRUE(control.Init(u"*"));
    EXPECT_TRUE(control.UploadImage(u"C:\\a.jpg"));
    holdsNone("upload");
    EXPECT_TRUE(control.RenameFile(u"a.jpg", u"b.jpg"));
    view.Select(0, true);
    control.DeleteFile();
    holdsNone("rename and delete");
    EXPECT_EQ(client->ManagePassword(u"7", u"anna", kLong, kShort), 1001);
    holdsNone("change of password");
    EXPECT_FALSE(client->LogonAs(u"7", u"anna", kRefused, u""));
    EXPECT_EQ(TextView(apartment->session.password), kLong);
    EXPECT_TRUE(client->LogonAs(u"7", u"anna", kShort, u""));
    holdsNone("refused and second log-on");
    EXPECT_EQ(client->AddUser(u"7", u"berta", u""), u"m");
    EXPECT_FALSE(HoldsPattern(apartment.get(), sizeof *apartment)) << "the log-on is another one now";
    EXPECT_EQ(client->ActivateAccount(u"7", u"berta", kKey), u"m");
    Text key = client->GetKeyForUser(u"7", u"berta");
    EXPECT_EQ(key, kKey);
    Wipe(key);
    EXPECT_EQ(client->DeleteUser(u"7", u"berta", kKey), 1001);
    holdsNone("accounts");
    EXPECT_TRUE(client->LogonAs(u"7", u"anna", kShort, u""));
    apartment->session.serverName = u"https://h";
    EXPECT_TRUE(client->LogonAs(u"7", u"anna", kLong, u""));
    EXPECT_FALSE(HoldsPattern(apartment.get(), sizeof *apartment)) << "FTP is not used over TLS";
  }
  apartment.reset();
  holdsNone("end of the apartment");
  watch.on = false;
  EXPECT_EQ(server.pages, 5) << "three for the file, two for the folder of the account";
  // By password: two forms, two parts, two encodings.
  for (std::size_t i = 5; i < watch.patterns.size(); i += 8)
    EXPECT_TRUE(watch.patterns[i].sent) << "the enciphered form of password " << i / 8;
}

#ifdef __SANITIZE_ADDRESS__
const int hooked = __sanitizer_install_malloc_and_free_hooks([](const volatile void*, std::size_t) {},
                                                             [](const volatile void* block) {
                                                               OnFree(const_cast<void*>(block),
                                                                      __sanitizer_get_allocated_size(block));
                                                             });
#endif

}  // namespace
}  // namespace tarnwick

#ifndef __SANITIZE_ADDRESS__
// The library's own operator new takes its memory from malloc.
void operator delete(void* block) noexcept {
#ifdef _WIN32
  if (block) tarnwick::OnFree(block, _msize(block));
#else
  tarnwick::OnFree(block, malloc_usable_size(block));
#endif
  std::free(block);
}
void operator delete(void* block, std::size_t) noexcept {
  operator delete(block);
}
#endif
