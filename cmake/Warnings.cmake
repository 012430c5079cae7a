# Warnings for our own code; code of others is included as system headers.
add_library(tarnwick_warnings INTERFACE)
target_compile_options(
  tarnwick_warnings
  INTERFACE -Wall
            -Wextra
            -Wpedantic
            -Wconversion
            -Wshadow)
# On Windows the compiler is whatever MSYS2 has by now, which may find more.
if(NOT CMAKE_HOST_WIN32)
  target_compile_options(tarnwick_warnings INTERFACE -Werror)
endif()
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
  # GCC 12 sees overlapping copies in std::basic_string's operator+ with a literal on the left where there are none.
  target_compile_options(tarnwick_warnings INTERFACE -Wno-restrict)
endif()
