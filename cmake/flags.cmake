# Compiler and linker flags.  What the presets choose (optimisation, debugging
# information, sanitizers) is not here; this is what every variant shares.

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)

# Behaviour hangs on these, so they hold for all code, GoogleTest included:
# the stack walk follows frame pointers, and no multiplication may be fused
# with an addition, or the targets would print different digits.
add_compile_options(
  -fno-omit-frame-pointer
  -ffp-contract=off
  -fstack-protector-strong
  # __FILE__ is shown to users: the path inside the project, wherever it lies.
  -ffile-prefix-map=${CMAKE_SOURCE_DIR}/=
  # Debuggers and reports find such a path from the project's root.
  -fdebug-prefix-map=${CMAKE_BINARY_DIR}=.)
add_link_options(-fstack-protector-strong)

if(WIN32)
  # x87 registers are wider than a double and would change the bytes of some
  # values on their way through.
  add_compile_options(-msse2 -mfpmath=sse)
  # No DLL beside the system's own.
  add_link_options(-static)
endif()

# Our own code, tests included.
add_library(zx_warnings INTERFACE)
target_compile_options(zx_warnings INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wconversion
  $<$<BOOL:${ZX_WERROR}>:-Werror>
  # The sanitizers' own code confuses this one, in the standard library too.
  $<$<CONFIG:Asan>:-Wno-maybe-uninitialized>)

# Our library and programs.
add_library(zx_library_flags INTERFACE)
target_link_libraries(zx_library_flags INTERFACE zx_warnings)
target_compile_options(zx_library_flags INTERFACE -fno-exceptions -fno-rtti)

# Our tests: the standard library may throw there.  Still no RTTI, since a
# test that derives from a class of the library would ask for the type
# information that the library does not have.
add_library(zx_test_flags INTERFACE)
target_link_libraries(zx_test_flags INTERFACE zx_warnings)
target_compile_options(zx_test_flags INTERFACE -fno-rtti)
