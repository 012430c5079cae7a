// A host that hears a control's events. All doubles around a control write into one transcript, in the order
// in which things happen.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "controls/ControlEvents.h"

namespace tarnwick {

using Transcript = std::vector<std::string>;

struct FakeHost : ControlEvents {
  explicit FakeHost(Transcript& itsLog) : log(itsLog) {}
  Transcript& log;
  // What the host does in an event, which is the last line of the transcript.
  std::function<void(const std::string&)> onEvent;

  void Raised(const std::string& event) {
    log.push_back(event);
    // A copy, because the host may set another one while it runs.
    if (const auto reaction = onEvent) reaction(event);
  }
  void FileManagerEvent(std::int16_t code, TextView description) override {
    Raised(std::to_string(code) + " " + Utf8FromText(description));
  }
  void OLEStartDrag(DragData&, std::int32_t& effects) override {
    Raised("OLEStartDrag " + std::to_string(effects));
    effects = 1;
  }
  void OLESetData(DragData&, std::int16_t format) override { Raised("OLESetData " + std::to_string(format)); }
  void OLEGiveFeedback(std::int32_t& effect, bool& cursors) override {
    Raised("OLEGiveFeedback " + std::to_string(effect));
    cursors = false;
  }
  void OLEDragOver(DragData&, std::int32_t& effect, const DragPoint& at, std::int16_t state) override {
    Raised("OLEDragOver " + std::to_string(effect) + " " + std::to_string(at.button) + " " +
           std::to_string(state));
    effect = 0;
  }
  void OLEDragDrop(DragData&, std::int32_t& effect, const DragPoint& at) override {
    Raised("OLEDragDrop " + std::to_string(effect) + " " + std::to_string(at.shift));
  }
  void OLECompleteDrag(std::int32_t effect) override { Raised("OLECompleteDrag " + std::to_string(effect)); }
  void StateChanged(ConnectionState state) override {
    Raised("state " + std::to_string(static_cast<int>(state)));
  }
  void DownloadProgress(std::int32_t lBytes) override { Raised("downloaded " + std::to_string(lBytes)); }
  void UploadProgress(std::int32_t lBytes) override { Raised("uploaded " + std::to_string(lBytes)); }
  void ReplyMessage(TextView sMessage) override { Raised("reply " + Utf8FromText(sMessage)); }
};

}  // namespace tarnwick
