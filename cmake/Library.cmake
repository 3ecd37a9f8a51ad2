# Installs the files that other programs, such as examples/verify.cpp, need to link the
# verification. These files are two static libraries (the tool's code, and library/), their headers,
# and the files for CMake's find_package and for pkg-config. The directory include/apktoolkit has
# the layout of the sources, because the headers include each other by their paths in the sources.
if(APKTOOLKIT_ZIPSTRING)
  return()  # this build uses the zip library of tests/compat, which is not installed
endif()
include(CMakePackageConfigHelpers)

set(APKTOOLKIT_HEADER_DIR ${CMAKE_INSTALL_INCLUDEDIR}/apktoolkit)
set(APKTOOLKIT_CONFIG_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/apktoolkit)

install(DIRECTORY apk crypto library util DESTINATION ${APKTOOLKIT_HEADER_DIR}
  FILES_MATCHING PATTERN "*.h")
install(TARGETS apktoolkit_core apktoolkit_verification EXPORT apktoolkit
  INCLUDES DESTINATION ${APKTOOLKIT_HEADER_DIR})
set_target_properties(apktoolkit_verification PROPERTIES EXPORT_NAME verification)
set_target_properties(apktoolkit_core PROPERTIES EXPORT_NAME core)
target_compile_features(apktoolkit_core PUBLIC cxx_std_17)

install(EXPORT apktoolkit NAMESPACE apktoolkit:: FILE apktoolkit-targets.cmake
  DESTINATION ${APKTOOLKIT_CONFIG_DIR})
configure_package_config_file(cmake/apktoolkit-config.cmake.in apktoolkit-config.cmake
  INSTALL_DESTINATION ${APKTOOLKIT_CONFIG_DIR} NO_SET_AND_CHECK_MACRO)
write_basic_package_version_file(apktoolkit-config-version.cmake COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/apktoolkit-config.cmake
  ${PROJECT_BINARY_DIR}/apktoolkit-config-version.cmake cmake/PlatformLibraries.cmake
  DESTINATION ${APKTOOLKIT_CONFIG_DIR})

cmake_path(RELATIVE_PATH CMAKE_INSTALL_PREFIX
  BASE_DIRECTORY ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig OUTPUT_VARIABLE APKTOOLKIT_PC_PREFIX)
# apktoolkit.pc names the platform's libraries by their paths. With -lcrypto, the linker could find
# the host's libcrypto.
list(TRANSFORM PLATFORM_LIBRARIES REPLACE "(.+)" "\${platformdir}/lib\\1.so"
  OUTPUT_VARIABLE APKTOOLKIT_PC_LIBRARIES)
list(JOIN APKTOOLKIT_PC_LIBRARIES " " APKTOOLKIT_PC_LIBRARIES)
configure_file(cmake/apktoolkit.pc.in apktoolkit.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/apktoolkit.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
