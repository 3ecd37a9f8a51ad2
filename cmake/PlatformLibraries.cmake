# The platform's own libraries, as Debian builds them for a workstation: headers under
# /usr/include/android, libraries in the multiarch folder's `android/`. Their headers are system
# headers (the `cfi` attribute warnings in them are not ours to mend), and their `libcrypto` is the
# platform's, not the host's, so its folder comes first.
set(PLATFORM_INCLUDE_DIR ${CMAKE_SYSROOT}/usr/include/android CACHE PATH
  "Headers of the platform libraries")
set(PLATFORM_LIBRARY_DIR ${CMAKE_SYSROOT}/usr/lib/${CMAKE_LIBRARY_ARCHITECTURE}/android CACHE PATH
  "Platform libraries")

foreach(name ziparchive androidfw utils log crypto)
  find_library(PLATFORM_${name}_LIBRARY ${name}
    PATHS ${PLATFORM_LIBRARY_DIR} NO_DEFAULT_PATH REQUIRED)
  add_library(platform::${name} SHARED IMPORTED)
  set_target_properties(platform::${name} PROPERTIES
    IMPORTED_LOCATION ${PLATFORM_${name}_LIBRARY}
    INTERFACE_INCLUDE_DIRECTORIES ${PLATFORM_INCLUDE_DIR})
endforeach()

# The zip library that everything here is built against: the one that is installed, or the one with
# the interface of API level 27 that tests/compat puts in front of it.
option(APKTOOLKIT_ZIPSTRING "Build against the zip library's interface of API level 27" OFF)
if(APKTOOLKIT_ZIPSTRING)
  add_subdirectory(tests/compat)
  add_library(platform::zip ALIAS zipstring_library)
else()
  add_library(platform::zip ALIAS platform::ziparchive)
endif()
