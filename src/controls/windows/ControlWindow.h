// What the windows of the controls have in common: the window is made on first use and parked below a hidden
// one while the control is in no container, it has the look that the container gives, and it keeps its
// control alive while it handles a message, because the host's code runs inside.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <optional>
#include <utility>

#include "base/RuntimeError.h"
#include "platform/windows/ComPtr.h"
#include "platform/windows/Owner.h"

namespace tarnwick {

// The control that a window belongs to, as its window needs it.
class ControlWindowUser {
 public:
  virtual ~ControlWindowUser() = default;

  // Keep the control alive, as those of a COM object do. Release may end the control and its window.
  virtual ULONG STDMETHODCALLTYPE AddRef() = 0;
  virtual ULONG STDMETHODCALLTYPE Release() = 0;

  // The window is about to be destroyed by anybody but its object, such as its container.
  virtual void WindowEnds() = 0;

  // The host's code runs in these: it may call the control inside, and destroy its window.

  // The window or one inside it got the focus, or a button went down there.
  virtual void Activated() = 0;
  // The focus has left the window and all inside it.
  virtual void FocusLeft() = 0;
  // What is selected is dragged out. Returns after the drop, and pumps messages until then.
  virtual void DragBegins() = 0;
};

class ControlWindow {
 public:
  ControlWindow(const ControlWindow&) = delete;
  ControlWindow& operator=(const ControlWindow&) = delete;

  // The window of the whole control, made hidden and without a container on the first call; null on failure.
  HWND Window();
  // Takes the window out of its container and hides it; what it shows stays.
  void Park();
  // Moves the keyboard focus to the next stop inside the control, or to the one before; false at the end,
  // when it is the container's turn.
  virtual bool MoveFocus([[maybe_unused]] bool backward) { return false; }
  // Size in pixels, when the window's screen has other dots per inch than the system; else nullopt.
  std::optional<SIZE> SizeOnOtherScreen() const;
  // Whether the process has windows of controls. A window is destroyed up to one message after its control.
  static bool AnyLeft();
  // Null for the system's own font, nullopt for the system's own colour. The font stays the caller's.
  void SetLook(HFONT font, std::optional<COLORREF> text, std::optional<COLORREF> background);

 protected:
  // `module` is where the window's class belongs. `control` outlives the object.
  ControlWindow(HINSTANCE module, const wchar_t* className, ControlWindowUser& control);
  ~ControlWindow();

  // Makes what is inside the window; false on failure.
  virtual bool MakeChildren() = 0;
  // The window and all inside it are gone, although the control is not.
  virtual void WindowGone() = 0;
  // Font or colours are others now. Called only while there is a window.
  virtual void ApplyLook() = 0;
  // The window is on a screen of other dots per inch than `before`. ApplyLook follows.
  virtual void DpiChanged(int before) = 0;
  // A message for the window of the control or for a child of it; nullopt leaves it to that window's own
  // procedure. The control lives until the message is handled. Its window may be gone, or be another one,
  // when a call that runs the host's code returns.
  virtual std::optional<LRESULT> OnMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam) = 0;

  // A child, or a child's child, whose messages come to OnMessage too; null on failure. `name` is its text.
  HWND MakeChild(HWND parent, const wchar_t* className, const wchar_t* name, DWORD style,
                 const RECT& place = {});
  // Lets the messages of a window that a child made for itself come to OnMessage too.
  void Watch(HWND window);

  // The window; null when there is none yet.
  HWND Outer() const { return window_; }
  // The container's, as it is: one that follows the screen gives another one there. Else the system's, as
  // large as the screen needs it.
  HFONT Font() const;
  COLORREF TextColor() const { return textColor_.value_or(GetSysColor(COLOR_WINDOWTEXT)); }
  COLORREF BackColor() const { return backColor_.value_or(GetSysColor(COLOR_WINDOW)); }
  // Dots per inch of the screen that the window is on; of the system before there is a window.
  int Dpi() const { return dpi_; }

  void ShowHourglass(bool hourglass);
  bool HasHourglass() const { return hourglass_; }

  ControlWindowUser& control_;

 private:
  static LRESULT CALLBACK WindowProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  static LRESULT CALLBACK ChildProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam, UINT_PTR id,
                                    DWORD_PTR outer);
  static ControlWindow* Of(HWND outer);
  template <typename Body>
  LRESULT Handle(Body&& body);
  LRESULT OnLook(HWND window, UINT message, WPARAM wParam, LPARAM lParam) const;
  void TellFocusLeft(HWND outer, UINT message, WPARAM wParam);
  std::optional<LRESULT> OnTab(HWND outer, UINT message, WPARAM wParam, LPARAM lParam);
  bool MakeWindow();
  void FollowDpi();

  const HINSTANCE module_;
  const wchar_t* const className_;
  HWND window_ = nullptr;
  // There was a window; its class may be registered since then.
  bool registered_ = false;
  // All children are there.
  bool made_ = false;
  bool hourglass_ = false;
  int dpi_;
  HFONT font_ = nullptr;
  // The system's font for a screen of other dots per inch than the system's, else empty.
  FontOwner ownFont_;
  std::optional<COLORREF> textColor_;
  std::optional<COLORREF> backColor_;
};

}  // namespace tarnwick
