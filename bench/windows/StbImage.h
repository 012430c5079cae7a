// One function of the stb library, kept away from code that has warnings switched on.
#pragma once

namespace tarnwick::bench {

// Width of a picture file in pixels; 0 when it is not recognised.
int StbWidth(const char* path);

}  // namespace tarnwick::bench
