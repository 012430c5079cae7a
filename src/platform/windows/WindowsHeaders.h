// The one place that includes the system's header.
#pragma once

#ifndef WIN32_LEAN_AND_MEAN
#define WIN32_LEAN_AND_MEAN
#endif
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>

// The header maps these names to their ...A or ...W forms, or away altogether, by macro, and with them every
// member of ours that is called the same. Calls into the system name their form, so nobody misses the macros.
#undef CopyFile
#undef CreateFile
#undef CreateWindow
#undef DeleteFile
#undef FindWindow
#undef GetClassName
#undef GetCurrentTime
#undef GetMessage
#undef GetObject
#undef GetTempPath
#undef GetUserName
#undef LoadImage
#undef LoadLibrary
#undef LoadString
#undef MoveFile
#undef PostMessage
#undef SendMessage
#undef SetPort
#undef Yield
#undef far
#undef near
#undef small
