// An account whose service and pages are doubles, for a control whose host and window are doubles too.
// Everything that happens stands in one transcript.
#pragma once

#include <gtest/gtest.h>

#include <map>

#include "controls/FileControl.h"
#include "fakes/FakeHost.h"
#include "fakes/FakePlatform.h"
#include "fakes/FakeTransfers.h"
#include "support/HttpAddress.h"

namespace tarnwick {

inline const std::string kGif("GIF89a\x90\x01\xC8\x00\xF7", 11);  // 400 by 200

class ControlTest : public testing::Test {
 protected:
  struct File {
    std::string name;
    std::string size;
  };

  // What the control finds when it is made.
  bool Prepare() {
    SessionValues& session = fake.apartment.session;
    session.serverName = u"h:81";
    session.userName = u"u@x";
    session.password = Text(u"p");
    session.productNumber = 7;
    fake.registry.InternetSettings()[u"ProxyEnable"] = FakeRegistry::Number(0);
    fake.strings.own[3582] = u"No pictures.";
    fake.strings.own[4001] = u"No such pictures.";
    fake.http.onPost = [this](const FakeHttp::Sent& sent) { Answer(sent); };
    fake.pump.onYield = [this] { log.emplace_back("yield"); };
    return true;
  }

  void Answer(const FakeHttp::Sent& sent) {
    // "/bv/bin/BVServicePage.asp?Request=NAME&Flag=0"; the first parameter is the enciphered name again.
    const std::size_t at = sent.target.find('=') + 1;
    const std::string name = sent.target.substr(at, sent.target.find('&') - at);
    const std::size_t parameters = sent.body.find('&');
    log.push_back("ask " + name + " " +
                  (parameters == std::string::npos ? "" : sent.body.substr(parameters + 1)));
    const auto answer = name == "ListFilesRequest" ? Listing() : replies[name];
    fake.http.answers.clear();
    if (answer != "fails") fake.http.answers.push_back(HttpAnswer{200, answer});
  }
  std::string Listing() const {
    if (listingFails) return "fails";
    std::string reply = "FileName&FileURL&FileSize&FileDate";
    for (const File& file : account)
      reply += "&FileName=" + EscapeFormValue(*TextFromUtf8(file.name)) +
               "&FileURL=" + EscapeFormValue(u"http://h/u/" + *TextFromUtf8(file.name)) +
               "&FileSize=" + file.size + "&FileDate=today";
    return reply;
  }
  // Where the control keeps the file's copy.
  static Text CopyOf(const std::string& name) { return u"C:\\Temp\\bv\\u@x\\" + *TextFromUtf8(name); }
  static std::string AddressOf(const std::string& name) { return "http://h/u/" + name; }
  std::string Records() const { return NamesOf(fake.apartment.listing.all); }
  // Only the lines that the host hears.
  std::string Events() const {
    std::string events;
    for (const std::string& line : log)
      if (std::isdigit(static_cast<unsigned char>(line[0])) != 0) events += line + ",";
    return events;
  }
  // What the host hears while the action runs.
  std::string Heard(const std::function<void()>& action) {
    log.clear();
    action();
    return Events();
  }
  void OnEvent(const std::string& event, const std::function<void()>& action) {
    host.onEvent = [event, action](const std::string& raised) {
      if (raised == event) action();
    };
  }
  void ExpectLog(const Transcript& expected) {
    EXPECT_EQ(log, expected);
    log.clear();
  }
  static void Upload(UploadEvents& events) {
    events.Initializing();
    events.Connecting();
    events.UploadStarted();
    events.UploadProgress(50, 768);
    events.ServerProcess();
    events.UploadComplete();
    events.ActionComplete();
  }

  FakePlatform fake;
  // Answers of the service by request; an empty one lacks every variable, "fails" is a lost connection.
  std::map<std::string, std::string> replies{{"CanUploadFile", "CanUploadFile=1001"},
                                             {"FileUploadRequest", "FileURL=http%3A%2F%2Fh%2Fu%2Fnew.jpg"},
                                             {"DeleteFileRequest", "DeleteStatus=TRUE"},
                                             {"RenameFileRequest", "lRenameFileStatus=1001"}};
  std::vector<File> account;
  bool listingFails = false;
  Transcript log;
  FakeHost host{log};
  FakeUploader uploader{log, fake.files};
  FakeDownloader downloader{log, fake.files};
  const bool prepared = Prepare();
  const ControlParts parts{fake.apartment, host, uploader, downloader};
};

}  // namespace tarnwick
