// The thumbnail control: pages, the fetching of their pictures, selection, renaming and the other operations.
#include "controls/thumbnailview/ctrlThumbNailView.h"

#include <cmath>

#include "base/RuntimeError.h"
#include "fakes/FakeThumbnailPage.h"
#include "transfer/AcceptorPages.h"
#include "unit/ControlFixture.h"

namespace tarnwick {
namespace {

class ThumbNailTest : public ControlTest {
 protected:
  ThumbNailTest() {
    fake.strings.own[487] = u"Click";
    fake.strings.own[488] = u"here";
    fake.strings.own[489] = u"for it";
    fake.pump.onYield = nullptr;
  }
  bool HasCopy(const std::string& name) const { return fake.files.files.contains(CopyOf(name)); }

  // The account has files of these names, of which each has its local copy.
  void List(const std::string& names, TextView filter = u"*") {
    account.clear();
    fake.files.files.clear();
    const Text all = *TextFromUtf8(names);
    for (const TextView name : Split(all, u' ')) {
      if (name.empty()) continue;
      account.push_back({Utf8FromText(name), std::to_string(kGif.size())});
      fake.files.files[CopyOf(account.back().name)] = {kGif.size(), 0, kGif};
    }
    fake.apartment.listing.isLoaded = false;
    EXPECT_TRUE(control.Init(filter));
    log.clear();
  }
  void ListNumbers(int count) {
    std::string names;
    for (int i = 1; i <= count; ++i) names += std::to_string(i) + ".gif ";
    List(names);
  }
  void Scroll(int value) {
    page.value = value;
    control.OnScrollChanged(value);
  }
  std::string Selected() const {
    return control.GetSelectedFilesHttpPath() ? Utf8FromText(*control.GetSelectedFilesHttpPath()) : "none";
  }
  std::string Shown() const { return NamesOf(fake.apartment.listing.shown); }
  // A download that arrives whole.
  void Arrives(FakeDownloader& from) {
    from.events->Received(11);
    fake.files.files[CopyOf(Utf8FromText(from.url.substr(from.url.rfind(u'/') + 1)))] = {kGif.size(), 0,
                                                                                         kGif};
    from.events->Finished(true);
  }
  std::function<void(FakeDownloader&)> Arrival() {
    return [this](FakeDownloader& from) { Arrives(from); };
  }
  // Fills the page; what happens while it waits for its pictures.
  void Fill(std::deque<std::function<void(FakeDownloader&)>> waits) {
    downloader.waits = std::move(waits);
    control.ChangeFileFilter(u"*");
  }
  std::string Validate(const std::string& name) {
    log.clear();
    Text text = *TextFromUtf8(name);
    control.ValidateFileName(text);
    return Events();
  }

