// Filling, filtering, selection, and what the user does with the list.
#include "unit/ListImageFixture.h"

#include "controls/FileNames.h"
#include "controls/listimage/DirectoryDate.h"

namespace tarnwick {
namespace {

TEST_F(ListImageTest, ListsTheAccount) {
  account = {{"a.jpg", "1536"}, {"b.GIF", "500"}};
  EXPECT_TRUE(control.Init(u"*"));
  ExpectLog({"ask ListFilesRequest Username=u@x&ProductID=7", "view list", "view columns", "view items 2"});
  EXPECT_EQ(view.columns, "filename=File Name;filepath=File Path;filesize=File Size;");
  EXPECT_EQ(view.label, u"No pictures.");
  EXPECT_EQ(control.ItemText(0, 0), u"a.jpg");
  EXPECT_EQ(control.ItemText(0, 1), u"http://h/u/a.jpg");
  EXPECT_EQ(control.ItemText(0, 2), u"1536 Bytes (2 KB)");
  EXPECT_EQ(control.ItemText(0, 3) + control.ItemText(2, 0), u"");
  EXPECT_EQ(fake.apartment.UserFolderPath, u"C:\\Temp\\bv\\u@x");
  EXPECT_TRUE(fake.apartment.listing.isCurrent);

  // While the listing is current nothing is asked.
  account.clear();
  EXPECT_TRUE(control.Init(u"*"));
  ExpectLog({"view list", "view columns", "view items 2"});
  fake.apartment.listing.isCurrent = false;
  EXPECT_TRUE(control.Init(u"*"));
  ExpectLog({"ask ListFilesRequest Username=u@x&ProductID=7", "view label", "view columns", "view items 0"});
  EXPECT_EQ(view.hint, u"") << "the label says it";
}

TEST_F(ListImageTest, FailingInitLeavesTheList) {
  List({{"a.jpg", "1"}});
  const auto failure = [&] { return ErrorOf([&] { control.Init(u"gif"); }); };
  fake.apartment.listing.isCurrent = false;
  listingFails = true;
  EXPECT_EQ(failure(), init_error::kListingFailed);
  EXPECT_FALSE(fake.apartment.listing.isCurrent);
  // A server that is not asked says nothing against its certificate.
  fake.http.failure = http_error::kCertificateName;
  for (const auto& [server, error] :
       {std::pair(u"https://h", ftp_error::kConnectAborted), std::pair(u"https://u@h", ftp_error::kNotTaken),
        std::pair(u"", ftp_error::kNotTaken)}) {
    fake.apartment.session.serverName = server;
    EXPECT_EQ(failure(), init_error::kListingFailed);
    EXPECT_EQ(control.m_LastError, error) << Utf8FromText(server);
  }
  control.mobjFileupload.reset();
  EXPECT_EQ(failure(), init_error::kNoClient);
  EXPECT_EQ(Names(), "a.jpg,");
}

TEST_F(ListImageTest, FiltersTwice) {
  // What Init and ChangeFileFilter show, and which of it with the picture of a GIF.
  const struct {
    TextView filter;
    const char* afterInit;
    const char* afterChange;
    const char* gifs;
  } kCases[] = {
      {u"*", "a.jpg,b.GIF,xgif,c.JPG,gi,", "a.jpg,b.GIF,xgif,c.JPG,gi,", "b.GIF,"},
      {u"jpg", "a.jpg,c.JPG,", "a.jpg,c.JPG,", ""},
      {u"GIF", "", "b.GIF,xgif,", "b.GIF,xgif,"},
      {u"", "", "a.jpg,b.GIF,xgif,c.JPG,gi,", "b.GIF,"},
  };
  List({{"a.jpg", "1"}, {"b.GIF", "1"}, {"xgif", "1"}, {"c.JPG", "1"}, {"gi", "1"}});
  for (const auto& test : kCases) {
    SCOPED_TRACE(Utf8FromText(test.filter));
    EXPECT_TRUE(control.Init(test.filter));
    EXPECT_EQ(Names(), test.afterInit);
    EXPECT_EQ(view.hint, Names().empty() ? u"No such pictures." : u"");
    control.ChangeFileFilter(test.filter);
    EXPECT_EQ(Names(), test.afterChange);
    EXPECT_EQ(view.hint, u"");
    std::string gifs;
    for (std::size_t i = 0; i < control.ItemCount(); ++i) {
      const ItemPicture picture = control.PictureOf(i);
      if (picture.large == 2 && picture.small == 4) gifs += Utf8FromText(control.ItemText(i, 0)) + ",";
      EXPECT_TRUE(picture.large == 2 || (picture.large == 4 && picture.small == 5));
    }
    EXPECT_EQ(gifs, test.gifs);
  }
}

TEST(ListImageNames, SizesRoundHalfToEven) {
  const struct {
    double bytes;
    const char* text;
    std::int32_t kilobytes;
  } kCases[] = {
      {512, "512", 0},
      {513, "513", 1},
      {1536, "1536", 2},
      {2560, "2560", 2},
      {-1536, "-1536", -2},
      {12.5, "12.5", 0},
      {1e14, "100000000000000", 2147483647},
      {1e300, "1E+300", 2147483647},
  };
  for (const auto& test : kCases) {
    EXPECT_EQ(Utf8FromText(SizeText(test.bytes)), test.text);
    EXPECT_EQ(Kilobytes(test.bytes), test.kilobytes) << test.text;
  }
}

TEST(ListImageNames, NumbersAndExtensions) {
  for (const TextView number : {u"2024", u" 7 ", u"-1", u"+1.5", u".5", u"5.", u"1e5", u"1E-5"})
    EXPECT_TRUE(IsNumeric(number)) << Utf8FromText(number);
  for (const TextView text :
       {u"", u" ", u".", u"-", u"2024.jpg", u"1.2.3", u"1e", u"e5", u"1 2", u"0x1", u"a"})
    EXPECT_FALSE(IsNumeric(text)) << Utf8FromText(text);
  const struct {
    TextView name, extension, result;
  } kCases[] = {
      {u"y", u".gif", u"y.gif"},  {u"a.b.jpg", u".gif", u"a.b.gif"},
      {u"y.", u".gif", u"y.gif"}, {u".jpg", u".gif", u".gif"},
      {u"y.jpg", u"", u"y"},      {u"", u".gif", u".gif"},
  };
  for (const auto& test : kCases) EXPECT_EQ(WithExtension(test.name, test.extension), test.result);
}

TEST(ListImageNames, DirectoryDates) {
  using namespace std::chrono;
  const auto on = [](int y, unsigned m, unsigned d) { return sys_days(year(y) / month(m) / day(d)); };
  EXPECT_EQ(DirectoryDate(u"7", u"Mar", u"1998", 2026), on(1998, 3, 7));
  EXPECT_EQ(DirectoryDate(u" 31", u"Dec", u"23:59", 2026), on(2026, 12, 31));
  EXPECT_EQ(DirectoryDate(u"30", u"Feb", u"2023", 2026), on(2023, 3, 2));
  EXPECT_EQ(DirectoryDate(u"1", u"Jan", u"29", 2026), on(2029, 1, 1));
  EXPECT_EQ(DirectoryDate(u"1", u"Jan", u"30", 2026), on(1930, 1, 1));
  for (const TextView month : {u"jan", u"anF", u"", u"JanFeb"})
    EXPECT_THROW(DirectoryDate(u"1", month, u"2020", 2026), RuntimeError);
  EXPECT_THROW(DirectoryDate(u"x", u"Jan", u"2020", 2026), RuntimeError);
  EXPECT_THROW(DirectoryDate(u"1", u"Jan", u"10000", 2026), RuntimeError);
}

TEST_F(ListImageTest, ChecksNames) {
  for (const char16_t refused : TextView(u"\\/:*?\"<>|#%")) {
    EXPECT_FALSE(control.IsFileNameValid(Text(u"a") + refused + refused + u"b.jpg"));
    ExpectLog({"1034 "});
  }
  for (const TextView valid : {u"", u"a b.jpg", u" ", u"CON", u"\u00e4.jpg", u".."})
    EXPECT_TRUE(control.IsFileNameValid(valid));
  ExpectLog({});

  List({{"a.jpg", "1"}, {" B.gif ", "1"}}, u"jpg");
  for (const TextView taken : {u"a.jpg", u"A.JPG", u"b.GIF", u" a.jpg"})
    EXPECT_FALSE(control.CheckIfFileDoesNotExist(taken)) << Utf8FromText(taken);
  EXPECT_TRUE(EqualsIgnoringCase(u"\u00C4\u0152\u017D\u03A3\u0416\u0401.JPG",
                                 u"\u00E4\u0153\u017E\u03C3\u0436\u0451.jpg"));
  EXPECT_FALSE(EqualsIgnoringCase(u"\u00D7\u0138", u"\u00F7\u0139"));
  EXPECT_FALSE(EqualsIgnoringCase(u"\u0130", u"\u0131"));
  for (const TextView free : {u"", u"a", u"a.jpgx"}) EXPECT_TRUE(control.CheckIfFileDoesNotExist(free));
  // The list counts too.
  fake.apartment.listing.all.Clear();
  EXPECT_FALSE(control.CheckIfFileDoesNotExist(u"A.jpg"));
  EXPECT_TRUE(control.CheckIfFileDoesNotExist(u" a.jpg"));
}

TEST_F(ListImageTest, AnswersQueries) {
  // What the window has selected need not be there any more.
  view.selected = {true};
  EXPECT_EQ(control.GetSelectedFilesHttpPath(), std::nullopt);
  List({{"a.jpg", "1"}, {"b.jpg", "2"}, {"c.jpg", "3"}});
  EXPECT_TRUE(control.GetFileNames().empty());
  view.Select(2, true);
  view.Select(1, true);
  EXPECT_EQ(control.SelectedFileName(), u"b.jpg");
  EXPECT_EQ(control.GetSelectedFilesHttpPath(), u"http://h/u/b.jpg");
  EXPECT_EQ(control.GetFileNames(), (std::vector<Text>{u"b.jpg", u"c.jpg"}));
  control.UploadedFileSetFocus(u"A.jpg");
  EXPECT_EQ(control.GetFileNames().size(), 2U);
  control.UploadedFileSetFocus(u"a.jpg");
  EXPECT_EQ(control.GetFileNames(), std::vector<Text>{u"a.jpg"});
  control.ListViewSetFocus();
  control.StartLabelExit();
  control.SetMultiSelectProperty(false);
  ExpectLog({"view focus", "view focus", "view at 0", "view focus", "view end edit"});
  EXPECT_FALSE(view.multiple);

  std::vector<std::shared_ptr<CUpload>> details;
  const auto take = [&](const std::shared_ptr<CUpload>& record) { details.push_back(record); };
  for (const TextView address : {u"", u"B.jpg", u"u/b.jpg", u".jpg"}) control.GetFileDetails(address, take);
  EXPECT_TRUE(details.empty());
  for (const TextView address : {u"http://h/u/b.jpg", u"b.jpg"}) control.GetFileDetails(address, take);
  ASSERT_EQ(details.size(), 2U);
  const CUpload& record = *details[0];
  EXPECT_EQ(Text(record.FileName) + u"|" + Text(record.FileDate) + u"|" + Text(record.FilePath),
            u"b.jpg|today|");
  EXPECT_EQ(record.FileSize, 2);

  const struct {
    TextView prefix;
    std::size_t start;
    std::optional<std::size_t> found;
  } kSearches[] = {{u"B", 0, 1}, {u"b", 2, 1}, {u"", 2, 2}, {u"c.jpgx", 0, {}}, {u"a", 3, 0}};
  for (const auto& search : kSearches) EXPECT_EQ(control.FindItem(search.prefix, search.start), search.found);
}

TEST_F(ListImageTest, ReselectsAfterRename) {
  List({{"a.jpg", "1"}, {"b.jpg", "1"}, {"c.gif", "1"}});
  view.Select(1, true);
  control.ChangeFileFilter(u"*");
  EXPECT_TRUE(control.GetFileNames().empty());
  EXPECT_TRUE(control.RenameFile(u"b.jpg", u"New.jpg"));
  view.Select(1, true);
  control.ChangeFileFilter(u"jpg");
  EXPECT_EQ(control.GetFileNames(), std::vector<Text>{u"New.jpg"});
  // Another listing spells it in another way.
  const auto again = std::make_shared<CUpload>(*fake.apartment.listing.all.At(2));
  fake.apartment.listing.all.Remove(2);
  again->FileName = u"NEW.jpg";
  fake.apartment.listing.all.Insert(2, again);
  control.ChangeFileFilter(u"jpg");
  EXPECT_EQ(control.GetFileNames(), std::vector<Text>{u"NEW.jpg"});
  // What is not shown cannot be selected again; the first one stands in.
  control.ChangeFileFilter(u"gif");
  EXPECT_EQ(control.GetFileNames(), std::vector<Text>{u"c.gif"});
}

TEST_F(ListImageTest, TellsTheHostWhatTheUserDoes) {
  const auto actions = [&] {
    control.OnKeyDown(38);
    control.OnKeyDown(40);
    control.OnKeyDown(37);
    control.OnClick();
    control.OnMouseButton();
    control.OnEnter();
    control.OnSelectionChanged();
  };
  List({});
  actions();
  ExpectLog({"1022 ", "1024 ", "1015 ", "1024 ", "1015 "});
  List({{"a.jpg", "1"}});
  actions();
  ExpectLog({"1015 ", "1015 ", "1022 ", "1024 ", "1015 ", "1024 ", "1015 "});
  view.Select(0, true);
  actions();
  const std::string current = "1015 " + AddressOf("a.jpg");
  ExpectLog({current, current, "1022 ", current, "1024 ", "1024 ", current});
  // A host that empties the list in the first event of a click.
  OnEvent("1022 ", [&] { control.ChangeFileFilter(u"gif"); });
  control.OnClick();
  ExpectLog({"1022 ", "view items 0", "1024 "});
}

TEST_F(ListImageTest, DragsAndDrops) {
  List({{"a.jpg", "1"}});
  struct Data : DragData {
  } data;
  std::int32_t effect = 3;
  bool cursors = true;
  std::vector<Text> files{u"C:\\a.jpg", u"C:\\b.jpg"};
  const std::vector<Text> all = files;
  OnEvent("1023 C:\\a.jpg", [&] { files.clear(); });
  // A drag that the list did not start has no end to tell.
  control.OnCompleteDrag(0);
  control.OnDragOver(data, effect, {1, 0, 0, 0}, 2);
  EXPECT_EQ(effect, 0);
  control.OnDrop(data, files, effect, {0, 4, 0, 0});
  control.OnDrop(data, {}, effect, {});
  ExpectLog({"OLEDragOver 3 1 2", "OLEDragDrop 0 4", "1023 C:\\a.jpg", "1023 C:\\b.jpg", "1023 ",
             "OLEDragDrop 0 0"});

  control.OLEDrag();
  control.OnStartDrag(data, effect);
  EXPECT_EQ(effect, 1);
  control.OnSetData(data, 13);
  control.OnGiveFeedback(effect, cursors);
  EXPECT_FALSE(cursors);
  control.OnDrop(data, all, effect, {});
  control.OnCompleteDrag(effect);
  control.OnCompleteDrag(effect);
  ExpectLog({"view drag", "OLEStartDrag 0", "OLESetData 13", "OLEGiveFeedback 1", "OLEDragDrop 1 0", "1021 ",
             "OLECompleteDrag 1"});

  EXPECT_EQ(control.ContentOfDrag().address, u"");
  view.Select(0, true);
  // An older copy, of another length, is not what the user sees.
  fake.files.files[u"C:\\Temp\\bv\\u@x\\a.jpg"] = {2, 0};
  EXPECT_EQ(control.ContentOfDrag().localFile, u"");
  fake.files.files[u"C:\\Temp\\bv\\u@x\\a.jpg"] = {1, 0};
  EXPECT_EQ(control.ContentOfDrag().address, u"http://h/u/a.jpg");
  EXPECT_EQ(control.ContentOfDrag().localFile, u"C:\\Temp\\bv\\u@x\\a.jpg");
  // Without a user folder it is not looked for in the root of a drive.
  fake.apartment.UserFolderPath.clear();
  fake.files.files[u"\\a.jpg"] = {};
  EXPECT_EQ(control.ContentOfDrag().localFile, u"");
}

TEST_F(ListImageTest, EditsLabels) {
  List({{"x.gif", "1"}});
  EXPECT_FALSE(control.OnBeforeLabelEdit());
  EXPECT_FALSE(control.OnAfterLabelEdit(0, u"y.gif"));
  ExpectLog({});
  EXPECT_TRUE(control.EnableRename(true));
  EXPECT_TRUE(control.OnBeforeLabelEdit());
  const struct {
    TextView text;
    const char* events;
    const char* name;
  } kCases[] = {
      {u"a#b.gif", "1034 ,", "x.gif,"},
      {u" ", "", "x.gif,"},
      {u" x.jpg", "", "x.gif,"},
      {u" z", "1031 z.gif,", "z.gif,"},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(Utf8FromText(test.text));
    const std::string before = Names();
    EXPECT_EQ(control.OnAfterLabelEdit(0, test.text), before != test.name);
    EXPECT_EQ(Events(), test.events);
    EXPECT_EQ(Names(), test.name);
    log.clear();
  }
  EXPECT_FALSE(control.OnAfterLabelEdit(1, u"y.gif"));
  // A rename in the event of another one.
  OnEvent("1031 m.gif", [&] {
    EXPECT_TRUE(control.RenameFile(u"m.gif", u"n.gif"));
    EXPECT_FALSE(control.OnBeforeLabelEdit());
  });
  EXPECT_TRUE(control.RenameFile(u"z.gif", u"m.gif"));
  EXPECT_TRUE(control.OnBeforeLabelEdit());
  EXPECT_FALSE(control.EnableRename(false));
  EXPECT_FALSE(control.bRenameEnabled);
}

TEST_F(ListImageTest, ManyFilesCostTheViewNothing) {
  std::vector<File> files(20'000);
  for (std::size_t i = 0; i < files.size(); ++i) files[i] = {std::to_string(i) + ".jpg", "1"};
  List(files);
  control.ChangeFileFilter(u"*");
  ExpectLog({"view items 20000"});
  EXPECT_EQ(control.ItemText(19'999, 0), u"19999.jpg");
}

TEST_F(ListImageTest, EndMakesTheNextControlList) {
  List({{"a.jpg", "1"}});
  { ctrlListImage second{parts, view}; }
  EXPECT_FALSE(fake.apartment.listing.isCurrent);
}

}  // namespace
}  // namespace tarnwick
