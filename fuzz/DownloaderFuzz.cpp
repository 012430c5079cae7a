// Whatever a server sends, in whatever pieces, and however the connection ends: the downloader writes what
// came after the first empty line, or nothing.
#include <cstdint>
#include <cstdlib>
#include <string>

#include "transfer/FileNameGuard.h"
#include "transfer/SocketDownloader.h"

namespace {

using namespace tarnwick;

struct Actions : DownloadActions {
  std::string request;
  std::string body;
  Text path;
  int ends = 0;
  bool written = false;
  void Connect(const DownloadPlan& plan) override {
    if (plan.port == 0) std::abort();
  }
  void Send(std::string_view bytes) override { request.append(bytes); }
  void CloseSocket() override {}
  void RestartWatchdog() override {}
  void StopWatchdog() override {}
  void BeginFile(TextView target, TextView) override { path = target; }
  void WriteFile(std::string_view bytes) override { body += bytes; }
  bool FinishFile(std::string_view rest) override {
    written = true;
    body += rest;
    return true;
  }
  void DropFile() override { body.clear(); }
  void Received(std::int32_t bytes) override {
    if (bytes < 0) std::abort();
  }
  void HeaderFound(std::string_view, std::int32_t) override {}
  void Finished(bool) override { ++ends; }
  void Failed(DownloadFailure, bool) override { ++ends; }
};

}  // namespace

// The input: the length of the address, then the address, how the connection ends, and the pieces, each after
// its length.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  std::string_view input(reinterpret_cast<const char*>(data), size);
  const auto take = [&] {
    const std::size_t length = input.empty() ? 0 : static_cast<unsigned char>(input[0]);
    input.remove_prefix(input.empty() ? 0 : 1);
    const std::string_view piece = input.substr(0, length);
    input.remove_prefix(piece.size());
    return piece;
  };
  const std::string_view url = take();
  const std::string_view choice = take();
  const char end = choice.empty() ? '\0' : choice[0];
  Actions actions;
  SocketDownloader machine(actions);
  machine.StartDownload(u"http://h/" + TextFromLatin1(url), u"", {u"C:\\t", end & 4 ? u"proxy" : u"", u"80"});
  const bool started = machine.IsRunning();
  machine.OnConnected();
  // One request, whose lines are ours.
  if (started && (actions.request.find("\r\n\r\n") != actions.request.size() - 4 ||
                  actions.request.find("\r\nHost: ") != actions.request.find("\r\n")))
    std::abort();
  std::string sent;
  while (!input.empty()) {
    std::string_view piece = take();
    sent.append(piece);
    while (!piece.empty()) {
      const std::span<char> room = machine.Room();
      if (room.empty()) break;
      const std::size_t count = piece.copy(room.data(), room.size());
      machine.OnArrived(count);
      piece.remove_prefix(count);
    }
  }
  if (end & 1) machine.OnSocketError();
  if (end & 2) machine.OnWatchdog();
  machine.OnClosedByPeer();
  machine.OnClosedByPeer();
  const std::size_t head = sent.find("\r\n\r\n");
  const bool expected = started && (end & 3) == 0 && head != std::string::npos;
  if (actions.ends != 1 || actions.written != expected) std::abort();
  if (expected &&
      (actions.body != sent.substr(head + 4) || !IsSafeFileName(TextView(actions.path).substr(5))))
    std::abort();
  return 0;
}