  FakeThumbnailPage page{log};
  ctrlThumbNailView control{parts, page};
};

// --- Pages ---

TEST_F(ThumbNailTest, Pages) {
  const struct {
    int count;
    bool scrolls;
    int max;
    const char* first;
    const char* last;
    const char* place;
  } kCases[] = {
      {0, false, -4, "No pictures./Click here for it", "No pictures./Click here for it", ""},
      {1, false, -2, "1.gif* ", "1.gif* ", "1 of 1"},
      {4, false, 0, "1.gif* 2.gif 3.gif 4.gif ", "1.gif* 2.gif 3.gif 4.gif ", "1 to 4 of 4"},
      {5, true, 2, "1.gif* 2.gif 3.gif 4.gif ", "3.gif* 4.gif 5.gif ", "3 to 5 of 5"},
      {8, true, 4, "1.gif* 2.gif 3.gif 4.gif ", "5.gif* 6.gif 7.gif 8.gif ", "5 to 8 of 8"},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.count);
    ListNumbers(test.count);
    EXPECT_EQ(page.scrolls, test.scrolls);
    EXPECT_EQ(page.max, test.max);
    EXPECT_EQ(page.Look(), test.first);
    if (test.scrolls) Scroll(test.max);
    EXPECT_EQ(page.Look(), test.last);
    EXPECT_EQ(Utf8FromText(control.PlaceOfPage()), test.place);
    EXPECT_EQ(page.scrolls, test.scrolls);
    EXPECT_EQ(Events(), "");
  }
}

TEST_F(ThumbNailTest, PagingMovesTheSelection) {
  ListNumbers(9);
  control.OnSlotPressed(3, false);
  EXPECT_EQ(page.Look(), "1.gif 2.gif 3.gif* 4.gif ");
  EXPECT_EQ(control.iImgNo, 3);
  Scroll(2);
  EXPECT_EQ(page.Look(), "3.gif* 4.gif 5.gif 6.gif ");
  EXPECT_EQ(Selected(), AddressOf("3.gif"));
  Scroll(0);
  EXPECT_EQ(Selected(), AddressOf("1.gif"));
  // The thumb may stand between rows; at the top it shows nothing until it is let go.
  page.value = 5;
  control.OnScrollDragged(5);
  EXPECT_EQ(page.Look(), "6.gif* 7.gif 8.gif 9.gif ");
  control.OnScrollDragged(0);
  EXPECT_EQ(page.Look(), "6.gif* 7.gif 8.gif 9.gif ");
  // The handler of the thumb asks how many files there are in all.
  control.ChangeFileFilter(u"jpg");
  fake.apartment.listing.shown.Clear();
  control.OnScrollDragged(8);
  EXPECT_EQ(page.Look(), "No such pictures.");
  EXPECT_EQ(control.iImgNo, 0);
}

TEST_F(ThumbNailTest, PagingBackHidesThePageThatWasThere) {
  ListNumbers(8);
  const auto shows = [this](const char* missing, const std::function<void()>& action) {
    fake.files.files.erase(CopyOf(missing));
    bool shown = false;
    downloader.waits = {[&](FakeDownloader& from) {
      shown = page.At(1).shown;
      Arrives(from);
    }};
    action();
    return shown;
  };
  EXPECT_TRUE(shows("5.gif", [this] { Scroll(4); }));
  EXPECT_FALSE(shows("1.gif", [this] { Scroll(0); }));
  // From the first page, which the filter has shown.
  Scroll(4);
  control.ChangeFileFilter(u"*");
  EXPECT_TRUE(shows("3.gif", [this] { Scroll(2); }));
}

TEST_F(ThumbNailTest, FiltersByTheEndOfTheName) {
  List("a.GIF b.jpg c.jpeg d.png e.Jpg f", u"gif");
  EXPECT_EQ(Shown(), "a.GIF,");
  const std::size_t asked = fake.http.sent.size();
  for (const auto& [filter, shown] : {std::pair<TextView, const char*>{u"jpg", "b.jpg,e.Jpg,"},
                                      {u"*", "a.GIF,b.jpg,c.jpeg,d.png,e.Jpg,f,"},
                                      {u"GIF", ""}}) {
    control.ChangeFileFilter(filter);
    EXPECT_EQ(Shown(), shown);
  }
  EXPECT_EQ(page.Look(), "No such pictures.");
  EXPECT_EQ(control.iImgNo, 0);
  EXPECT_TRUE(control.Init(u"jpg"));
  EXPECT_EQ(page.Look(), "b.jpg* e.Jpg ");
  EXPECT_EQ(fake.http.sent.size(), asked) << "the listing is fetched once";
}

TEST_F(ThumbNailTest, ListsAgainAfterAFailure) {
  listingFails = true;
  fake.apartment.listing.isCurrent = true;
  EXPECT_FALSE(control.Init(u"*"));
  EXPECT_FALSE(fake.apartment.listing.isCurrent);
  EXPECT_EQ(control.m_LastError, ftp_error::kNotTaken);
  EXPECT_EQ(page.Look(), "") << "which does not say that the account is empty";
  listingFails = false;
  // Two files of one address: the half that was listed does not pass for the account.
  account = {{"a.gif", "1"}, {"a.gif", "1"}};
  EXPECT_FALSE(control.Init(u"*"));
  EXPECT_EQ(Records() + Shown(), "");
  List("a.gif");
  EXPECT_EQ(Shown(), "a.gif,");
  control.mobjFileupload = nullptr;
  fake.apartment.listing.isLoaded = false;
  EXPECT_FALSE(control.Init(u"*"));
}

// --- Places and captions ---

TEST(ThumbNail, FitsPicturesIntoTheSquare) {
  const struct {
    std::int32_t height, width;
    PicturePlace place;
  } kCases[] = {
      {200, 400, {150, 671.5, 1965, 982}},  // 982.5, rounded half to even
      {400, 200, {641.5, 180, 982, 1965}},
      {1, 1, {150, 180, 1965, 1965}},
      {1, 65535, {150, 1162.5, 1965, 0}},
  };
  for (const auto& test : kCases) {
    const PicturePlace place = FitImage(test.height, test.width);
    EXPECT_EQ(place, test.place);
    EXPECT_EQ(Turned(place), FitImage(test.width, test.height));
  }
  EXPECT_EQ(ErrorOf([] { FitImage(0, 0); }), 11);
  EXPECT_EQ(ErrorOf([] { FitImage(1100000, 1100000); }), 6);
}

TEST(ThumbNail, ShortensCaptions) {
  EXPECT_EQ(FormatLabelText(u"averyveryverylongname.jpeg"), u"averyveryvery...jpeg");
  EXPECT_EQ(FormatLabelText(u"exactly-twenty-c.jpg"), u"exactly-twenty-c.jpg");
  EXPECT_EQ(FormatLabelText(u"Tom & Jerry.jpg"), u"Tom && Jerry.jpg");
  EXPECT_EQ(FormatLabelText(u"0123456789&&&&&&&&&&&.gif"), u"0123456789&&&&&&....gif");

  // Tips say all; nothing in them turns the line or begins one.
  CUpload file;
  file.FileName = u"averyveryverylong & \u202Ename.jpeg";
  file.FileDate = u"3/1/2024\n1:02:03 PM";
  file.FileSize = 2560;
  EXPECT_EQ(FormatTip(file),
            u"averyveryverylong & \uFFFDname.jpeg\r\n2560 Bytes (2 KB)\r\n3/1/2024\uFFFD1:02:03 PM");
  file.FileDate = Text();
  file.FileSize = -1;
  EXPECT_EQ(FormatTip(file), u"averyveryverylong & \uFFFDname.jpeg");
}

// --- Fetching ---

TEST_F(ThumbNailTest, FetchesWhatIsMissing) {
  List("a.gif b&b.gif c.gif d.gif");
  fake.files.files.erase(CopyOf("b&b.gif"));
  fake.files.files.erase(CopyOf("d.gif"));
  downloader.waits = {Arrival(), [](FakeDownloader& from) { from.events->Failed(7, u"refused", true); }};
  control.ChangeFileFilter(u"*");
  ExpectLog({"caption 1 a.gif", "picture 1", "1234 1", "caption 2 Downloading b&&b.gif",
             "download http://h/u/b&b.gif to ", "9999 11", "watchdog stops", "caption 2 b&&b.gif",
             "picture 2", "caption 3 c.gif", "picture 3", "caption 4 Downloading d.gif",
             "download http://h/u/d.gif to ", "5555 ", "cancel", "watchdog stops", "caption 4 d.gif",
             "1234 -1"});
  EXPECT_EQ(page.Look(), "a.gif* b&&b.gif c.gif d.gif! ");
  EXPECT_EQ(control.NameOf(2), u"b&b.gif");
  EXPECT_FALSE(control.m_bTransferInProgress || control.gbConnectionFailed);
  EXPECT_EQ(page.At(2).place.top, 671.5);
}

TEST_F(ThumbNailTest, LeavesAnEmptySquareForWhatIsNoPicture) {
  List("b.gif nul.gif");
  fake.files.files[CopyOf("b.gif")].bytes.replace(6, 4, 4, '\0');
  control.ChangeFileFilter(u"*");
  EXPECT_EQ(page.Look(), "b.gif*! nul.gif! ") << "the last name is not safe as a local one";
  ExpectLog({"caption 1 b.gif", "picture 1 without a place", "caption 2 nul.gif"});
  control.OnPictureUnreadable(1);
  EXPECT_TRUE(HasCopy("b.gif")) << "its length is right: it is a file of another kind";

  // What came in place of a picture, or of a part of it, is not kept: the next page with it asks again.
  List("a.gif");
  fake.files.files.erase(CopyOf("a.gif"));
  for (const std::string part : {"<html>404</html>", "\x89PNG", "GIF8"}) {
    downloader.waits = {[&](FakeDownloader& from) {
      fake.files.files[CopyOf("a.gif")] = {part.size(), 0, part};
      from.events->Finished(true);
    }};
    control.ChangeFileFilter(u"*");
    EXPECT_TRUE(downloader.waits.empty());
    EXPECT_EQ(page.Look(), "a.gif*! ");
    EXPECT_FALSE(HasCopy("a.gif"));
  }
}

TEST_F(ThumbNailTest, FetchesACopyOfAnotherLengthOnceInAListing) {
  List("a.gif b.gif");
  const auto isAsked = [this] {
    log.clear();
    downloader.waits = {[](FakeDownloader& from) { from.events->Failed(7, u"refused", true); }};
    control.ChangeFileFilter(u"*");
    return downloader.waits.empty();
  };
  const auto otherLength = [this] { fake.files.files[CopyOf("a.gif")] = {kGif.size() + 1, 0, kGif + "x"}; };
  EXPECT_FALSE(isAsked());
  otherLength();
  EXPECT_TRUE(isAsked());
  EXPECT_EQ(page.Look(), "a.gif* b.gif ") << "what cannot be fetched is shown as it is";
  EXPECT_FALSE(isAsked());
  // Until it turns out to be no picture.
  control.OnPictureUnreadable(1);
  EXPECT_TRUE(isAsked());
  // What is not fetched after all is still owed: in the next listing, of a page that is replaced, or
  // filled while the host's own transfer has the socket.
  const std::function<void()> kInstead[] = {
      [&] {
        OnEvent("1234 1", [this] { control.ChangeFileFilter(u"none"); });
        control.ChangeFileFilter(u"*");
      },
      [&] {
        uploader.script = [this](UploadEvents&) { control.ChangeFileFilter(u"*"); };
        fake.files.files[u"C:\\new.jpg"] = {1, 0, "x"};
        downloader.waits = {[this](FakeDownloader&) { control.ChangeFileFilter(u"none"); }};
        control.UploadImage(u"C:\\new.jpg");
      },
  };
  for (const auto& instead : kInstead) {
    List("a.gif b.gif");
    otherLength();
    instead();
    host.onEvent = nullptr;
    EXPECT_TRUE(isAsked());
  }
  // A size that is too large to be told.
  List("a.gif b.gif");
  fake.apartment.listing.Change(fake.apartment.listing.all.At(1), [](CUpload& file) { file.FileSize = -1; });
  EXPECT_FALSE(isAsked());
}

TEST_F(ThumbNailTest, PagingReplacesTheFill) {
  ListNumbers(9);
  for (int i = 1; i <= 9; ++i) fake.files.files.erase(CopyOf(std::to_string(i) + ".gif"));
  // The second picture of a page is on its way when the user chooses one and turns the wheel twice: what was
  // in between is never asked for.
  downloader.waits = {Arrival(),
                      [this](FakeDownloader&) {
                        EXPECT_TRUE(page.scrolls);
                        control.OnSlotPressed(1, false);
                        EXPECT_EQ(page.Look(), "3.gif* Downloading 4.gif! ! ! ");
                        Scroll(4);
                        Scroll(6);
                      },
                      Arrival(), Arrival(), Arrival()};
  Scroll(2);
  EXPECT_EQ(page.Look(), "7.gif* 8.gif 9.gif ");
  EXPECT_EQ(page.value, 6);
  EXPECT_EQ(Events(),
            "1234 1,9999 11,1022 ,1015 " + AddressOf("3.gif") + ",9999 11,9999 11,9999 11,1234 -1,");
  EXPECT_FALSE(HasCopy("4.gif") || HasCopy("5.gif"));
  EXPECT_TRUE(page.scrolls);
  // So does filtering in the event that tells that it begins.
  log.clear();
  OnEvent("1234 1", [this] { control.ChangeFileFilter(u"none"); });
  control.ChangeFileFilter(u"*");
  EXPECT_EQ(Events(), "1234 1,1234 -1,");
  EXPECT_TRUE(std::ranges::none_of(log, [](const auto& line) { return line.starts_with("download"); }));
}

TEST_F(ThumbNailTest, RefusesTransfersOfTheHostWhileItFetches) {
  ListNumbers(1);
  fake.files.files.erase(CopyOf("1.gif"));
  const auto refused = [this] {
    EXPECT_FALSE(control.UploadImage(u"C:\\new.jpg"));
    EXPECT_EQ(control.m_LastError, ftp_error::kTransferInProgress);
    EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\x"), u"");
  };
  int begun = 0;
  host.onEvent = [&](const std::string& event) {
    if (event == "1234 1" || event == "9999 11") {
      ++begun;
      refused();
    }
  };
  Fill({Arrival()});
  EXPECT_EQ(begun, 2);
  EXPECT_EQ(page.Look(), "1.gif* ");
}

TEST_F(ThumbNailTest, FillsThePageAfterATransferOfTheHosts) {
  ListNumbers(6);
  fake.files.files.erase(CopyOf("6.gif"));
  downloader.waits = {[this](FakeDownloader& from) {
                        Scroll(2);
                        EXPECT_EQ(page.Look(), "3.gif* 4.gif 5.gif 6.gif! ");
                        Arrives(from);
                      },
                      Arrival()};
  control.DownLoadFileFromServer(u"C:\\x");
  EXPECT_EQ(page.Look(), "3.gif* 4.gif 5.gif 6.gif ");
  // Somebody else has logged on by then: these pictures have no place in his folder.
  fake.files.files.erase(CopyOf("1.gif"));
  downloader.waits = {[this](FakeDownloader& from) {
    Scroll(0);
    fake.apartment.listing.Forget();
    fake.apartment.session.userName = u"other";
    Arrives(from);
  }};
  control.DownLoadFileFromServer(u"C:\\x");
  EXPECT_EQ(page.Look(), "1.gif*! 2.gif! 3.gif! 4.gif! ");
}

TEST_F(ThumbNailTest, ClosingEndsTheWaitAndOpeningAllowsAnother) {
  ListNumbers(2);
  fake.files.files.erase(CopyOf("1.gif"));
  // Closed and opened again before the wait looks: it must end all the same.
  Fill({[this](FakeDownloader&) {
    control.Close();
    control.Open();
  }});
  EXPECT_EQ(page.Look(), "1.gif*! 2.gif ");
  Fill({Arrival()});
  EXPECT_EQ(page.Look(), "1.gif* 2.gif ");
  // In the event that tells that the fetching begins there is no wait yet.
  fake.files.files.erase(CopyOf("1.gif"));
  OnEvent("1234 1", [this] {
    EXPECT_EQ(page.At(2).tip.find("2.gif"), 0U) << "a screen reader asks before the picture is there";
    control.Close();
  });
  Fill({});
  EXPECT_EQ(control.m_strLastErrorDesc, u"The control was closed.");
}

TEST_F(ThumbNailTest, AStopEndsTheFetchingOfThePage) {
  ListNumbers(4);
  for (const char* name : {"1.gif", "2.gif", "3.gif"}) fake.files.files.erase(CopyOf(name));
  downloader.waits = {Arrival(),
                      [this](FakeDownloader&) { control.mobjFileupload->AbortFileTransfer(true); }};
  control.ChangeFileFilter(u"*");
  EXPECT_EQ(page.Look(), "1.gif* 2.gif! 3.gif! 4.gif ");
  EXPECT_EQ(Events(), "1234 1,9999 11,1234 -1,");
  EXPECT_EQ(control.m_strLastErrorDesc, u"The transfer was stopped.");
  // It ends that of a page which was asked for just before.
  Fill({[this](FakeDownloader&) {
    control.ChangeFileFilter(u"*");
    control.mobjFileupload->AbortFileTransfer(true);
  }});
  EXPECT_EQ(page.Look(), "1.gif* 2.gif! 3.gif! 4.gif ");
  EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
  // It does not end that of a page which is asked for afterwards.
  Fill({[this](FakeDownloader&) {
          control.mobjFileupload->AbortFileTransfer(true);
          control.ChangeFileFilter(u"*");
        },
        Arrival(), Arrival()});
  EXPECT_EQ(page.Look(), "1.gif* 2.gif 3.gif 4.gif ");
  EXPECT_EQ(control.m_LastError, ftp_error::kSuccess);
}

// --- What the user does ---

TEST_F(ThumbNailTest, APressTakesThePictureThatItsSlotWaitsFor) {
  ListNumbers(9);
  for (int i = 5; i <= 8; ++i) fake.files.files.erase(CopyOf(std::to_string(i) + ".gif"));
  downloader.waits = {[this](FakeDownloader& from) {
                        // While nothing is chosen, what looks selected is the first of this page.
                        EXPECT_EQ(Selected(), AddressOf("5.gif"));
                        EXPECT_TRUE(page.At(1).selected);
                        // The thumb stands at the top for a moment.
                        control.OnScrollDragged(0);
                        control.OnSlotPressed(3, true);
                        EXPECT_TRUE(page.At(3).selected);
                        control.DeleteFile();
                        Arrives(from);
                      },
                      Arrival(), Arrival(), Arrival()};
  Scroll(4);
  const std::string at = AddressOf("7.gif");
  EXPECT_TRUE(Events().starts_with("1234 1,1022 ,1015 " + at + ",1016 " + at + ",1001 ,")) << Events();
  EXPECT_EQ(Records(), "1.gif,2.gif,3.gif,4.gif,5.gif,6.gif,8.gif,9.gif,");
}

TEST_F(ThumbNailTest, SelectionIsOfTheListAndOfThePage) {
  // A new list without the selected picture.
  ListNumbers(4);
  control.OnSlotPressed(2, false);
  account.erase(account.begin() + 1);
  fake.apartment.listing.isLoaded = false;
  EXPECT_TRUE(control.Init(u"*"));
  EXPECT_EQ(page.Look(), "1.gif* 3.gif 4.gif ");
  // A rename of another picture.
  control.OnSlotPressed(2, false);
  EXPECT_TRUE(control.RenameFile(u"4.gif", u"x.gif"));
  EXPECT_EQ(page.Look(), "1.gif 3.gif* x.gif ");
  // A rename of what another listing has by now.
  const auto again = std::make_shared<CUpload>(*fake.apartment.listing.all.At(2));
  fake.apartment.listing.all.Remove(2);
  fake.apartment.listing.all.Insert(2, again);
  EXPECT_TRUE(control.RenameFile(u"3.gif", u"y.gif"));
  EXPECT_EQ(page.Look(), "1.gif y.gif* x.gif ");
  // The list gets shorter while the page is filled, by the hand of another control.
  ListNumbers(4);
  fake.files.files.erase(CopyOf("3.gif"));
  Fill({[this](FakeDownloader& from) {
    fake.apartment.listing.shown.Remove(2);
    control.OnSlotPressed(3, false);
    Arrives(from);
  }});
  EXPECT_EQ(Selected(), AddressOf("3.gif"));
  // An upload that the filter hides is no reason to keep the selection while pages change.
  ListNumbers(9);
  control.ChangeFileFilter(u"gif");
  uploader.script = Upload;
  fake.files.files[u"C:\\new.jpg"] = {1, 0, "x"};
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  Scroll(4);
  EXPECT_EQ(Selected(), AddressOf("5.gif"));
}

TEST_F(ThumbNailTest, AFillLeavesFocusAndEditorAlone) {
  ListNumbers(5);
  const auto focused = [this](const std::function<void()>& action) {
    page.focused = 0;
    action();
    return page.focused > 0;
  };
  const auto filter = [this] { control.ChangeFileFilter(u"*"); };
  EXPECT_TRUE(focused(filter));
  page.hasFocus = false;
  EXPECT_FALSE(focused(filter));
  EXPECT_TRUE(focused([this] { control.Init(u"*"); }));
  page.hasFocus = true;
  control.EnableRename(true);
  fake.files.files.erase(CopyOf("2.gif"));
  downloader.waits = {[this](FakeDownloader& from) {
    control.OnKeyDown(113);
    Arrives(from);
  }};
  page.focused = 0;
  Scroll(0);
  EXPECT_EQ(page.focused, 1) << "before the editor was there; later it would have ended the editing";
  EXPECT_EQ(page.editor, 1);
  // Nor does the same page, filled again; another picture in its place does.
  Scroll(0);
  EXPECT_EQ(page.editor, 1);
  Scroll(2);
  EXPECT_EQ(page.editor, 0);
  page.edited = u"renamed.gif";
  control.OnEditorEntered();
  EXPECT_EQ(Shown(), "1.gif,2.gif,3.gif,4.gif,5.gif,");
}

TEST_F(ThumbNailTest, KeysAndButtons) {
  ListNumbers(4);
  const std::string at = AddressOf("1.gif");
  const struct {
    const char* name;
    std::function<void()> action;
    std::string events;
  } kCases[] = {
      {"left", [&] { control.OnSlotPressed(1, false); }, "1022 ,1015 " + at + ","},
      {"right", [&] { control.OnSlotPressed(1, true); }, "1022 ,1015 " + at + ",1016 " + at + ","},
      {"right beside", [&] { control.OnBackgroundPressed(true); }, "1016 " + at + ","},
      {"delete", [&] { control.OnKeyDown(46); }, "1022 ,1015 " + at + ",2222 " + at + ","},
      {"F5", [&] { control.OnKeyDown(116); }, "7777 ,"},
      {"F2 while forbidden", [&] { control.OnKeyDown(113); }, ""},
      {"enter", [&] { control.OnKeyDown(13); }, "1022 ,1015 " + at + ",1024 " + at + ","},
      {"link", [&] { control.OnLinkClicked(); }, "1111 Show QST,"},
      {"button", [&] { control.OnSwitchView(); }, "5554 5554,"},
      {"files over it", [&] { control.OnFilesEnter(); }, "1020 " + at + ","},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.name);
    log.clear();
    test.action();
    EXPECT_EQ(Events(), test.events);
  }
}

