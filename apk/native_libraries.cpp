#include "apk/native_libraries.h"

#include <cstring>

namespace ApkTools {

std::string InstalledLibraryPath(const std::string& package_path, const std::string& entry_name) {
  for (const LibraryDirectory& row : kLibraryDirectories) {
    const size_t prefix_length = strlen(row.entry_prefix);
    // Deliberate: plain prefixes. No "/" has to follow, so "lib/armeabiX/a.so" is looked for in
    // "lib/armX/"; the digest check that follows decides all the same.
    if (entry_name.compare(0, prefix_length, row.entry_prefix) != 0) continue;
    const size_t slash = package_path.rfind('/');
    const std::string directory =
        slash == std::string::npos ? "" : package_path.substr(0, slash + 1);
    return directory + row.installed + entry_name.substr(prefix_length);
  }
  return {};
}

}  // namespace ApkTools
