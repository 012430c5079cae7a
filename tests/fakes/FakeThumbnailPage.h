// A scripted double of the thumbnail window. It keeps what it shows, and writes captions, pictures and the
// editor into the transcript.
#pragma once

#include <array>
#include <string>

#include "controls/thumbnailview/ThumbnailPage.h"
#include "fakes/FakeHost.h"

namespace tarnwick {

struct FakeThumbnailPage : ThumbnailPage {
  explicit FakeThumbnailPage(Transcript& itsLog) : log(itsLog) {}
  struct Slot {
    bool shown = false;
    std::string caption;
    std::string tip;
    std::string picture;
    PicturePlace place;
    bool selected = false;
  };
  Transcript& log;
  std::array<Slot, kSlotCount> slots;
  bool grid = false;
  std::string message;
  std::string link;
  std::string gridText;
  bool scrolls = false;
  int max = 0;
  int value = 0;
  int editor = 0;
  Text edited;

  Slot& At(int slot) { return slots.at(static_cast<std::size_t>(slot - 1)); }
  // The captions of the visible slots; "*" marks the selected one, "!" one without a picture.
  std::string Look() const {
    if (!grid) return message + "/" + link;
    std::string look = gridText;
    for (const Slot& slot : slots)
      if (slot.shown) look += slot.caption + (slot.selected ? "*" : "") + (slot.picture.empty() ? "! " : " ");
    return look;
  }

  void ShowGrid(bool itsGrid) override {
    grid = itsGrid;
    for (Slot& slot : slots) slot.shown = grid;
  }
  void SetEmptyTexts(TextView itsMessage, TextView itsLink) override {
    message = Utf8FromText(itsMessage);
    link = Utf8FromText(itsLink);
  }
  void SetGridText(TextView text) override { gridText = Utf8FromText(text); }
  void ShowSlot(int slot, bool shown) override { At(slot).shown = shown; }
  void ClearSlot(int slot) override {
    At(slot).caption.clear();
    At(slot).tip.clear();
    At(slot).picture.clear();
  }
  void SetCaption(int slot, TextView caption) override {
    At(slot).caption = Utf8FromText(caption);
    log.push_back("caption " + std::to_string(slot) + " " + At(slot).caption);
  }
  void SetTip(int slot, TextView tip) override { At(slot).tip = Utf8FromText(tip); }
  bool SetPicture(int slot, TextView path, const std::optional<PicturePlace>& place) override {
    log.push_back("picture " + std::to_string(slot) + (place ? "" : " without a place"));
    // As if only what has a place were a picture.
    if (!place) return false;
    At(slot).picture = Utf8FromText(path);
    At(slot).place = *place;
    return true;
  }
  void SetSelected(int slot, bool selected) override { At(slot).selected = selected; }
  void SetScrollRange(int itsMax) override { max = itsMax; }
  void EnableScroll(bool enabled) override { scrolls = enabled; }
  void SetScrollValue(int itsValue) override { value = itsValue; }
  int ScrollValue() const override { return value; }
  void ShowEditor(int slot, TextView name) override {
    editor = slot;
    edited = name;
    log.push_back("editor " + std::to_string(slot) + " " + Utf8FromText(name));
  }
  void HideEditor() override {
    editor = 0;
    log.emplace_back("editor hides");
  }
  Text EditorText() const override { return edited; }
  bool hasFocus = true;
  bool HasFocus() const override { return hasFocus; }
  // How often it was given the focus.
  int focused = 0;
  void Focus() override { ++focused; }
  void SetHourglass(bool) override {}
  void StartDrag() override { log.emplace_back("page drag"); }
};

}  // namespace tarnwick
