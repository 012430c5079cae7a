// Upload, delete, rename and download: everything that happens, in its order.
#include "transfer/AcceptorPages.h"
#include "unit/ListImageFixture.h"

namespace tarnwick {
namespace {

const std::string kUploadCall =
    "page upload|C:\\new.jpg|http://h:81/users/|/httpupload/UploadAcceptor.asp|0|u@x|p|"
    "4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E";
const std::string kDeleteTail = "|/httpupload/DeleteAcceptor.asp|u@x|p|4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E";
const std::string kRenameTail = "|/httpupload/RenameAcceptor.asp|u@x|p|4A7E2C51-93D0-4f1c-B2E9-6C1D08F3A27E";
const std::string kAskCan = "ask CanUploadFile UserName=u@x&ProductID=7";
const std::string kAskList = "ask ListFilesRequest Username=u@x&ProductID=7";

// --- Upload ---

class ListImageUpload : public ListImageTest {
 protected:
  ListImageUpload() {
    fake.files.files[u"C:\\new.jpg"] = {1536, 0};
    uploader.script = Upload;
  }
};

TEST_F(ListImageUpload, Transcript) {
  List({});
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  ExpectLog({"view hourglass", kAskCan, "watchdog starts", kUploadCall,
             // Initializing, connecting.
             "watchdog starts", "yield", "yield", "state 0",
             // Started, half, complete; the server works between the last two.
             "yield", "state 2", "state 9", "9999 0", "uploaded 0", "watchdog starts", "yield", "9999 50",
             "uploaded 768", "yield", "watchdog starts", "yield", "yield", "9999 100", "uploaded 768",
             "watchdog stops", "state 10", "yield", "yield",
             "ask FileUploadRequest FileName=new.jpg&FileSize=1536&Username=u@x&ProductID=7",
             "watchdog stops", "view append", "view list", "view focus", "view at 0",
             "1015 http://h/u/new.jpg", "view pointer"});
  EXPECT_EQ(control.ItemText(0, 2), u"1536Bytes (2KB)");
  EXPECT_EQ(control.m_LastError, ftp_error::kSuccess);
  EXPECT_FALSE(control.m_bTransferInProgress);
  ASSERT_EQ(Records(), "new.jpg,");
  EXPECT_EQ(fake.apartment.listing.all.At(1)->FileDate, u"1/2/2026 3:04:05 AM");
  // The next filling spells the size as it spells the others.
  control.ChangeFileFilter(u"*");
  EXPECT_EQ(control.ItemText(0, 2), u"1536 Bytes (2 KB)");
  EXPECT_EQ(control.GetFileNames(), std::vector<Text>{u"new.jpg"}) << "it stays selected";
}

TEST_F(ListImageUpload, Outcomes) {
  const auto nothing = [](UploadEvents&) {};
  const auto completeOnly = [](UploadEvents& events) { events.UploadComplete(); };
  const auto otherUser = [&](UploadEvents& events) {
    events.UploadComplete();
    fake.apartment.session.userName = u"other";
  };
  const auto neverComplete = [](UploadEvents& events) {
    events.UploadComplete();
    events.UploadProgress(100, 1536);
  };
  const struct {
    const char* name;
    const char* answer;
    std::function<void(UploadEvents&)> script;
    std::int32_t error;
    const char* url;
    bool result;
    bool registered;
    const char* events;
  } kCases[] = {
      {"quota", "CanUploadFile=1002", Upload, 0, "FileURL=x", false, false, "1014 ,"},
      {"no service", "fails", Upload, 0, "FileURL=x", false, false, "1005 ,"},
      {"other code", "CanUploadFile=7", completeOnly, 0, "FileURL=x", true, true, "9999 100,1015 x,"},
      {"same bytes", "CanUploadFile=1001", completeOnly, -2147220891, "FileURL=x", true, true,
       "9999 100,1015 x,"},
      {"tolerated", "CanUploadFile=1001", completeOnly, 380, "FileURL=x", true, true, "9999 100,1015 x,"},
      {"refused", "CanUploadFile=1001", completeOnly, -2147220881, "FileURL=x", false, false, "9999 100,"},
      {"silent", "CanUploadFile=1001", nothing, 0, "FileURL=x", false, false, ""},
      {"goes on", "CanUploadFile=1001", neverComplete, 0, "FileURL=x", false, false, "9999 100,9999 100,"},
      {"another user meanwhile", "CanUploadFile=1001", otherUser, 0, "FileURL=x", false, false, "9999 100,"},
      {"not registered", "CanUploadFile=1001", completeOnly, 0, "fails", false, true, "9999 100,"},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.name);
    List({});
    replies["CanUploadFile"] = test.answer;
    replies["FileUploadRequest"] = test.url;
    uploader.script = test.script;
    uploader.error = test.error;
    EXPECT_EQ(control.UploadImage(u"C:\\new.jpg"), test.result);
    fake.apartment.session.userName = u"u@x";
    EXPECT_EQ(fake.files.writers, 0);
    EXPECT_EQ(Events(), test.events);
    const auto asks = [](const std::string& line) { return line.starts_with("ask FileUpload"); };
    EXPECT_EQ(std::ranges::count_if(log, asks), test.registered ? 1 : 0);
    if (test.registered) {
      EXPECT_EQ(control.m_LastError, test.result ? ftp_error::kSuccess : ftp_error::kNotTaken);
    }
    EXPECT_EQ(Names(), test.result ? "new.jpg," : "");
    EXPECT_EQ(Records(), test.result ? "new.jpg," : "");
    EXPECT_EQ(log.back(), "view pointer");
    EXPECT_FALSE(control.m_bTransferInProgress);
  }
}

// An upload as the component makes it, which ends when it is not wanted any more before the last byte.
void StoppableUpload(UploadEvents& events) {
  const auto goOn = [&] {
    if (!events.IsWanted()) throw RuntimeError(error::kInterrupted);
  };
  events.Connecting();
  goOn();
  events.UploadStarted();
  goOn();
  events.UploadProgress(50, 768);
  goOn();
  events.UploadComplete();
}

TEST_F(ListImageUpload, IsStoppedInAnyEventBeforeItsEnd) {
  uploader.script = StoppableUpload;
  const std::function<void()> kStops[] = {[&] { control.mobjFileupload->AbortFileTransfer(true); },
                                          [&] { control.EndTransfer(); }};
  for (const auto& stop : kStops) {
    for (const char* event :
         {"state 0", "state 2", "state 9", "9999 0", "uploaded 0", "9999 50", "uploaded 768"}) {
      SCOPED_TRACE(event);
      List({});
      OnEvent(event, stop);
      EXPECT_FALSE(control.UploadImage(u"C:\\new.jpg"));
      EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
      EXPECT_EQ(Names() + Records(), "");
      // No event follows.
      for (auto line = std::ranges::find(log, event) + 1; line != log.end(); ++line)
        EXPECT_TRUE(line->starts_with("view") || line->starts_with("watchdog") || *line == "yield") << *line;
    }
    for (const char* event : {"9999 100", "state 10"}) {
      List({});
      OnEvent(event, stop);
      EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg")) << "the server has the file";
      EXPECT_EQ(Names() + Records(), "new.jpg,new.jpg,");
      EXPECT_EQ(control.m_LastError, ftp_error::kSuccess);
    }
  }
  // A stop is meant for what runs, and a flag that is stored without one ends nothing.
  List({});
  OnEvent("9999 50", [&] { control.mobjFileupload->AbortFileTransfer(false); });
  control.mobjFileupload->AbortFileTransfer(true);
  EXPECT_TRUE(fake.apartment.abortTransfer);
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
}

TEST_F(ListImageUpload, TellsWhyItFailed) {
  List({{"NEW.jpg", "100"}});
  fake.files.files[u"C:\\a.jpg"] = {50, 0};
  fake.files.folders.emplace_back(u"C:\\folder");
  replies["GetTotalUsedQuota"] = "UsedQuota=900";
  const auto fails = [&](TextView path, std::int32_t error) {
    uploader.error = error;
    // The double reads the file before it fails.
    if (error != 53) fake.files.files.try_emplace(Text(path));
    EXPECT_FALSE(control.UploadImage(path));
    return std::to_string(control.m_LastError) + " " + Utf8FromText(control.m_strLastErrorDesc);
  };
  // An answer that is lost after a stop came too late is no stop.
  const auto late = [&](UploadEvents&) { control.mobjFileupload->AbortFileTransfer(true); };
  uploader.script = late;
  EXPECT_EQ(fails(u"C:\\a.jpg", acceptor::kUnspecified).substr(0, 3), "43 ");
  const struct {
    TextView path;
    std::int32_t error;
    const char* quota;
    const char* reason;
  } kCases[] = {
      {u"C:\\folder", 53, "", "54 This is a folder, not a file. (53)"},
      {u"C:\\missing.jpg", 53, "", "54 The file was not found. (53)"},
      {u"C:\\locked.jpg", 75, "", "54 The file could not be read. (75)"},
      {u"C:\\new.jpg", -2147220881, "1000", "57 The account has a file of that name. (-2147220881)"},
      {u"C:\\a#.jpg", -2147220881, "1000", "57 The file's name is not allowed. (-2147220881)"},
      {u"C:\\a.jpg", -2147220881, "949", "56 The account is full. (-2147220881)"},
      {u"C:\\a.jpg", -2147220881, "950", "57 The file's name is not allowed. (-2147220881)"},
      {u"C:\\a.jpg", -2147220878, "", "52 The server refused the user name or the password. (-2147220878)"},
      {u"C:\\a.jpg", -2147220840, "", "54 The account has no folder on the server. (-2147220840)"},
      {u"C:\\a.jpg", -2147467259, "",
       "43 The connection was lost, or the server gave no usable answer. (-2147467259)"},
      {u"C:\\a.jpg", 7, "", "44 The server refused. (7)"},
  };
  uploader.script = nullptr;
  for (const auto& test : kCases) {
    replies["GetMaxQuota"] = std::string("MaxUserQuota=") + test.quota;
    EXPECT_EQ(fails(test.path, test.error), test.reason);
  }
  uploader.error = 0;
  for (const auto& [answer, error] : {std::pair{"1002", 56}, {"1004", 53}}) {
    replies["CanUploadFile"] = std::string("CanUploadFile=") + answer;
    // The host may look in the event.
    host.onEvent = [&, error = error](const std::string&) { EXPECT_EQ(control.m_LastError, error); };
    EXPECT_FALSE(control.UploadImage(u"C:\\a.jpg"));
    EXPECT_EQ(control.m_LastError, error);
  }
  host.onEvent = nullptr;
  control.mobjFileupload.reset();
  EXPECT_FALSE(control.UploadImage(u"C:\\a.jpg"));
  EXPECT_EQ(control.m_LastError, ftp_error::kNoClient);
  control.Close();
  EXPECT_FALSE(control.UploadImage(u"C:\\a.jpg"));
  EXPECT_EQ(control.m_strLastErrorDesc, u"The control was closed.");
}

TEST_F(ListImageUpload, WatchdogOfAnUploadEndsWithIt) {
  const auto silence = [this] { downloader.events->Failed(ftp_error::kTimeout, u"silent", false); };
  // What it tells is the reason, however the upload fails then.
  for (const bool throws : {false, true}) {
    List({});
    uploader.script = [&](UploadEvents&) {
      silence();
      EXPECT_TRUE(control.gbConnectionFailed);
      if (throws) throw RuntimeError(acceptor::kUnspecified);
    };
    EXPECT_FALSE(control.UploadImage(u"C:\\new.jpg"));
    EXPECT_EQ(control.m_LastError, ftp_error::kTimeout);
    EXPECT_FALSE(control.gbConnectionFailed) << "the next download is another matter";
  }
  // Not of one that succeeds after all, nor does what the host sets go with it.
  uploader.script = [&](UploadEvents& events) {
    silence();
    Upload(events);
  };
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  EXPECT_EQ(control.m_LastError, ftp_error::kSuccess);
  uploader.script = Upload;
  control.gbConnectionFailed = true;
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  EXPECT_TRUE(control.gbConnectionFailed);
}

TEST_F(ListImageUpload, ReplacesAFile) {
  List({{"old.jpg", "1"}, {"NEW.jpg", "1"}, {"z.jpg", "1"}});
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  EXPECT_EQ(Names() + Records(), "old.jpg,new.jpg,z.jpg,old.jpg,new.jpg,z.jpg,");
  EXPECT_EQ(control.ItemText(1, 1) + control.ItemText(1, 2), u"http://h/u/new.jpg1536Bytes (2KB)");
  EXPECT_EQ(fake.apartment.listing.all.PositionOf(u"http://h/u/new.jpg"), 2U);
  EXPECT_EQ(fake.apartment.listing.all.PositionOf(u"http://h/u/NEW.jpg"), 0U);
  EXPECT_TRUE(std::ranges::count(log, "view refresh 1") == 1 && std::ranges::count(log, "view append") == 0);
  // Once more, under the address that it has by now; then a service that gives it another file's address.
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  EXPECT_EQ(control.ItemCount(), 3U);
  EXPECT_EQ(Events().substr(Events().rfind("1015")), "1015 http://h/u/new.jpg,");
  fake.files.files[u"C:\\two.jpg"] = {1, 0};
  replies["FileUploadRequest"] = "FileURL=http://h/u/z.jpg";
  EXPECT_TRUE(control.UploadImage(u"C:\\two.jpg"));
  EXPECT_EQ(Names() + Records(), "old.jpg,new.jpg,two.jpg,old.jpg,new.jpg,two.jpg,");
  // What the filter hides is registered and not shown.
  control.ChangeFileFilter(u"gif");
  EXPECT_TRUE(control.UploadImage(u"C:\\two.jpg"));
  EXPECT_EQ(Names(), "");
  EXPECT_TRUE(Events().ends_with(",1015 ,"));
  EXPECT_NE(view.hint, u"");
  fake.files.files[u"C:\\one.gif"] = {1, 0};
  replies["FileUploadRequest"] = "FileURL=http://h/u/one.gif";
  EXPECT_TRUE(control.UploadImage(u"C:\\one.gif"));
  EXPECT_EQ(Names() + Utf8FromText(view.hint), "one.gif,");
}

TEST_F(ListImageUpload, LocalCopyHasTheBytesThatWereSent) {
  List({});
  const Text copy = fake.apartment.UserFolderPath + u"\\new.jpg";
  uploader.script = [this](UploadEvents& events) {
    events.FileBytes(", sent");
    fake.files.files[u"C:\\new.jpg"].bytes = "later";
    Upload(events);
  };
  const struct {
    const char* name;
    const char* url;
    std::int32_t error;
    std::size_t room;
    const char* bytes;
  } kCases[] = {
      {"sent", "FileURL=http://h/u/new.jpg", 0, 99, "file, sent"},
      {"not taken", "FileURL=http://h/u/new.jpg", -2147220881, 99, "old"},
      // The server has other bytes than the old copy by now.
      {"not registered", "FileURL=", 0, 99, ""},
      {"no answer", "FileURL=http://h/u/new.jpg", acceptor::kUnspecified, 99, ""},
      // The upload goes on; the file is copied as it is then.
      {"disk full for a while", "FileURL=http://h/u/new.jpg", 0, 5, "later"},
      // Nothing is better than the picture that was there before.
      {"disk full", "FileURL=http://h/u/new.jpg", 0, 3, ""},
      {"another name", "FileURL=http://h/u/x.jpg", 0, 99, "old"},
      {"no safe name", "FileURL=http://h/u/a%3Ab", 0, 99, "old"},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.name);
    fake.files.files[u"C:\\new.jpg"] = {4, 0, "file"};
    fake.files.files[copy] = {3, 0, "old"};
    fake.files.mostWritten = test.room;
    replies["FileUploadRequest"] = test.url;
    uploader.error = test.error;
    control.UploadImage(u"C:\\new.jpg");
    EXPECT_EQ(fake.files.files[copy].bytes, test.bytes);
    EXPECT_EQ(fake.files.writers, 0);
  }
  EXPECT_EQ(fake.files.files[fake.apartment.UserFolderPath + u"\\x.jpg"].bytes, "later");
  // A file that is already where its copy would be stays the one it is, however its name is spelled.
  uploader.error = 0;
  const Text other = u"C:\\TEMP~1\\NEW.jpg";
  replies["FileUploadRequest"] = "FileURL=http://h/u/new.jpg";
  fake.files.spellings[other] = copy;
  for (const Text& path : {copy, other}) {
    fake.files.files[copy] = {3, 0, "old"};
    fake.files.files[other] = {3, 0, "old"};
    for (const char* address : {"FileURL=http://h/u/new.jpg", "FileURL="}) {
      replies["FileUploadRequest"] = address;
      control.UploadImage(path);
      EXPECT_EQ(fake.files.files[copy].bytes, "old");
    }
  }
}

