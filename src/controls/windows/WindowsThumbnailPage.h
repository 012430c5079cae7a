// The window of the thumbnail control: a grid of four pictures with captions, the scroll bar beside it, the
// texts of an empty account in its place, the editor over a caption, and the button that switches to the
// list.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <array>
#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "controls/thumbnailview/ThumbnailPage.h"
#include "controls/thumbnailview/ThumbnailPageUser.h"
#include "controls/windows/ControlWindow.h"
#include "controls/windows/PageAccessible.h"
#include "controls/windows/PageScrollBar.h"
#include "controls/windows/PictureCache.h"
#include "controls/windows/PictureWorkers.h"
#include "controls/windows/ThumbnailLayout.h"
#include "controls/windows/ThumbnailTile.h"
#include "platform/windows/ComPtr.h"
#include "platform/windows/Owner.h"

namespace tarnwick {

class WindowsThumbnailPage : public ThumbnailPage, public ControlWindow {
 public:
  // Size of a control that shows all of the page, in HIMETRIC.
  static constexpr SIZEL kNaturalExtent = layout::kPageHimetric;

  // `module` is where the window's class belongs. `control` outlives the object. The thread has initialised
  // COM, which reads the pictures.
  WindowsThumbnailPage(HINSTANCE module, ControlWindowUser& control);
  ~WindowsThumbnailPage() override;

  // Before the window is made; `user` takes part until the object ends.
  void SetUser(ThumbnailPageUser& user) { user_ = &user; }

  // Draws the page as the window would show it, into `bounds` in pixels of the screen, which `dc` may map to
  // others. Waits for the pictures, because nobody draws it again when they are there.
  void Draw(HDC dc, const RECT& bounds);
  bool MoveFocus(bool backward) override;

  // For screen readers. Slot 0 is the grid.
  PageAccessible& AccessibleOf(int slot);
  HWND WindowOf(int slot) const;
  int PictureCount() const;
  // The slot that looks selected, or 0.
  int SelectedSlot() const;
  std::wstring SpokenName(int slot) const;
  // What the tip of the slot tells beside the name.
  std::wstring SpokenDetails(int slot) const;
  // Of the page among all pictures, or what the grid says in place of them.
  std::wstring SpokenPlace() const;

  void ShowGrid(bool grid) override;
  void SetEmptyTexts(TextView message, TextView link) override;
  void SetGridText(TextView text) override;
  void ShowSlot(int slot, bool shown) override;
  void ClearSlot(int slot) override;
  void SetCaption(int slot, TextView caption) override;
  void SetTip(int slot, TextView tip) override { At(slot).tip = tip; }
  bool SetPicture(int slot, TextView path, const std::optional<PicturePlace>& place) override;
  void SetSelected(int slot, bool selected) override;
  void SetScrollRange(int max) override { scrollBar_.SetRange(max); }
  void EnableScroll(bool enabled) override { scrollBar_.Enable(enabled); }
  void SetScrollValue(int value) override { scrollBar_.SetValue(value); }
  int ScrollValue() const override { return scrollBar_.Value(); }
  void ShowEditor(int slot, TextView name) override;
  void HideEditor() override;
  Text EditorText() const override;
  bool HasFocus() const override;
  void Focus() override;
  void SetHourglass(bool hourglass) override { ShowHourglass(hourglass); }
  void StartDrag() override { control_.DragBegins(); }

 private:
  struct Slot : ThumbnailTile {
    HWND window = nullptr;
    // Where the picture comes from and goes to.
    std::wstring path;
    std::optional<PicturePlace> twips;
    // The picture that a worker decodes for the slot; null when there is none.
    std::shared_ptr<const PictureRequest> awaited;
    // What the picture was last asked for to lie on.
    COLORREF background = 0;
    Text tip;
    // Why the picture is not shown; kNone also when there is no file.
    PictureFault fault = PictureFault::kNone;
    bool shown = true;
  };
  enum class Content { kNothing, kGrid, kEmptyAccount };

