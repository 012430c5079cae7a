// Scripted doubles of the components that move bytes.
#pragma once

#include <gtest/gtest.h>

#include <deque>
#include <functional>
#include <new>
#include <string>

#include "base/RuntimeError.h"
#include "fakes/FakeHost.h"
#include "fakes/FakePlatform.h"
#include "platform/SecureFetch.h"
#include "platform/StreamSocket.h"
#include "platform/Timer.h"
#include "transfer/Transfers.h"

namespace tarnwick {

struct FakeUploader : Uploader {
  FakeUploader(Transcript& itsLog, FakeFiles& itsFiles) : log(itsLog), files(itsFiles) {}
  Transcript& log;
  FakeFiles& files;
  // What the component tells while it works.
  std::function<void(UploadEvents&)> script;
  // The error with which the next calls end; 0 for none.
  std::int32_t error = 0;
  // Whether a rename ends for a lack of memory.
  bool noMemory = false;

  void Called(std::string call, std::initializer_list<TextView> arguments) {
    for (const TextView argument : arguments) call += "|" + Utf8FromText(argument);
    log.push_back(call);
  }
  void End() const {
    if (error != 0) throw RuntimeError(error);
  }
  void UploadFile(TextView path, TextView base, TextView page, std::int32_t flag, TextView user,
                  TextView password, TextView product, UploadEvents& events) override {
    Called("page upload", {path, base, page, TextFromNumber(flag), user, password, product});
    events.FileBytes(files.At(path).bytes);
    if (script) script(events);
    End();
  }
  void DeleteFile(TextView base, TextView name, TextView page, TextView user, TextView password,
                  TextView product) override {
    Called("page delete", {base, name, page, user, password, product});
    End();
  }
  void RenameFile(TextView base, TextView oldName, TextView newName, TextView page, TextView user,
                  TextView password, TextView product) override {
    Called("page rename", {base, oldName, newName, page, user, password, product});
    if (noMemory) throw std::bad_alloc();
    End();
  }
};

struct FakeDownloader : Downloader {
  FakeDownloader(Transcript& itsLog, FakeFiles& itsFiles) : log(itsLog), files(itsFiles) {}
  Transcript& log;
  FakeFiles& files;
  DownloadEvents* events = nullptr;
  Text url;
  Text target;
  // What happens while a wait sleeps, one entry a wait. A wait without one would never end.
  std::deque<std::function<void(FakeDownloader&)>> waits;

  void Wait() override {
    if (waits.empty() || !events) {
      ADD_FAILURE() << "nothing ends this wait";
      throw RuntimeError(error::kInterrupted);
    }
    const auto next = std::move(waits.front());
    waits.pop_front();
    next(*this);
  }
  void SetEvents(DownloadEvents* sink) override { events = sink; }
  bool canStart = true;
  bool CanStart(TextView) const override { return canStart; }
  // What begins to be made; empty when nothing does.
  Text prepared;
  void Prepare(TextView itsTarget) override { prepared = itsTarget; }
  void Start(TextView itsUrl, TextView explicitTarget) override {
    EXPECT_EQ(std::exchange(prepared, {}), canStart ? explicitTarget : TextView());
    url = itsUrl;
    target = explicitTarget;
    log.push_back("download " + Utf8FromText(url) + " to " + Utf8FromText(target));
  }
  void Cancel() override {
    prepared.clear();
    log.emplace_back("cancel");
  }
  void RestartWatchdog() override { log.emplace_back("watchdog starts"); }
  void StopWatchdog() override { log.emplace_back("watchdog stops"); }
};

// A stream whose events a test tells through `events`.
template <typename Stream>
struct FakeStream : Stream {
  explicit FakeStream(Transcript& itsLog) : log(itsLog) {}
  Transcript& log;
  SocketEvents* events = nullptr;
  std::string waiting;

  void Arrives(std::string_view bytes) {
    for (waiting = bytes; !waiting.empty();) {
      const std::size_t before = waiting.size();
      events->OnReadable();
      if (waiting.size() == before) return;
    }
  }
  void SetEvents(SocketEvents* sink) override { events = sink; }
  std::size_t Read(std::span<char> room) override {
    const std::size_t count = waiting.copy(room.data(), room.size());
    waiting.erase(0, count);
    return count;
  }
  int closed = 0;
  void Close() override {
    ++closed;
    log.emplace_back("close");
  }
};

struct FakeSocket : FakeStream<StreamSocket> {
  using FakeStream::FakeStream;
  std::string sent;
  void Connect(TextView host, std::uint16_t port) override {
    log.push_back("connect " + Utf8FromText(host) + ":" + std::to_string(port));
  }
  void Send(std::string_view bytes) override {
    sent = bytes;
    log.push_back("send " + sent.substr(0, sent.find('\r')));
  }
};

struct FakeSecureFetch : FakeStream<SecureFetch> {
  using FakeStream::FakeStream;
  std::string headers;
  void Begin(const HttpGet& get) override {
    headers = get.headers;
    log.push_back("fetch " + Utf8FromText(get.host) + ":" + std::to_string(get.port) + get.target);
  }
};

struct FakeTimer : Timer {
  std::function<void()> handler;
  // 0 when it does not run.
  std::uint32_t runs = 0;
  void SetHandler(std::function<void()> itsHandler) override { handler = std::move(itsHandler); }
  void Start(std::uint32_t milliseconds) override { runs = milliseconds; }
  void Stop() override { runs = 0; }
};

}  // namespace tarnwick
