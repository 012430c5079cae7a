// Everything that the library uses of Windows, in one object.
#pragma once

#include "platform/Platform.h"
#include "platform/windows/WindowsFileSystem.h"
#include "platform/windows/WindowsHttpTransport.h"
#include "platform/windows/WindowsInternet.h"
#include "platform/windows/WindowsMessagePump.h"
#include "platform/windows/WindowsRegistry.h"
#include "platform/windows/WindowsStringResources.h"

namespace tarnwick {

class WindowsPlatform {
 public:
  // `module` is the library's own, for its strings.
  explicit WindowsPlatform(HINSTANCE module) : strings_(module) {}

  // Refers to the members; valid while this object lives.
  Platform View() { return {registry_, http_, internet_, files_, strings_, pump_}; }

 private:
  WindowsRegistry registry_;
  WindowsHttpTransport http_;
  WindowsInternet internet_;
  WindowsFileSystem files_;
  WindowsStringResources strings_;
  WindowsMessagePump pump_;
};

}  // namespace tarnwick