TEST_F(ListImageUpload, NextOneStartsFromTheLastEvent) {
  List({});
  fake.files.files[u"C:\\two.jpg"] = {1, 0};
  OnEvent("1015 http://h/u/new.jpg", [&] {
    host.onEvent = nullptr;
    replies["FileUploadRequest"] = "FileURL=http://h/u/two.jpg";
    EXPECT_TRUE(control.UploadImage(u"C:\\two.jpg"));
  });
  EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
  EXPECT_EQ(Names(), "new.jpg,two.jpg,");
  // One hourglass over both.
  EXPECT_EQ(std::ranges::count(log, "view hourglass"), 1);
  EXPECT_EQ(std::ranges::count(log, "view pointer"), 1);
}

// --- Delete ---

TEST_F(ListImageTest, DeleteTranscript) {
  List({{"a.jpg", "1"}, {"b.jpg", "1"}, {"c.gif", "1"}, {"d.jpg", "1"}}, u"jpg");
  view.Select(1, true);
  view.Select(2, true);
  account = {{"a.jpg", "1"}, {"c.gif", "1"}};
  control.DeleteFile();
  ExpectLog({"view hourglass",
             "1002 ",
             "page delete|http://h:81/users/|b.jpg" + kDeleteTail,
             "ask DeleteFileRequest Username=u@x&ProductID=7&FileToBeDeleted=b.jpg",
             "1001 ",
             "1015 " + AddressOf("b.jpg"),
             "yield",
             "page delete|http://h:81/users/|d.jpg" + kDeleteTail,
             "ask DeleteFileRequest Username=u@x&ProductID=7&FileToBeDeleted=d.jpg",
             "1001 ",
             "1015 " + AddressOf("b.jpg"),
             "yield",
             "view items 0",
             kAskList,
             "view list",
             "view columns",
             "view items 1",
             "view at 0",
             "1015 " + AddressOf("a.jpg"),
             "view pointer"});
  EXPECT_TRUE(fake.apartment.listing.isCurrent);
}

