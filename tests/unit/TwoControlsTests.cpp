// A list and a page of thumbnails on one account: what one of them does reaches the other.
#include "controls/listimage/ctrlListImage.h"
#include "controls/thumbnailview/ctrlThumbNailView.h"
#include "fakes/FakeListView.h"
#include "fakes/FakeThumbnailPage.h"
#include "unit/ControlFixture.h"

namespace tarnwick {
namespace {

class TwoControlsTest : public ControlTest {
 protected:
  TwoControlsTest() {
    fake.pump.onYield = nullptr;
    uploader.script = Upload;
    account = {{"a.gif", "11"}, {"b.gif", "11"}, {"c.gif", "11"}};
    EXPECT_TRUE(list.Init(u"*"));
    for (const char* name : {"a.gif", "b.gif", "c.gif", "new.jpg"})
      fake.files.files[CopyOf(name)] = {kGif.size(), 0, kGif};
    fake.files.files[u"C:\\new.jpg"] = {kGif.size(), 0, "GIF89a-new-"};
    log.clear();
  }
  FakeListView view{log};
  ctrlListImage list{parts, view};
  // A control has transfer components of its own.
  FakeUploader pageUploader{log, fake.files};
  FakeDownloader pageDownloader{log, fake.files};
  FakeThumbnailPage page{log};
  std::unique_ptr<ctrlThumbNailView> thumbnails = std::make_unique<ctrlThumbNailView>(
      ControlParts{fake.apartment, host, pageUploader, pageDownloader}, page);
};

TEST_F(TwoControlsTest, ThumbnailsEndThenUploadThenInit) {
  EXPECT_TRUE(thumbnails->Init(u"*"));
  EXPECT_TRUE(list.mobjFileupload->ListIsCurrent()) << "the page has listed the same account";
  fake.apartment.listing.isCurrent = false;
  EXPECT_TRUE(list.Init(u"*"));
  EXPECT_TRUE(fake.apartment.listing.isLoaded) << "nor need the page list what the list has listed";
  thumbnails.reset();
  EXPECT_TRUE(list.UploadImage(u"C:\\new.jpg"));
  EXPECT_EQ(Records(), "new.jpg,");
  EXPECT_FALSE(list.mobjFileupload->ListIsCurrent());
  account.push_back({"new.jpg", "11"});
  EXPECT_TRUE(list.Init(u"*"));
  EXPECT_EQ(Records(), "a.gif,b.gif,c.gif,new.jpg,");
}

// The list has listed anew, so the page shows records of an older listing.
TEST_F(TwoControlsTest, AnUploadTakesThePlaceOfAnOlderRecord) {
  EXPECT_TRUE(thumbnails->Init(u"*"));
  fake.apartment.listing.isCurrent = false;
  EXPECT_TRUE(list.Init(u"*"));
  fake.files.files[u"C:\\b.gif"] = {kGif.size(), 0, kGif};
  pageUploader.script = Upload;
  replies["FileUploadRequest"] = "FileURL=http://h/u/b.gif";
  EXPECT_TRUE(thumbnails->UploadImage(u"C:\\b.gif"));
  EXPECT_EQ(page.Look(), "a.gif b.gif* c.gif ");
  EXPECT_EQ(fake.apartment.listing.shown.At(2), fake.apartment.listing.all.At(2));
}

// What the page is fetching is changed by the list meanwhile; the bytes on their way are the old ones.
TEST_F(TwoControlsTest, ChangesOvertakeAFetch) {
  replies["FileUploadRequest"] = "FileURL=http://h/u/b.gif";
  fake.files.files[u"C:\\b.gif"] = {kGif.size(), 0, "GIF89a-new-"};
  const std::string uploaded = "GIF89a-new-";
  const std::string fetched = kGif;
  const struct {
    const char* name;
    std::function<void()> change;
    const char* asked;  // by the page, in all
    const char* look;
    std::string copyOfB;
    std::string copyOfZ;
  } kCases[] = {
      {"upload", [this] { EXPECT_TRUE(list.UploadImage(u"C:\\b.gif")); }, "b.gif ", "a.gif* b.gif c.gif ",
       uploaded, ""},
      {"rename", [this] { EXPECT_TRUE(list.RenameFile(u"b.gif", u"z.gif")); }, "b.gif z.gif ",
       "a.gif* z.gif c.gif ", "", fetched},
      {"delete",
       [this] {
         view.selected = {false, true, false};
         account.erase(account.begin() + 1);
         list.DeleteFile();
       },
       "b.gif ", "a.gif* b.gif! c.gif ", "", ""},
  };
  const auto bytesOf = [this](const std::string& name) {
    const auto copy = fake.files.files.find(CopyOf(name));
    return copy == fake.files.files.end() ? "" : copy->second.bytes;
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.name);
    account = {{"a.gif", "11"}, {"b.gif", "11"}, {"c.gif", "11"}};
    fake.apartment.listing.Forget();
    EXPECT_TRUE(list.Init(u"*"));
    fake.apartment.listing.isLoaded = true;
    fake.files.files.erase(CopyOf("b.gif"));
    fake.files.files.erase(CopyOf("z.gif"));
    std::string asked;
    const auto fetch = [&](FakeDownloader& from) {
      const Text name = from.url.substr(from.url.rfind(u'/') + 1);
      const Text copy = CopyOf(Utf8FromText(name));
      const std::uint32_t changes = fake.apartment.ChangesOfCopy(copy);
      asked += Utf8FromText(name) + " ";
      if (asked == "b.gif ") test.change();
      // As the real one does.
      const bool keeps = fake.apartment.ChangesOfCopy(copy) == changes;
      if (keeps) fake.files.files[copy] = {fetched.size(), 0, fetched};
      from.events->Finished(keeps);
    };
    pageDownloader.waits = {fetch, fetch};
    EXPECT_TRUE(thumbnails->Init(u"*"));
    EXPECT_EQ(asked, test.asked);
    EXPECT_EQ(page.Look(), test.look);
    EXPECT_EQ(thumbnails->m_LastError, ftp_error::kSuccess);
    EXPECT_EQ(bytesOf("b.gif"), test.copyOfB);
    EXPECT_EQ(bytesOf("z.gif"), test.copyOfZ);
  }
}

}  // namespace
}  // namespace tarnwick
