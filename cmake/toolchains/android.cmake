# Builds for 64-bit Arm and API level 27, with clang 9 or later, lld, and your own sysroot. The
# sysroot (-DCMAKE_SYSROOT=DIR) must have the target's C and C++ headers and libraries.
# -DPLATFORM_INCLUDE_DIR names the header directories of the platform libraries.
# -DPLATFORM_LIBRARY_DIR names the directory of these libraries (docs/porting.md).
#
# CMAKE_SYSTEM_NAME is Linux, because CMake requires an NDK if the name is Android.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)

set(CMAKE_SYSROOT "" CACHE PATH "Root of the target's headers and libraries")
if(NOT CMAKE_SYSROOT)
  message(FATAL_ERROR "The android preset needs -DCMAKE_SYSROOT=DIR, see docs/porting.md")
endif()
set(CMAKE_TRY_COMPILE_PLATFORM_VARIABLES CMAKE_SYSROOT)
# Some sysroots lack the start files of programs, so CMake must check the compiler without linking a
# program.
set(CMAKE_TRY_COMPILE_TARGET_TYPE STATIC_LIBRARY)

if(NOT CMAKE_CXX_COMPILER)
  find_program(ANDROID_CLANG clang++ REQUIRED)
  set(CMAKE_CXX_COMPILER ${ANDROID_CLANG})
endif()
set(CMAKE_CXX_COMPILER_TARGET aarch64-linux-android27)
set(CMAKE_LIBRARY_ARCHITECTURE aarch64-linux-android)
# The platform's C++ library is libc++. Some clang versions do not choose it for this target. Some
# phones have pages of 16 KiB, and most have pages of 4 KiB. A program that is linked for 16 KiB
# runs on both kinds of phones.
set(CMAKE_CXX_FLAGS_INIT "-stdlib=libc++")
set(CMAKE_EXE_LINKER_FLAGS_INIT "-fuse-ld=lld -Wl,-z,max-page-size=16384")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-fuse-ld=lld -Wl,-z,max-page-size=16384")

set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