TEST_F(ThumbNailTest, EditsTheNameInPlace) {
  ListNumbers(4);
  control.EnableRename(true);
  control.OnSlotPressed(2, false);
  log.clear();
  control.OnKeyDown(113);
  ExpectLog({"8888 ", "editor 2 2.gif"});
  page.edited = u"new & old.jpg";
  control.OnEditorEntered();
  EXPECT_EQ(log.front(), "caption 2 new && old.jpg") << "as it was edited, until it is renamed";
  EXPECT_EQ(Events(), "1031 ,");
  EXPECT_EQ(page.At(2).tip.find("new & old.gif"), 0U) << page.At(2).tip;
  EXPECT_EQ(page.Look(), "1.gif new && old.gif* 3.gif 4.gif ");
  EXPECT_EQ(Shown() + Records(), "1.gif,new & old.gif,3.gif,4.gif,1.gif,new & old.gif,3.gif,4.gif,");
  EXPECT_TRUE(HasCopy("new & old.gif") && !HasCopy("2.gif"));

  // The same name without its extension changes nothing, and is not what the caption says then.
  log.clear();
  control.OnKeyDown(113);
  page.edited = u"new & old";
  control.OnEditorEntered();
  // When it hides, the window tells that the focus has left it.
  control.OnEditorLeft();
  ExpectLog({"8888 ", "editor 2 new & old.gif", "caption 2 new && old", "editor hides",
             "caption 2 new && old.gif", "1031 "});

  // An upload on the same page takes the selection, and not the caption.
  control.OnKeyDown(113);
  control.UploadedFileSetFocus(u"4.gif");
  page.edited = u"new & old";
  control.OnEditorEntered();
  EXPECT_EQ(page.Look(), "1.gif new && old.gif 3.gif 4.gif* ");
  control.OnSlotPressed(2, false);
  // A refused character restores the caption; leaving the editor changes nothing.
  log.clear();
  control.OnKeyDown(113);
  page.edited = u"a#b.gif";
  control.OnEditorEntered();
  ExpectLog({"8888 ", "editor 2 new & old.gif", "1034 ", "caption 2 new && old.gif", "editor hides"});
  control.OnKeyDown(113);
  control.OnEditorLeft();
  control.OnEditorLeft();
  control.OnEditorEntered();
  ExpectLog({"8888 ", "editor 2 new & old.gif", "editor hides"});
  OnEvent("8888 ", [this] { control.Close(); });
  control.OnKeyDown(113);
  ExpectLog({"8888 ", "cancel"});
}

