# The language level, the warnings and the hardening of every target, and stricter rules for the
# tool's own code. Options add sanitizers and coverage, or turn the hardening off. This file does
# not turn warnings into errors; most presets in CMakePresets.json do. A new warning of a newer
# compiler must not stop a build without a preset, for example the build of a Debian package.
set(CMAKE_CXX_STANDARD 17)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
if(NOT CMAKE_BUILD_TYPE)
  set(CMAKE_BUILD_TYPE Release)
endif()
set(CMAKE_CXX_FLAGS_RELEASE "-O2")

add_compile_options(-Wall -Wextra)
set(APKTOOLKIT_TOOL_OPTIONS -fno-exceptions -fno-rtti -Wconversion)

# The hardening that the platform uses for its own programs. Symbols are bound before the program
# starts, and their table is then read-only. Programs can be loaded at any address. The stack is
# protected. Calls of C library functions such as memcpy are checked where the compiler knows the
# size of the buffer. On 64-bit Arm, jumps and returns are protected, too. scripts/check-binary
# checks that compiled files have this hardening. It checks the protection of jumps and returns only
# in object files and static libraries.
option(APKTOOLKIT_HARDEN "Harden programs and libraries as the platform does" ON)
if(APKTOOLKIT_HARDEN)
  include(CheckPIESupported)
  check_pie_supported(LANGUAGES CXX)
  add_link_options(LINKER:-z,relro,-z,now)
  add_compile_options(-fstack-protector-strong)
  if(NOT CMAKE_CXX_FLAGS MATCHES _FORTIFY_SOURCE)
    add_compile_definitions(_FORTIFY_SOURCE=2)
  endif()
  if(CMAKE_SYSTEM_PROCESSOR STREQUAL aarch64)
    add_compile_options(-mbranch-protection=standard)
  endif()
endif()

set(APKTOOLKIT_SANITIZE "" CACHE STRING
  "Sanitizers for the whole build, as a value of -fsanitize= (empty: none)")
if(APKTOOLKIT_SANITIZE)
  add_compile_options(-fsanitize=${APKTOOLKIT_SANITIZE} -fno-sanitize-recover=all
    -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${APKTOOLKIT_SANITIZE})
endif()

# In the tool's code, unsigned arithmetic may wrap only in functions that are marked
# WRAPS_ON_PURPOSE (crypto/wrapping.h).
option(APKTOOLKIT_CHECK_OVERFLOW "Treat unsigned overflow as an error (clang)" OFF)
if(APKTOOLKIT_CHECK_OVERFLOW)
  list(APPEND APKTOOLKIT_TOOL_OPTIONS -fsanitize=unsigned-integer-overflow
    -fsanitize-ignorelist=${PROJECT_SOURCE_DIR}/cmake/foreign_code.txt)
endif()

option(APKTOOLKIT_COVERAGE "Count the lines that run (scripts/coverage)" OFF)
if(APKTOOLKIT_COVERAGE)
  # Several threads count the same lines. Without atomic counters, some counts become negative.
  add_compile_options(--coverage -O0 -fprofile-update=atomic)
  add_link_options(--coverage)
endif()
