// What the controls' events mean to a person.
#pragma once

#include <string>

namespace tarnwick::demo {

// Codes of FileManagerEvent that the host acts on.
inline constexpr int kCodeMenu = 1016;
inline constexpr int kCodeClickBegins = 1022;
inline constexpr int kCodeDropped = 1023;
inline constexpr int kCodeOpen = 1024;
inline constexpr int kCodeRenamed = 1031;
inline constexpr int kCodeQuickStart = 1111;
inline constexpr int kCodeBusy = 1234;
inline constexpr int kCodeDeleteKey = 2222;
inline constexpr int kCodeSwitchView = 5554;
inline constexpr int kCodeRefreshKey = 7777;
inline constexpr int kCodeProgress = 9999;

// The status line for a FileManagerEvent.
std::wstring Wording(int code, const std::wstring& text);
// Whether the event tells that something could not be done.
bool TellsFailure(int code);

}  // namespace tarnwick::demo