// A host calls the control while the editor is open, or while a page waits for its pictures.
TEST_F(ThumbNailTest, TakesCallsOfTheHostInBetween) {
  ListNumbers(8);
  control.EnableRename(true);
  control.OnKeyDown(113);
  EXPECT_EQ(Validate("x.gif"), "1031 ,");
  control.OnEditorLeft();
  EXPECT_EQ(std::ranges::count(log, "editor hides"), 1);
  EXPECT_EQ(page.Look(), "x.gif* 2.gif 3.gif 4.gif ");

  // The file that is asked for during the fill of another page is the selected one.
  fake.files.files.erase(CopyOf("5.gif"));
  downloader.waits = {[&](FakeDownloader& from) {
    control.UploadedFileSetFocus(u"8.gif");
    Arrives(from);
  }};
  Scroll(2);
  EXPECT_EQ(page.Look(), "5.gif 6.gif 7.gif 8.gif* ");

  // Somebody logs on during the fill: the listing is not taken for the new user's.
  fake.files.files.erase(CopyOf("x.gif"));
  downloader.waits = {[&](FakeDownloader& from) {
    fake.apartment.listing.isLoaded = false;
    Arrives(from);
  }};
  EXPECT_TRUE(control.Init(u"*"));
  EXPECT_FALSE(fake.apartment.listing.isLoaded);

  // Without a selected picture there is nothing to rename, and nobody is asked to; an editor went with it.
  control.OnKeyDown(113);
  EXPECT_EQ(page.editor, 1);
  List("");
  EXPECT_EQ(Validate("y.gif"), "1033 ,");
}