TEST_F(ListImageTest, DeleteOutcomes) {
  // The service decides, whatever the page says.
  List({{"a.jpg", "1"}});
  uploader.error = -2147220880;
  view.Select(0, true);
  account.clear();
  control.DeleteFile();
  EXPECT_EQ(Events(), "1001 ,1015 http://h/u/a.jpg,");
  EXPECT_FALSE(view.listShown);
  uploader.error = 0;
  for (const char* answer : {"DeleteStatus=FALSE", "fails", ""}) {
    List({{"a.jpg", "1"}});
    replies["DeleteFileRequest"] = answer;
    view.Select(0, true);
    control.DeleteFile();
    EXPECT_EQ(Events(), "1015 http://h/u/a.jpg,") << answer;
    EXPECT_EQ(Names(), "a.jpg,");
    EXPECT_EQ(std::exchange(control.m_LastError, 0), ftp_error::kNotTaken);
  }

  // A listing that fails afterwards leaves a list without items, which is not shown as an empty account.
  replies["DeleteFileRequest"] = "DeleteStatus=TRUE";
  List({{"a.jpg", "1"}, {"b.jpg", "1"}});
  view.Select(0, true);
  listingFails = true;
  control.DeleteFile();
  EXPECT_EQ(Events(), "1001 ,1015 http://h/u/a.jpg,1002 ,");
  EXPECT_EQ(Names(), "");
  EXPECT_TRUE(view.listShown);
  EXPECT_EQ(view.hint, u"");
  EXPECT_EQ(control.m_strLastErrorDesc, u"The files were deleted, but the rest could not be listed.");
  EXPECT_FALSE(fake.apartment.listing.isCurrent);
  EXPECT_EQ(log.back(), "view pointer");
}

