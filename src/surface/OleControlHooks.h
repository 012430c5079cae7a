// What the OLE side of a control knows of the control itself.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oaidl.h>

#include <cstdint>
#include <optional>
#include <span>

#include "surface/AmbientValues.h"

namespace tarnwick {

// A property that is kept with the host's form.
struct PersistedProperty {
  const wchar_t* name;
  DISPID id;
  VARTYPE type;
};

// What the OLE side needs of the control that it belongs to. None of these is called once the control is
// being destroyed. The host's code, where it runs, is an event's or the container's, and may re-enter the
// control.
class OleControlHooks {
 public:
  virtual ~OleControlHooks() = default;

  // The controlling unknown, without a reference of its own.
  virtual IUnknown& Identity() = 0;
  virtual const CLSID& ClassId() const = 0;

  // The window of the control, created on the first call without a container as its parent; null on failure.
  virtual HWND Window() = 0;
  // Takes the window out of its container and hides it. Runs the code of the window that gets the focus
  // instead.
  virtual void Park() = 0;
  // Client size of the window in its own pixels, which Draw uses, when its screen has another DPI than the
  // system.
  virtual std::optional<SIZE> SizeOnOtherScreen() = 0;
  // Draws the control as it looks without a window, into `bounds` in pixels of `dc`.
  virtual void Draw(HDC dc, const RECT& bounds) = 0;
  // The container's values have changed, or the control came into another container. May run the host's code.
  virtual void AmbientChanged(const AmbientValues& values) = 0;
  // Gives the control's window the keyboard focus. Runs the code of the window that had it, and the host's.
  virtual void GiveFocus() = 0;
  // Moves the focus to the next stop inside the control, or to the one before; false at the last one. May run
  // the host's code.
  virtual bool MoveFocus(bool backward) = 0;
  // The container closes the control: transfers that run are stopped. May run the host's code.
  virtual void Closing() = 0;
  // The container has let go of the control. May run the host's code.
  virtual void SiteGone() = 0;

  virtual std::span<const PersistedProperty> Properties() const = 0;
  virtual std::int32_t GetProperty(DISPID id) const = 0;
  virtual void SetProperty(DISPID id, std::int32_t value) = 0;
};

}  // namespace tarnwick
