// What the OLE side of a control and the control itself know of each other.
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

// What OleControl needs of the control that it belongs to. None of these is called once the control ends.
class OleControlHooks {
 public:
  virtual ~OleControlHooks() = default;

  // The control as its container sees it; not counted.
  virtual IUnknown& Identity() = 0;
  virtual const CLSID& ClassId() const = 0;

  // The window of the control, created on the first call without a container as its parent; null on failure.
  virtual HWND Window() = 0;
  // Takes the window out of its container and hides it.
  virtual void Park() = 0;
  // Client size of the window in its own pixels, which Draw uses, when its screen has another DPI than the
  // system.
  virtual std::optional<SIZE> SizeOnOtherScreen() = 0;
  // Draws the control as it looks without a window, into `bounds` in pixels of `dc`.
  virtual void Draw(HDC dc, const RECT& bounds) = 0;
  // The container's values have changed, or the control came into another container.
  virtual void AmbientChanged(const AmbientValues& values) = 0;
  // Gives the control's window the keyboard focus.
  virtual void GiveFocus() = 0;
  // Moves the focus to the next stop inside the control, or to the one before; false at the end.
  virtual bool MoveFocus(bool backward) = 0;
  // The container closes the control: what runs ends.
  virtual void Closing() = 0;
  // The container has let go of the control.
  virtual void SiteGone() = 0;

  virtual std::span<const PersistedProperty> Properties() const = 0;
  virtual std::int32_t GetProperty(DISPID id) const = 0;
  virtual void SetProperty(DISPID id, std::int32_t value) = 0;
};

}  // namespace tarnwick