TEST_F(ListImageTest, LeavesTheFilesOfAnotherUserAlone) {
  List({{"a.jpg", "1"}});
  view.Select(0, true);
  control.bRenameEnabled = true;
  log.clear();
  for (Text* of : {&fake.apartment.session.userName, &fake.apartment.session.serverName}) {
    const Text own = std::exchange(*of, u"other");
    control.DeleteFile();
    EXPECT_FALSE(control.OnBeforeLabelEdit());
    EXPECT_FALSE(control.OnAfterLabelEdit(0, u"b.jpg"));
    ExpectLog({"view hourglass", "view pointer", "1033 "});
    EXPECT_EQ(control.m_LastError, ftp_error::kNotLoggedOn);
    // Nor is his upload shown among them.
    fake.files.files[u"C:\\new.jpg"] = {1, 0};
    uploader.script = Upload;
    EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
    EXPECT_EQ(Names(), "a.jpg,");
    log.clear();
    *of = own;
  }
  EXPECT_TRUE(control.OnAfterLabelEdit(0, u"b.jpg"));
}

TEST_F(ListImageTest, HostActsWhileFilesAreDeleted) {
  const struct {
    const char* name;
    std::function<void(ctrlListImage&)> action;
    const char* deleted;
  } kCases[] = {
      {"fills and selects again",
       [this](ctrlListImage& list) {
         list.ChangeFileFilter(u"*");
         view.selected.assign(3, true);
       },
       "a.jpg,"},
      {"logs another user on", [this](ctrlListImage&) { fake.apartment.session.userName = u"other"; },
       "a.jpg,"},
      {"takes the client", [](ctrlListImage& list) { list.mobjFileupload.reset(); }, "a.jpg,"},
      {"closes", [](ctrlListImage& list) { list.Close(); }, "a.jpg,"},
      {"stops", [](ctrlListImage& list) { list.mobjFileupload->AbortFileTransfer(true); }, "a.jpg,"},
      {"selects others",
       [this](ctrlListImage&) {
         view.selected = {true, false, false};
       },
       "a.jpg,b.jpg,c.jpg,"},
      {"deletes again", [](ctrlListImage& list) { list.DeleteFile(); }, "a.jpg,b.jpg,c.jpg,"},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.name);
    log.clear();
    fake.apartment.listing.isCurrent = false;
    account = {{"a.jpg", "1"}, {"b.jpg", "1"}, {"c.jpg", "1"}};
    ctrlListImage deleting{parts, view};
    ASSERT_TRUE(deleting.Init(u"*"));
    for (std::size_t i = 0; i < 3; ++i) view.Select(i, true);
    bool acted = false;
    OnEvent("1001 ", [&] {
      if (!std::exchange(acted, true)) test.action(deleting);
    });
    deleting.DeleteFile();
    std::string deleted;
    for (const std::string& line : log)
      if (const std::size_t at = line.find("ToBeDeleted="); at != std::string::npos)
        deleted += line.substr(at + 12) + ",";
    EXPECT_EQ(deleted, test.deleted);
    EXPECT_EQ(deleting.m_LastError == ftp_error::kSuccess, deleted == "a.jpg,b.jpg,c.jpg,");
    if (std::string_view(test.name) == "closes") {
      EXPECT_EQ(std::ranges::count(log, kAskList), 1) << "only before";
    }
    EXPECT_EQ(log.back(), "view pointer");
    host.onEvent = nullptr;
    fake.apartment.session.userName = u"u@x";
  }
}