  bool MakeChildren() override;
  void WindowGone() override;
  void ApplyLook() override;
  void DpiChanged(int before) override;
  std::optional<LRESULT> OnMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam) override;
  std::optional<LRESULT> OnOuterMessage(UINT message, WPARAM wParam, LPARAM lParam);
  std::optional<LRESULT> OnGridMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  std::optional<LRESULT> OnEditorMessage(UINT message, WPARAM wParam, LPARAM lParam);
  std::optional<LRESULT> OnButtonMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  void RelayToTips(const MSG& message);
  bool MakeTips();
  static std::wstring TipOf(const Slot& slot);
  LRESULT OnFocus(HWND window, WPARAM wParam, LPARAM lParam);
  LRESULT OnAct(WPARAM acts, int slot);
  LRESULT OnPress(HWND window, UINT message, POINT at);
  LRESULT OnMove(POINT at);
  void EndDragWatch();

  Slot& At(int slot) { return slots_[static_cast<std::size_t>(slot) - 1]; }
  int SlotOf(HWND window) const;
  HWND FirstStop() const;
  void PlaceChildren() const;
  void TellSelection(int slot);
  void TellFocus() const;
  void DisconnectAccessibles();
  bool LoadPictureOf(Slot& slot);
  static void Show(Slot& slot, const SharedPicture& picture);
  void TakePicture(const std::shared_ptr<const PictureRequest>& request, ShownPicture picture);
  static void TellReason(const Slot& slot);
  static void Redraw(const Slot& slot);
  void PlaceEditor() const;
  void ApplyContent() const;
  void ApplyCaption(int slot);
  void ApplyTexts() const;
  FontOwner LinkFont() const;
  RECT LabelPlace(HDC dc, HFONT font, TextView text, RECT room) const;
  // Of the message and of the link.
  std::pair<RECT, RECT> LabelPlaces(HDC dc) const;
  void RefreshGrid() const;
  void PaintGrid(HWND window);
  void FollowBackground();
  TileStyle Style() const { return {Dpi(), Font(), BackColor()}; }
  void DrawGridText(HDC dc, RECT area) const;
  void DrawLabel(HDC dc, RECT area, bool isLink, bool focus) const;
  int Pixels(int twips) const { return layout::Pixels(twips, Dpi()); }
  RECT Pixels(const layout::TwipRect& area) const { return layout::Pixels(area, Dpi()); }

  ThumbnailPageUser* user_ = nullptr;
  std::array<Slot, kSlotCount> slots_;
  PictureCache pictures_;
  PictureWorkers workers_;
  Content content_ = Content::kNothing;
  Text message_;
  Text link_;
  Text gridText_;
  // What screen readers have of the page, the grid first; made when they ask.
  std::array<ComPtr<PageAccessible>, kSlotCount + 1> accessibles_;
  // What they were told last: the selected slot, or 0, its picture's name, and the page.
  int toldSlot_ = 0;
  std::wstring toldName_;
  std::wstring toldPlace_;
  PageScrollBar scrollBar_;

  HWND gridWindow_ = nullptr;
  HWND scrollWindow_ = nullptr;
  HWND messageWindow_ = nullptr;
  HWND linkWindow_ = nullptr;
  HWND switchWindow_ = nullptr;
  HWND editorWindow_ = nullptr;
  // Made when the pointer comes to a slot first. It belongs to the host's window of that moment, and may be
  // gone with it.
  Owner<HWND, DestroyWindow> tips_;
  // As long as the window of the tips reads it.
  std::wstring tipText_;
  // The slot whose name is edited, or 0.
  int edited_ = 0;
  // The control is being told of the focus, or of the end of the edit: what follows from that is no news.
  bool tellingFocus_ = false;
  bool tellingEditor_ = false;
  // Where the button went down on a picture that may be dragged out.
  std::optional<POINT> dragFrom_;
};

}  // namespace tarnwick
