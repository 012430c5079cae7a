// A scripted double of the list window, which writes into the transcript.
#pragma once

#include <string>
#include <vector>

#include "controls/listimage/ListView.h"
#include "fakes/FakeHost.h"

namespace tarnwick {

// Keeps the selection as a list window does.
struct FakeListView : ListView {
  explicit FakeListView(Transcript& itsLog) : log(itsLog) {}
  Transcript& log;
  std::vector<bool> selected;
  std::optional<std::size_t> focused;
  bool multiple = true;
  bool listShown = true;
  Text label;
  Text hint;
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
  void SetHint(TextView text) override { hint = text; }
  bool IsSelected(std::size_t index) const override { return selected.at(index); }
  std::optional<std::size_t> NextSelected(std::size_t from) const override {
    for (std::size_t i = from; i < selected.size(); ++i)
      if (selected[i]) return i;
    return std::nullopt;
  }
  // What the user does.
  void Select(std::size_t index, bool select) {
    if (select && !multiple) selected.assign(selected.size(), false);
    selected.at(index) = select;
  }
  void SelectAlone(std::size_t index) override {
    selected.assign(selected.size(), false);
    selected.at(index) = true;
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

}  // namespace tarnwick