// --- Rename ---

TEST_F(ListImageTest, RenameTranscript) {
  List({{"a.jpg", "1"}, {"b.jpg", "1"}});
  view.Select(1, true);
  // Another picture's, which had the name.
  const Text old = fake.apartment.UserFolderPath + u"\\c d.jpg";
  fake.files.files[old] = {1, 0};
  EXPECT_TRUE(control.RenameFile(u"b.jpg", u"  c d.jpg "));
  ExpectLog({"view hourglass", "page rename|http://h:81/users/|b.jpg|c d.jpg" + kRenameTail,
             "ask RenameFileRequest Username=u@x&ProductID=7&OldFileName=b.jpg&NewFileName=c%20d.jpg",
             "view refresh 1", "1031 c d.jpg", "view pointer"});
  EXPECT_FALSE(fake.apartment.listing.isCurrent);
  EXPECT_FALSE(fake.files.files.contains(old));
  for (const TextView name : {u"\\B.jpg", u"\\C d.jpg"})
    EXPECT_EQ(fake.apartment.ChangesOfCopy(fake.apartment.UserFolderPath + Text(name)), 1U);
  EXPECT_EQ(Names() + Records(), "a.jpg,c d.jpg,a.jpg,c d.jpg,");
  EXPECT_EQ(control.GetSelectedFilesHttpPath(), u"http://h/u/c d.jpg");
  EXPECT_EQ(fake.apartment.listing.all.PositionOf(u"http://h/u/c d.jpg"), 2U);
  EXPECT_EQ(fake.apartment.listing.all.PositionOf(u"http://h/u/b.jpg"), 0U);

  // The file system takes both names for one file, which stays.
  const Text copy = fake.apartment.UserFolderPath + u"\\a.jpg";
  fake.files.files[copy] = {1, 0};
  EXPECT_TRUE(control.RenameFile(u"a.jpg", u"A.jpg"));
  EXPECT_TRUE(fake.files.files.contains(copy));
}

