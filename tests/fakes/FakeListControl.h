// Scripted doubles around the list control: window, host and transfers. All write into one transcript, in the
// order in which things happen.
#pragma once

#include <deque>
#include <functional>
#include <string>
#include <vector>

#include "controls/ControlEvents.h"
#include "controls/listimage/ListView.h"
#include "support/RuntimeError.h"

namespace tarnwick {

using Transcript = std::vector<std::string>;

// Keeps the selection as a list window does.
struct FakeListView : ListView {
  explicit FakeListView(Transcript& itsLog) : log(itsLog) {}
  Transcript& log;
  std::vector<bool> selected;
  std::optional<std::size_t> focused;
  bool multiple = true;
  bool listShown = true;
  Text label;
  std::string columns;

  void SetColumns(std::span<const ListColumn> all) override {
    columns.clear();
    for (const ListColumn& column : all)
      columns += Utf8FromText(column.key) + "=" + Utf8FromText(column.title) + ";";
    log.emplace_back("view columns");
  }
  void SetItemCount(std::size_t count) override {
    selected.assign(count, false);
    focused.reset();
    log.push_back("view items " + std::to_string(count));
  }
  void AppendItem() override {
    selected.push_back(false);
    log.emplace_back("view append");
  }
  void RefreshItem(std::size_t index) override { log.push_back("view refresh " + std::to_string(index)); }
  void ShowList(bool list) override {
    listShown = list;
    log.emplace_back(list ? "view list" : "view label");
  }
  void SetLabelText(TextView text) override { label = text; }
  bool IsSelected(std::size_t index) const override { return selected.at(index); }
  std::optional<std::size_t> NextSelected(std::size_t from) const override {
    for (std::size_t i = from; i < selected.size(); ++i)
      if (selected[i]) return i;
    return std::nullopt;
  }
  void Select(std::size_t index, bool select) override {
    if (select && !multiple) selected.assign(selected.size(), false);
    selected.at(index) = select;
  }
  void SetFocusTo(std::size_t index) override {
    focused = index;
    log.push_back("view at " + std::to_string(index));
  }
  void SetMultiSelect(bool several) override { multiple = several; }
  void EndLabelEdit() override { log.emplace_back("view end edit"); }
  void Focus() override { log.emplace_back("view focus"); }
  void SetHourglass(bool hourglass) override {
    log.emplace_back(hourglass ? "view hourglass" : "view pointer");
  }
  void StartDrag() override { log.emplace_back("view drag"); }
};

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
