#include "StbImage.h"

#define STB_IMAGE_IMPLEMENTATION
#define STB_IMAGE_STATIC
#define STBI_NO_THREAD_LOCALS
#include <stb_image.h>

namespace tarnwick::bench {

int StbWidth(const char* path) {
  int width = 0;
  int height = 0;
  int channels = 0;
  return stbi_info(path, &width, &height, &channels) ? width : 0;
}

}  // namespace tarnwick::bench