TEST_F(ThumbNailTest, NamesThatAreRefusedOrTaken) {
  ListNumbers(3);
  for (const auto& [name, events] : {std::pair{"   ", "1035 ,"},
                                     {".gif", "1035 ,"},
                                     {"CON", "1035 ,"},
                                     {" 1.jpg ", "1031 ,"},
                                     {"1.GIF", "1031 ,"},
                                     {"2.GIF", "1032 ,"},
                                     {"3", "1032 ,"}}) {
    SCOPED_TRACE(name);
    EXPECT_EQ(Validate(name), events);
    EXPECT_EQ(page.Look(), "1.gif* 2.gif 3.gif ");
    for (const std::string& line : log) EXPECT_EQ(line.find("page rename"), std::string::npos);
  }
  EXPECT_EQ(Validate("console.gif"), "1031 ,") << "begins like a device, but is none";
  for (const auto& [number, error] : {std::pair{-2147220881, ftp_error::kNameNotAllowed},
                                      {-2147220880, ftp_error::kUnavailable},
                                      {acceptor::kUnspecified, ftp_error::kConnectionLost}}) {
    uploader.error = number;
    EXPECT_EQ(Validate("x.gif"), "1033 ,");
    EXPECT_EQ(control.m_LastError, error);
  }
  EXPECT_EQ(page.Look(), "console.gif* 2.gif 3.gif ");
  uploader.noMemory = true;
  EXPECT_EQ(Validate("x.gif"), "1033 ,");
  EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
  uploader.noMemory = false;
  uploader.error = 0;
  EXPECT_EQ(Validate("3.gif"), "1032 ,");
  EXPECT_EQ(control.m_strLastErrorDesc, u"The account has a file of that name.");
  EXPECT_EQ(Heard([&] { EXPECT_TRUE(control.RenameFile(u"2.gif", u" y.gif ")); }), "1031 y.gif,");
  EXPECT_EQ(page.Look(), "console.gif* y.gif 3.gif ");
}

