# The platform's own libraries. By default, these are Debian's builds for a workstation: headers
# under /usr/include/android, libraries under /usr/lib/<architecture>/android. The libraries are
# imported targets. CMake therefore treats their headers as system headers. The compiler then does
# not print the headers' warnings about the `cfi` attribute. /usr/include/android also has the
# headers of the platform's `libcrypto`. OpenSSL's headers in /usr/include can have the same names,
# so the compiler searches /usr/include/android first.
set(PLATFORM_INCLUDE_DIR ${CMAKE_SYSROOT}/usr/include/android CACHE STRING
  "Headers of the platform libraries: one directory, or a list of them")
set(PLATFORM_LIBRARY_DIR ${CMAKE_SYSROOT}/usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}/android CACHE PATH
  "Platform libraries")

set(PLATFORM_LIBRARIES ziparchive androidfw utils log crypto)
foreach(name ${PLATFORM_LIBRARIES})
  find_library(PLATFORM_${name}_LIBRARY ${name}
    PATHS ${PLATFORM_LIBRARY_DIR} NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH REQUIRED)
  add_library(platform::${name} SHARED IMPORTED)
  set_target_properties(platform::${name} PROPERTIES
    IMPORTED_LOCATION ${PLATFORM_${name}_LIBRARY}
    INTERFACE_INCLUDE_DIRECTORIES "${PLATFORM_INCLUDE_DIR}")
endforeach()
