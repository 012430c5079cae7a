// Dragging out of a window and onto it.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ole2.h>

#include <functional>

#include "surface/ComObject.h"
#include "surface/DataObject.h"

namespace tarnwick {

// Is notified of a drag over a window and a drop onto it, and runs the host's code then. Effects are those of
// OLE; `state` is 0 when the drag enters, 1 when it leaves, 2 while it moves.
class DropUser {
 public:
  virtual ~DropUser() = default;
  virtual void DragMoves(DataObject& data, DWORD& effect, const DragPoint& at, std::int16_t state) = 0;
  virtual void Dropped(DataObject& data, DWORD& effect, const DragPoint& at) = 0;
};

// The target that is registered for a window. It belongs to the system as well, so it may outlive its user.
class DropTarget final : public ComObject<IDropTarget> {
 public:
  // Registers for `window`; `identity` is kept alive while `user` is called.
  DropTarget(HWND window, IUnknown& identity, DropUser& user);

  // From here on nothing is notified any more.
  void Revoke();

  STDMETHODIMP DragEnter(IDataObject* data, DWORD keys, POINTL at, DWORD* effect) override;
  STDMETHODIMP DragOver(DWORD keys, POINTL at, DWORD* effect) override;
  STDMETHODIMP DragLeave() override;
  STDMETHODIMP Drop(IDataObject* data, DWORD keys, POINTL at, DWORD* effect) override;

 private:
  DragPoint PointOf(DWORD keys, POINTL screen) const;
  // Runs what(user), which runs the host's code, with the control kept alive; nothing when it was revoked.
  template <typename What>
  HRESULT Notify(What&& what) noexcept;

  HWND window_;
  IUnknown* identity_;
  DropUser* user_;
  ComPtr<DataObject> data_;
};

// Runs a drag of `data` that begins with a button pressed, until the drop; the effect of it, DROPEFFECT_NONE
// when it was cancelled. `feedback` may change the effect that is shown, and says whether the system's
// pointers are used. Pumps messages, and runs the code of `feedback` and of whatever target is below the
// pointer.
DWORD RunDrag(DataObject& data, DWORD allowedEffects, const std::function<bool(DWORD effect)>& feedback);

}  // namespace tarnwick
