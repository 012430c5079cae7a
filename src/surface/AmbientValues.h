// What a container says about itself to the controls in it.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <ocidl.h>

#include "platform/windows/ComPtr.h"

namespace tarnwick {

// What the container does not say keeps its default.
struct AmbientValues {
  ComPtr<IFont> font;
  COLORREF backColor = 0;
  COLORREF foreColor = 0;
  bool hasBackColor = false;
  bool hasForeColor = false;
  bool userMode = true;
};

// Asks `site`, which is the control's own variable and read anew for each value. Runs the container's code,
// which may release the control or set another site inside.
AmbientValues AskAmbientValues(const ComPtr<IOleClientSite>& site);

}  // namespace tarnwick
