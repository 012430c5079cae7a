#include "EventWording.h"

namespace tarnwick::demo {
namespace {

const wchar_t* Words(int code) {
  switch (code) {
    case 1001:
      return L"file deleted";
    case 1002:
      return L"item skipped by the delete";
    case 1005:
      return L"not allowed for this account";
    case 1014:
      return L"upload refused: the quota is used up";
    case 1015:
      return L"current item";
    case kCodeMenu:
      return L"context menu for";
    case 1020:
      return L"files are dragged over";
    case 1021:
      return L"dropped, but no files from outside";
    case kCodeClickBegins:
      return L"selection about to change";
    case kCodeDropped:
      return L"file dropped";
    case kCodeOpen:
      return L"open";
    case kCodeRenamed:
      return L"renamed";
    case 1032:
      return L"another picture has this name";
    case 1033:
      return L"rename failed";
    case 1034:
      return L"name refused";
    case 1035:
      return L"no file may have this name";
    case kCodeDeleteKey:
      return L"delete";
    case 5555:
      return L"download failed";
    case kCodeRefreshKey:
      return L"list again";
    case 8888:
      return L"rename begins";
    case kCodeProgress:
      return L"progress";
    default:
      return L"event";
  }
}

}  // namespace

std::wstring Wording(int code, const std::wstring& text) {
  switch (code) {
    case kCodeQuickStart:
      return L"QuickStart";
    case kCodeBusy:
      return text == L"1" ? L"busy: pictures are being fetched" : L"pictures fetched";
    case kCodeSwitchView:
      return L"to the list";
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
