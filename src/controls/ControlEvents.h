// What a control tells its host. The host's code runs inside these calls and may do anything, such as calling
// the control again or releasing it.
#pragma once

#include <cstdint>

#include "base/Text.h"

namespace tarnwick {

// Codes of FileManagerEvent.
namespace event {
inline constexpr std::int16_t kDeleted = 1001;
inline constexpr std::int16_t kNotSelected = 1002;    // a delete passed over the item
inline constexpr std::int16_t kNotAllowed = 1005;     // by the account
inline constexpr std::int16_t kUploadRefused = 1014;  // the quota is used up
// Description: its address; without one an empty text, in the thumbnails three blanks.
inline constexpr std::int16_t kCurrentItem = 1015;
inline constexpr std::int16_t kContextMenu = 1016;  // the right button; description as for kCurrentItem
inline constexpr std::int16_t kDragOver = 1020;     // files are dragged over the thumbnails
// A drop that comes from a control of ours; in the thumbnails any without files.
inline constexpr std::int16_t kOwnDrop = 1021;
inline constexpr std::int16_t kClickBegins = 1022;
inline constexpr std::int16_t kFileDrop = 1023;  // description: a file's path; empty after the last one
inline constexpr std::int16_t kClickEnds = 1024;
// Description: the new name; empty from the thumbnails' editor.
inline constexpr std::int16_t kRenamed = 1031;
inline constexpr std::int16_t kNameTaken = 1032;
inline constexpr std::int16_t kRenameFailed = 1033;
inline constexpr std::int16_t kNameRefused = 1034;
inline constexpr std::int16_t kNameUnfit = 1035;   // empty, or it begins as no name may begin
inline constexpr std::int16_t kQuickStart = 1111;  // the link of an empty account
inline constexpr std::int16_t kBusy = 1234;        // description: "1" when it begins, "-1" at the end
inline constexpr std::int16_t kDeleteKey = 2222;   // the host may delete the selected picture
inline constexpr std::int16_t kSwitchView = 5554;
inline constexpr std::int16_t kDownloadFailed = 5555;
inline constexpr std::int16_t kRefreshKey = 7777;  // the host may list the account again
inline constexpr std::int16_t kRenameKey = 8888;   // a rename begins
inline constexpr std::int16_t kProgress = 9999;    // description: percent of an upload, bytes of a download
}  // namespace event

// FTP_CONNECTION_STATES that a transfer passes through.
enum class ConnectionState : std::int32_t {
  kResolvingHost = 0,
  kConnected = 2,
  kTransferStarting = 9,
  kTransferCompleted = 10,
};

// The data object of a drag, as the surface makes it; the rules only pass it on.
struct DragData {
  virtual ~DragData() = default;
};

// Where the pointer is in a drag and what is pressed, numbered as hosts know it.
struct DragPoint {
  std::int16_t button = 0;
  std::int16_t shift = 0;
  float x = 0;
  float y = 0;
};

// None of them throws; a host's failure ends in the surface.
class ControlEvents {
 public:
  virtual ~ControlEvents() = default;

  virtual void FileManagerEvent(std::int16_t code, TextView description) = 0;
  virtual void OLEStartDrag(DragData& data, std::int32_t& allowedEffects) = 0;
  virtual void OLESetData(DragData& data, std::int16_t format) = 0;
  virtual void OLEGiveFeedback(std::int32_t& effect, bool& defaultCursors) = 0;
  virtual void OLEDragOver(DragData& data, std::int32_t& effect, const DragPoint& at, std::int16_t state) = 0;
  virtual void OLEDragDrop(DragData& data, std::int32_t& effect, const DragPoint& at) = 0;
  virtual void OLECompleteDrag(std::int32_t effect) = 0;
  virtual void StateChanged(ConnectionState state) = 0;
  // Bytes so far.
  virtual void DownloadProgress(std::int32_t lBytes) = 0;
  virtual void UploadProgress(std::int32_t lBytes) = 0;
  virtual void ReplyMessage(TextView sMessage) = 0;
};

}  // namespace tarnwick
