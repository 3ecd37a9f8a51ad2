# The language level and the warnings that every target is built with, and what the tool's own code
# is held to on top of them. Warnings are errors in the developers' presets alone: a new warning of a
# newer compiler must not stop a build of the packages.
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

# What the platform hardens its own programs with. Symbols are bound before the program starts, and
# their table is read-only then; programs lie anywhere in memory; the stack is protected; calls are
# checked where the compiler knows how much room there is; on 64-bit Arm so are jumps and returns.
# scripts/check-binary looks for all of it in what was made.
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
  "Sanitizers that everything is built with, as -fsanitize= takes them (empty: none)")
if(APKTOOLKIT_SANITIZE)
  add_compile_options(-fsanitize=${APKTOOLKIT_SANITIZE} -fno-sanitize-recover=all
    -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${APKTOOLKIT_SANITIZE})
endif()

# Unsigned numbers may wrap, but in the tool only where it says that it means them to
# (crypto/wrapping.h).
option(APKTOOLKIT_CHECK_OVERFLOW "Take unsigned overflow for a mistake (clang)" OFF)
if(APKTOOLKIT_CHECK_OVERFLOW)
  list(APPEND APKTOOLKIT_TOOL_OPTIONS -fsanitize=unsigned-integer-overflow
    -fsanitize-ignorelist=${PROJECT_SOURCE_DIR}/cmake/foreign_code.txt)
endif()

option(APKTOOLKIT_COVERAGE "Count the lines that run (scripts/coverage)" OFF)
if(APKTOOLKIT_COVERAGE)
  add_compile_options(--coverage -O0)
  add_link_options(--coverage)
endif()