// --- Operations ---

TEST_F(ThumbNailTest, DeletesTheSelectedPicture) {
  ListNumbers(5);
  Scroll(2);
  control.OnSlotPressed(3, false);
  log.clear();
  bool again = true;
  fake.pump.onYield = [&] {
    if (std::exchange(again, false)) control.DeleteFile();
  };
  control.DeleteFile();
  fake.pump.onYield = nullptr;
  EXPECT_EQ(Events(), "1001 ,1022 ,1015 " + AddressOf("1.gif") + ",") << "the page went with its last row";
  EXPECT_EQ(page.Look(), "1.gif* 2.gif 3.gif 4.gif ");
  EXPECT_EQ(Shown() + Records(), "1.gif,2.gif,3.gif,4.gif,1.gif,2.gif,3.gif,4.gif,");
  EXPECT_FALSE(HasCopy("5.gif"));

  log.clear();
  fake.apartment.session.userName = u"other";
  control.DeleteFile();
  Text name = u"z.gif";
  control.ValidateFileName(name);
  EXPECT_EQ(Events(), "1002 ,1033 ,") << "the pictures are another user's";
  EXPECT_EQ(control.m_LastError, ftp_error::kNotLoggedOn);
  fake.apartment.session.userName = u"u@x";

  log.clear();
  replies["DeleteFileRequest"] = "DeleteStatus=FALSE";
  control.DeleteFile();
  EXPECT_EQ(Events(), "");
  EXPECT_TRUE(HasCopy("1.gif"));
  replies["DeleteFileRequest"] = "DeleteStatus=TRUE";
  OnEvent("1001 ", [this] { control.Close(); });
  control.DeleteFile();
  EXPECT_EQ(Events(), "1001 ,");
  host.onEvent = nullptr;
  control.Open();
  control.ChangeFileFilter(u"*");
  for (int i = 0; i < 3; ++i) control.DeleteFile();
  EXPECT_EQ(page.Look(), "No pictures./Click here for it");
  EXPECT_EQ(Heard([&] { control.DeleteFile(); }), "1002 ,");
}

