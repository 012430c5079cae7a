#include "EventWording.h"

namespace tarnwick::demo {
namespace {

const wchar_t* Words(int code) {
  switch (code) {
    case 1001:
      return L"File deleted";
    case 1002:
      return L"Item skipped by the delete";
    case 1005:
      return L"Not allowed for this account";
    case 1014:
      return L"Upload refused: the quota is used up";
    case 1015:
      return L"Current item";
    case kCodeMenu:
      return L"Context menu for";
    case 1020:
      return L"Files are dragged over";
    case 1021:
      return L"Dropped, but no files from outside";
    case kCodeClickBegins:
      return L"Selection about to change";
    case kCodeDropped:
      return L"File dropped";
    case kCodeOpen:
      return L"Enter, or the end of a click";
    case kCodeRenamed:
      return L"Renamed";
    case 1032:
      return L"Another picture has this name";
    case 1033:
      return L"Rename failed";
    case 1034:
      return L"Name refused";
    case 1035:
      return L"No file may have this name";
    case kCodeDeleteKey:
      return L"Delete";
    case 5555:
      return L"Download failed";
    case kCodeRefreshKey:
      return L"List again";
    case 8888:
      return L"Rename begins";
    case kCodeProgress:
      return L"Progress";
    default:
      return L"Event";
  }
}

}  // namespace

std::wstring Wording(int code, const std::wstring& text) {
  switch (code) {
    case kCodeQuickStart:
      return L"QuickStart";
    case kCodeBusy:
      return text == L"1" ? L"Fetching pictures" : L"Pictures fetched";
    case kCodeSwitchView:
      return L"To the list";
    default:
      return text.empty() ? Words(code) : Words(code) + (L" " + text);
  }
}

bool TellsFailure(int code) {
  switch (code) {
    case 1002:
    case 1005:
    case 1014:
    case 1032:
    case 1033:
    case 1034:
    case 1035:
    case 5555:
      return true;
    default:
      return false;
  }
}

}  // namespace tarnwick::demo