TEST_F(ListImageTest, RenameOutcomes) {
  const auto rename = [&] {
    EXPECT_EQ(Heard([&] { EXPECT_FALSE(control.RenameFile(u"a.jpg", u"b.jpg")); }), "1033 ,");
    EXPECT_EQ(Names() + Records(), "a.jpg,a.jpg,");
    return log.size();
  };
  List({{"a.jpg", "1"}});
  replies["RenameFileRequest"] = "fails";
  EXPECT_EQ(rename(), 5U);
  EXPECT_TRUE(fake.apartment.listing.isCurrent);
  // The service hears nothing of what the page refused, and without a client nobody does.
  uploader.error = 380;
  EXPECT_EQ(rename(), 4U);
  control.mobjFileupload.reset();
  EXPECT_EQ(rename(), 3U);
}

TEST_F(ListImageTest, RenamesWhatIsOnlyHalfKnown) {
  List({{"a.jpg", "1"}, {"b.jpg", "1"}});
  // Not listed at all; in the list alone; onto an address that another record has.
  EXPECT_TRUE(control.RenameFile(u"none.jpg", u"x.jpg"));
  EXPECT_EQ(Names() + Records(), "a.jpg,b.jpg,a.jpg,b.jpg,");
  EXPECT_TRUE(control.RenameFile(u"a.jpg", u"b.jpg"));
  EXPECT_EQ(Names() + Records(), "b.jpg,b.jpg,b.jpg,b.jpg,");
  fake.apartment.listing.all.Clear();
  EXPECT_TRUE(control.RenameFile(u"b.jpg", u"c.jpg"));
  EXPECT_EQ(Names(), "c.jpg,b.jpg,");
  EXPECT_EQ(control.ItemText(0, 1), u"http://h/u/c.jpg");
}

// --- Download ---

class ListImageDownload : public ListImageTest {
 protected:
  // The transfer of a file of five bytes, a wait for each step.
  void Succeed() {
    downloader.waits = {
        [](FakeDownloader& d) { d.events->Resolving(); },
        [](FakeDownloader& d) {
          d.events->Connected();
          d.events->TransferStarting();
        },
        [](FakeDownloader& d) { d.events->Received(20); },
        [this](FakeDownloader& d) {
          d.events->HeaderFound(u"HTTP/1.1 200 OK", 3);
          EXPECT_EQ(control.m_lDownloadedBytes, 3);
        },
        [](FakeDownloader& d) { d.events->Received(5); },
        [](FakeDownloader& d) {
          d.files.files[d.target] = {5, 0};
          d.events->Finished(true);
        },
    };
  }
};