TEST_F(ThumbNailTest, ShowsWhatWasUploaded) {
  ListNumbers(6);
  uploader.script = Upload;
  fake.files.files[u"C:\\new.jpg"] = {kGif.size(), 0, kGif};
  EXPECT_EQ(Heard([&] { EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg")); }),
            "9999 0,9999 50,9999 100,1015 " + AddressOf("new.jpg") + ",");
  EXPECT_EQ(page.Look(), "5.gif 6.gif new.jpg* ");
  EXPECT_EQ(page.value, 4);
  // It stays selected while pages change; where it is not on the page the first slot looks selected.
  Scroll(0);
  EXPECT_EQ(page.Look(), "1.gif* 2.gif 3.gif 4.gif ");
  EXPECT_EQ(Selected(), AddressOf("new.jpg"));
  // Which is not the one that looks selected, so neither is changed.
  EXPECT_EQ(Heard([&] { control.DeleteFile(); }), "1002 ,");
  EXPECT_EQ(Validate("y.gif"), "1033 ,");
  EXPECT_EQ(control.m_LastError, ftp_error::kUnavailable);
  control.EnableRename(true);
  control.OnKeyDown(113);
  EXPECT_EQ(log.back(), "8888 ") << "there is no place for an editor";
  for (const TextView name : {u"2.gif", u"3.GIF"}) control.UploadedFileSetFocus(name);
  EXPECT_EQ(page.Look(), "1.gif 2.gif* 3.gif 4.gif ");
  Scroll(2);
  EXPECT_EQ(Selected(), AddressOf("3.gif")) << "another one was chosen meanwhile";

  // A picture replaces the one of its name.
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  EXPECT_EQ(fake.apartment.listing.shown.Count(), 7U);
}

TEST_F(ThumbNailTest, Drops) {
  struct Data : DragData {
  } data;
  std::int32_t effect = 1;
  const std::vector<Text> files{u"C:\\1.jpg", u"C:\\2.jpg"};
  const auto drop = [&](const std::vector<Text>& dropped) {
    log.clear();
    control.OnDrop(data, dropped, effect, {});
    return Events();
  };
  EXPECT_EQ(drop(files), "1023 C:\\1.jpg,1023 C:\\2.jpg,1023 ,");
  EXPECT_EQ(drop({}), "1021 ,");
  OnEvent("1023 C:\\1.jpg", [this] { control.mobjFileupload->AbortFileTransfer(true); });
  EXPECT_EQ(drop(files), "1023 C:\\1.jpg,1023 ,");
  EXPECT_FALSE(fake.apartment.abortTransfer);
  std::int32_t allowed = 1;
  control.OnStartDrag(data, allowed);
  OnEvent("OLEDragDrop 1 0", [&] { control.OnCompleteDrag(0); });
  EXPECT_EQ(drop(files), "1021 ,") << "a picture dropped on its own page is none to upload";
}

}  // namespace
}  // namespace tarnwick
