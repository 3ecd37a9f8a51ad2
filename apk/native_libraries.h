// The paths on disk of a package's native libraries. The installer extracts the libraries into
// directories beside the package. A table maps each ABI directory in the archive to one of
// the directories beside the package. InstalledLibraryPath keeps no state and logs nothing.
#pragma once

#include <string>
#include <string_view>

namespace ApkTools {

struct LibraryDirectory {
  std::string_view entry_prefix;  // the start of the entries' names in the archive
  const char* installed;          // the start of the extracted files' paths beside the package
};

// The first row whose prefix matches wins. The row "lib/armeabi" is the last, because its prefix
// also matches every name that starts with "lib/armeabi-v7a" or "lib/armeabi-v8a".
// Deliberate: "lib/armeabi-v8a" is not a standard ABI directory. Packages that use it mean 64-bit
// Arm.
inline constexpr LibraryDirectory kLibraryDirectories[] = {
    {"lib/armeabi-v7a", "lib/arm"},
    {"lib/armeabi-v8a", "lib/arm64"},
    {"lib/arm64-v8a", "lib/arm64"},
    {"lib/armeabi", "lib/arm"},
};

// The path on disk of the library `entry_name` of the package at `package_path`. Empty if no row of
// the table matches. Otherwise the path starts with the directory of `package_path`, but an
// `entry_name` with ".." can lead out of this directory. If `package_path` has no "/", the result
// is relative to the working directory.
inline std::string InstalledLibraryPath(const std::string& package_path,
                                        const std::string& entry_name) {
  for (const LibraryDirectory& row : kLibraryDirectories) {
    // Deliberate: prefixes need not end at a "/". For example, "lib/armeabiX/a.so" is looked for in
    // "lib/armX/". The file is still signed only if its bytes have the digest that the manifest
    // lists for the entry.
    if (entry_name.compare(0, row.entry_prefix.size(), row.entry_prefix) != 0) continue;
    const size_t slash = package_path.rfind('/');
    const auto directory = package_path.substr(0, slash == std::string::npos ? 0 : slash + 1);
    return directory + row.installed + entry_name.substr(row.entry_prefix.size());
  }
  return {};
}

}  // namespace ApkTools
