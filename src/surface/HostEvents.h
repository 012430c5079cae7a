// The events of a control on their way to the host. Each runs the host's code, which may re-enter the control
// or release it; whoever raises one keeps the control alive.
#pragma once

#include "controls/ControlEvents.h"
#include "surface/OleControl.h"

namespace tarnwick {

class HostEvents final : public ControlEvents {
 public:
  // `ole` outlives the object.
  explicit HostEvents(OleControl& ole) : ole_(ole) {}

  void FileManagerEvent(std::int16_t code, TextView description) override;
  void OLEStartDrag(DragData& data, std::int32_t& allowedEffects) override;
  void OLESetData(DragData& data, std::int16_t format) override;
  void OLEGiveFeedback(std::int32_t& effect, bool& defaultCursors) override;
  void OLEDragOver(DragData& data, std::int32_t& effect, const DragPoint& at, std::int16_t state) override;
  void OLEDragDrop(DragData& data, std::int32_t& effect, const DragPoint& at) override;
  void OLECompleteDrag(std::int32_t effect) override;
  void StateChanged(ConnectionState state) override;
  void DownloadProgress(std::int32_t lBytes) override;
  void UploadProgress(std::int32_t lBytes) override;
  void ReplyMessage(TextView sMessage) override;

 private:
  void RaiseNumber(DISPID event, std::int32_t number);

  OleControl& ole_;
};

}  // namespace tarnwick