TEST_F(ListImageDownload, Transcript) {
  List({{"a.jpg", "1"}, {"b.jpg", "5"}});
  view.Select(1, true);
  for (const TextView folder : {u"C:\\To", u"C:\\To\\"}) {
    fake.files.files[u"C:\\To\\b.jpg"] = {1, 0};
    Succeed();
    downloader.waits.push_front([this](FakeDownloader& d) {
      EXPECT_FALSE(d.files.files.contains(d.target));
      EXPECT_EQ(control.m_lDownloadedBytes, 0);
    });
    EXPECT_EQ(control.DownLoadFileFromServer(folder), u"C:\\To\\b.jpg");
    ExpectLog({"download http://h/u/b.jpg to C:\\To\\b.jpg", "state 0", "state 2", "state 9", "9999 20",
               "downloaded 20", "reply HTTP/1.1 200 OK", "9999 5", "downloaded 5", "state 10",
               "watchdog stops", "yield"});
    EXPECT_EQ(control.m_lDownloadedBytes, 5);
    EXPECT_FALSE(control.m_bTransferInProgress);
  }
}

TEST_F(ListImageDownload, FindsTargetAndAddress) {
  const struct {
    const char* name;
    TextView path;
    TextView target;
    bool fetched;
  } kCases[] = {
      {"2024", u"C:\\To\\picture", u"C:\\To\\picture", true},
      {"2024", u"C:\\To\\", u"C:\\To", true},
      {"2024.jpg", u"C:\\To\\\\", u"C:\\To\\\\2024.jpg", true},
      {"a.jpg", u"", u"\\a.jpg", true},
      {"..", u"C:\\To", u"C:\\To\\..", false},
  };
  for (const auto& test : kCases) {
    SCOPED_TRACE(test.name);
    List({{test.name, "1"}});
    view.Select(0, true);
    fake.files.files.clear();
    Succeed();
    EXPECT_EQ(control.DownLoadFileFromServer(test.path), test.target);
    const std::string start = "download " + AddressOf(test.name) + " to " + Utf8FromText(test.target);
    EXPECT_EQ(std::ranges::count(log, start), test.fetched ? 1 : 0);
    EXPECT_EQ(Events().starts_with("5555"), !test.fetched);
  }
  // The record of that very address, else the first whose address holds the item's; none: nothing starts.
  List({{"a.jpg.gif", "1"}, {"a.jpg", "1"}}, u"jpg");
  view.Select(0, true);
  for (const char* address : {"a.jpg", "a.jpg.gif"}) {
    Succeed();
    control.DownLoadFileFromServer(u"C:\\To");
    EXPECT_EQ(log.front(), "download http://h/u/" + std::string(address) + " to C:\\To\\a.jpg");
    log.clear();
    fake.apartment.listing.all.Remove(fake.apartment.listing.all.Count());
  }
  // Nothing can be attempted: the older file stays, and the reason is told.
  fake.files.files[u"C:\\To\\a.jpg"] = {3, 0, "old"};
  EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To\\"), u"C:\\To\\a.jpg");
  EXPECT_EQ(control.m_LastError, ftp_error::kUnavailable);
  control.mobjFileupload.reset();
  EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"");
  EXPECT_EQ(control.m_LastError, ftp_error::kNoClient);
  ExpectLog({});
}

TEST_F(ListImageDownload, Failures) {
  List({{"a.jpg", "1"}});
  view.Select(0, true);
  const auto download = [&] {
    log.clear();
    EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"C:\\To\\a.jpg");
    EXPECT_FALSE(control.gbConnectionFailed || control.m_bTransferInProgress);
    EXPECT_EQ(std::ranges::count(log, "watchdog stops"), 1);
    return Events();
  };
  downloader.waits = {[](FakeDownloader& d) { d.events->Failed(6, u"refused", true); }};
  // A stop that comes too late is not the reason.
  OnEvent("5555 ", [&] { control.EndTransfer(); });
  EXPECT_EQ(download(), "5555 ,");
  EXPECT_EQ(control.m_LastError, 6);
  EXPECT_EQ(control.m_strLastErrorDesc, u"refused");
  // It is the outcome of the download, whatever else runs then.
  replies["RenameFileRequest"] = "fails";
  OnEvent("1033 ", [&] { downloader.events->Failed(6, u"refused", true); });
  downloader.waits = {[&](FakeDownloader&) { control.RenameFile(u"a.jpg", u"b.jpg"); }};
  EXPECT_EQ(download(), "1033 ,5555 ,");
  EXPECT_EQ(control.m_LastError, 6);
  host.onEvent = nullptr;
  downloader.waits = {[](FakeDownloader& d) { d.events->Failed(ftp_error::kTimeout, u"silent", false); }};
  EXPECT_EQ(download(), "");
  EXPECT_EQ(control.m_LastError, ftp_error::kTimeout);
  // The writer failed.
  for (const TextView folder : {u"C:\\Else", u"C:\\To"}) {
    fake.files.folders = {Text(folder)};
    downloader.waits = {[](FakeDownloader& d) { d.events->Finished(false); }};
    EXPECT_EQ(download(), "");
    EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
    EXPECT_EQ(control.m_strLastErrorDesc, folder == u"C:\\To" ? u"The local file could not be written."
                                                              : u"The local folder was not found.");
  }
  // What is there already stays and is not taken for the download.
  constexpr std::uint32_t kReadOnly = 1;
  fake.files.files[u"C:\\To\\a.jpg"] = {3, kReadOnly, "old"};
  control.m_LastError = 0;
  EXPECT_EQ(Heard([&] { EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"C:\\To\\a.jpg"); }), "5555 ,");
  EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
  EXPECT_EQ(fake.files.files[u"C:\\To\\a.jpg"].bytes, "old");
  EXPECT_EQ(downloader.prepared, u"");
  // The host gives up before: nothing is attempted, nor is it when the address is none.
  fake.files.files[u"C:\\To\\a.jpg"].attributes = 0;
  control.gbConnectionFailed = true;
  log.clear();
  EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"C:\\To\\a.jpg");
  ExpectLog({});
  EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
  EXPECT_FALSE(control.gbConnectionFailed);
  downloader.canStart = false;
  downloader.waits = {[](FakeDownloader& d) { d.events->Failed(45, u"no address", true); }};
  EXPECT_EQ(download(), "5555 ,");
  EXPECT_EQ(fake.files.files[u"C:\\To\\a.jpg"].bytes, "old");
  downloader.canStart = true;
  // Or meanwhile, which is the only reason then.
  const struct {
    std::function<void()> stops;
    TextView reason;
  } kStops[] = {
      {[&] { control.gbConnectionFailed = true; }, u"gbConnectionFailed was set."},
      {[&] { control.mobjFileupload->AbortFileTransfer(true); }, u"The transfer was stopped."},
      {[&] { control.EndTransfer(); }, u"The control was closed."},
  };
  for (const auto& test : kStops) {
    downloader.waits = {[&](FakeDownloader&) { test.stops(); }};
    EXPECT_EQ(download(), "");
    EXPECT_TRUE(downloader.waits.empty());
    EXPECT_EQ(std::ranges::count(log, "cancel"), 1);
    EXPECT_EQ(control.m_LastError, ftp_error::kAborted);
    EXPECT_EQ(control.m_strLastErrorDesc, test.reason);
  }
  // The next one is not meant.
  Succeed();
  EXPECT_EQ(download().substr(0, 5), "9999 ");
  EXPECT_EQ(control.m_LastError, ftp_error::kSuccess);
}

