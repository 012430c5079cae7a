# Warnings for our own code; code of others is included as system headers.
add_library(tarnwick_warnings INTERFACE)
target_compile_options(
  tarnwick_warnings INTERFACE -Wall -Wextra -Wpedantic -Wconversion -Wshadow -Werror)
