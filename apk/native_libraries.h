// Where a package's native libraries lie on disk: the ABI directories of the archive, and the
// directories beside the package that the installer extracts them to. Nothing is kept or logged.
#pragma once

#include <string>

namespace ApkTools {

struct LibraryDirectory {
  const char* entry_prefix;  // of the names in the archive
  const char* installed;     // where the installer puts those libraries, beside the package
};

// The first row whose prefix matches wins, so the longer names come before "lib/armeabi", which is
// a prefix of two of them.
// Deliberate: "lib/armeabi-v8a" is in no usual list of ABIs; a package that has it means 64-bit
// Arm.
inline constexpr LibraryDirectory kLibraryDirectories[] = {
    {"lib/armeabi-v7a", "lib/arm"},
    {"lib/armeabi-v8a", "lib/arm64"},
    {"lib/arm64-v8a", "lib/arm64"},
    {"lib/armeabi", "lib/arm"},
};

// The path of the library `entry_name` of the package at `package_path` on disk: beside the
// package, or relative to the working directory if `package_path` has no "/". Empty if no row of
// the table has its ABI.
std::string InstalledLibraryPath(const std::string& package_path, const std::string& entry_name);

}  // namespace ApkTools