// In any event the host may try another transfer, list anew, or take the client away.
TEST_F(ListImageDownload, OneTransferAtATime) {
  uploader.script = Upload;
  fake.files.files[u"C:\\new.jpg"] = {1536, 0};
  const std::pair<bool, const char*> kCases[] = {{false, "9999 0"}, {false, "9999 100"}, {false, "state 9"},
                                                 {true, "state 0"}, {true, "9999 20"},   {true, "state 10"}};
  for (const auto& [downloads, event] : kCases) {
    SCOPED_TRACE(event);
    List({{"a.jpg", "1"}, {"b.jpg", "1"}});
    view.Select(0, true);
    Succeed();
    fake.files.files.erase(u"C:\\To\\a.jpg");
    bool acted = false;
    OnEvent(event, [&] {
      acted = true;
      EXPECT_TRUE(control.m_bTransferInProgress);
      control.m_bTransferInProgress = false;
      log.clear();
      EXPECT_FALSE(control.UploadImage(u"C:\\new.jpg"));
      EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"");
      ExpectLog({});
      EXPECT_EQ(control.m_LastError, ftp_error::kTransferInProgress);
      // What is no transfer is free to run.
      EXPECT_TRUE(control.RenameFile(u"b.jpg", u"c.jpg"));
      control.ChangeFileFilter(u"gif");
      control.mobjFileupload.reset();
    });
    if (downloads) {
      EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"C:\\To\\a.jpg");
    } else {
      EXPECT_TRUE(control.UploadImage(u"C:\\new.jpg"));
    }
    EXPECT_TRUE(acted);
    EXPECT_EQ(control.m_LastError, ftp_error::kSuccess);
    EXPECT_EQ(Records(), downloads ? "a.jpg,c.jpg," : "a.jpg,c.jpg,new.jpg,");
    EXPECT_EQ(fake.files.files.contains(u"C:\\To\\a.jpg"), downloads);
    host.onEvent = nullptr;
    control.mobjFileupload = std::make_shared<CFileUpload>(fake.apartment);
    control.ChangeFileFilter(u"*");
  }
}

TEST_F(ListImageDownload, CloseEndsTheWait) {
  List({{"a.jpg", "1"}});
  view.Select(0, true);
  Succeed();
  OnEvent("9999 20", [&] {
    control.Close();
    EXPECT_EQ(log.back(), "cancel") << "the host may pump messages here";
  });
  EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"C:\\To\\a.jpg");
  EXPECT_EQ(downloader.waits.size(), 3U);
  log.clear();
  EXPECT_EQ(control.DownLoadFileFromServer(u"C:\\To"), u"");
  EXPECT_FALSE(control.UploadImage(u"C:\\new.jpg"));
  ExpectLog({});
}

}  // namespace
}  // namespace tarnwick
