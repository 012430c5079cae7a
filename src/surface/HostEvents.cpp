#include "surface/HostEvents.h"

#include <array>

#include "surface/DataObject.h"
#include "surface/Guard.h"
#include "surface/TypeLibrary.h"

namespace tarnwick {
namespace {

template <typename Value>
VARIANT ReferenceTo(VARTYPE type, Value& value) {
  VARIANT reference = {};
  V_VT(&reference) = static_cast<VARTYPE>(type | VT_BYREF);
  V_BYREF(&reference) = &value;
  return reference;
}

// The data as a by-reference argument: what the host puts in its place is released like the object itself.
Variant Owned(DragData& data) {
  return Variant(static_cast<DataObject&>(data).Dispatch());
}
VARIANT ObjectReference(Variant& owned) {
  return ReferenceTo(VT_DISPATCH, V_DISPATCH(&owned.Get()));
}

}  // namespace

void HostEvents::FileManagerEvent(std::int16_t code, TextView description) {
  Done([&] {
    Variant number;
    V_VT(&number.Get()) = VT_I2;
    V_I2(&number.Get()) = code;
    Variant text;
    text.Get() = VariantFromText(description);
    std::array arguments = {ReferenceTo(VT_VARIANT, number.Get()), ReferenceTo(VT_BSTR, V_BSTR(&text.Get()))};
    ole_.Raise(DISPID_FileManagerEvent, arguments);
  });
}

void HostEvents::OLEStartDrag(DragData& data, std::int32_t& allowedEffects) {
  Variant object = Owned(data);
  LONG effects = allowedEffects;
  std::array arguments = {ObjectReference(object), ReferenceTo(VT_I4, effects)};
  ole_.Raise(DISPID_OLEStartDrag, arguments);
  allowedEffects = effects;
}

void HostEvents::OLESetData(DragData& data, std::int16_t format) {
  Variant object = Owned(data);
  std::array arguments = {ObjectReference(object), ReferenceTo(VT_I2, format)};
  ole_.Raise(DISPID_OLESetData, arguments);
}

void HostEvents::OLEGiveFeedback(std::int32_t& effect, bool& defaultCursors) {
  LONG shown = effect;
  VARIANT_BOOL cursors = AutomationBoolean(defaultCursors);
  std::array arguments = {ReferenceTo(VT_I4, shown), ReferenceTo(VT_BOOL, cursors)};
  ole_.Raise(DISPID_OLEGiveFeedback, arguments);
  effect = shown;
  defaultCursors = cursors != VARIANT_FALSE;
}

void HostEvents::OLEDragOver(DragData& data, std::int32_t& effect, const DragPoint& at, std::int16_t state) {
  Variant object = Owned(data);
  LONG wanted = effect;
  DragPoint point = at;
  std::array arguments = {ObjectReference(object),          ReferenceTo(VT_I4, wanted),
                          ReferenceTo(VT_I2, point.button), ReferenceTo(VT_I2, point.shift),
                          ReferenceTo(VT_R4, point.x),      ReferenceTo(VT_R4, point.y),
                          ReferenceTo(VT_I2, state)};
  ole_.Raise(DISPID_OLEDragOver, arguments);
  effect = wanted;
}

void HostEvents::OLEDragDrop(DragData& data, std::int32_t& effect, const DragPoint& at) {
  Variant object = Owned(data);
  LONG wanted = effect;
  DragPoint point = at;
  std::array arguments = {ObjectReference(object),          ReferenceTo(VT_I4, wanted),
                          ReferenceTo(VT_I2, point.button), ReferenceTo(VT_I2, point.shift),
                          ReferenceTo(VT_R4, point.x),      ReferenceTo(VT_R4, point.y)};
  ole_.Raise(DISPID_OLEDragDrop, arguments);
  effect = wanted;
}

void HostEvents::RaiseNumber(DISPID event, std::int32_t number) {
  LONG value = number;
  std::array arguments = {ReferenceTo(VT_I4, value)};
  ole_.Raise(event, arguments);
}

void HostEvents::OLECompleteDrag(std::int32_t effect) {
  RaiseNumber(DISPID_OLECompleteDrag, effect);
}

void HostEvents::StateChanged(ConnectionState state) {
  RaiseNumber(DISPID_StateChanged, static_cast<std::int32_t>(state));
}

void HostEvents::DownloadProgress(std::int32_t lBytes) {
  RaiseNumber(DISPID_DownloadProgress, lBytes);
}

void HostEvents::UploadProgress(std::int32_t lBytes) {
  RaiseNumber(DISPID_UploadProgress, lBytes);
}

void HostEvents::ReplyMessage(TextView sMessage) {
  Done([&] {
    Variant text;
    text.Get() = VariantFromText(sMessage);
    std::array arguments = {text.Get()};
    ole_.Raise(DISPID_ReplyMessage, arguments);
  });
}

}  // namespace tarnwick
