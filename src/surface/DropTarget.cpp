#include "surface/DropTarget.h"

#include "surface/Guard.h"

namespace tarnwick {
namespace {

constexpr std::int16_t kEnters = 0;
constexpr std::int16_t kLeaves = 1;
constexpr std::int16_t kMoves = 2;

class DropSource final : public ComObject<IDropSource> {
 public:
  explicit DropSource(const std::function<bool(DWORD)>& feedback) : feedback_(feedback) {}

  STDMETHODIMP QueryContinueDrag(BOOL escape, DWORD keys) override {
    if (escape) return DRAGDROP_S_CANCEL;
    return keys & (MK_LBUTTON | MK_RBUTTON) ? S_OK : DRAGDROP_S_DROP;
  }
  STDMETHODIMP GiveFeedback(DWORD effect) override {
    return Guarded([&]() -> HRESULT { return feedback_(effect) ? DRAGDROP_S_USEDEFAULTCURSORS : S_OK; });
  }

 private:
  const std::function<bool(DWORD)> feedback_;
};

}  // namespace

DropTarget::DropTarget(HWND window, IUnknown& identity, DropUser& user)
    : window_(window), identity_(&identity), user_(&user) {
  RegisterDragDrop(window_, this);
}

void DropTarget::Revoke() {
  user_ = nullptr;
  RevokeDragDrop(window_);
}

DragPoint DropTarget::PointOf(DWORD keys, POINTL screen) const {
  POINT point = {screen.x, screen.y};
  ScreenToClient(window_, &point);
  DragPoint at;
  at.button = static_cast<std::int16_t>((keys & MK_LBUTTON ? 1 : 0) | (keys & MK_RBUTTON ? 2 : 0) |
                                        (keys & MK_MBUTTON ? 4 : 0));
  at.shift = static_cast<std::int16_t>((keys & MK_SHIFT ? 1 : 0) | (keys & MK_CONTROL ? 2 : 0) |
                                       (keys & 0x20 /* MK_ALT */ ? 4 : 0));
  at.x = static_cast<float>(point.x);
  at.y = static_cast<float>(point.y);
  return at;
}

template <typename What>
HRESULT DropTarget::Notify(What&& what) noexcept {
  if (!user_) return S_OK;
  const ComPtr<IUnknown> alive(identity_);
  return Guarded([&] {
    what(*user_);
    return S_OK;
  });
}

STDMETHODIMP DropTarget::DragEnter(IDataObject* data, DWORD keys, POINTL at, DWORD* effect) {
  if (!data || !effect) return E_INVALIDARG;
  return Guarded([&] {
    // Held: the host's code may end the drag inside.
    const auto dragged = ComPtr<DataObject>::Adopt(new DataObject(*data));
    data_ = dragged;
    return Notify([&](DropUser& user) { user.DragMoves(*dragged, *effect, PointOf(keys, at), kEnters); });
  });
}

STDMETHODIMP DropTarget::DragOver(DWORD keys, POINTL at, DWORD* effect) {
  if (!effect) return E_INVALIDARG;
  const ComPtr<DataObject> data = data_;
  if (!data) return E_UNEXPECTED;
  return Notify([&](DropUser& user) { user.DragMoves(*data, *effect, PointOf(keys, at), kMoves); });
}

STDMETHODIMP DropTarget::DragLeave() {
  const ComPtr<DataObject> data = std::move(data_);
  if (!data) return S_OK;
  DWORD none = DROPEFFECT_NONE;
  return Notify([&](DropUser& user) { user.DragMoves(*data, none, DragPoint(), kLeaves); });
}

STDMETHODIMP DropTarget::Drop(IDataObject*, DWORD keys, POINTL at, DWORD* effect) {
  if (!effect) return E_INVALIDARG;
  const ComPtr<DataObject> data = std::move(data_);
  if (!data) return E_UNEXPECTED;
  return Notify([&](DropUser& user) { user.Dropped(*data, *effect, PointOf(keys, at)); });
}

DWORD RunDrag(DataObject& data, DWORD allowedEffects, const std::function<bool(DWORD)>& feedback) {
  const auto source = ComPtr<DropSource>::Adopt(new DropSource(feedback));
  DWORD effect = DROPEFFECT_NONE;
  const HRESULT result = DoDragDrop(static_cast<IDataObject*>(&data), source.Get(), allowedEffects, &effect);
  return result == DRAGDROP_S_DROP ? effect : DROPEFFECT_NONE;
}

}  // namespace tarnwick
