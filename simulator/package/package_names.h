// Recognises the file names of packages and JARs. Reads no files.
#pragma once

#include <strings.h>

#include <algorithm>
#include <iterator>
#include <string_view>

namespace simulator {

// The endings of the file names of packages, JARs, sets of packages, and app bundles.
inline constexpr std::string_view kPackageEndings[] = {".apk",  ".jar",  ".apks",
                                                       ".xapk", ".apkm", ".aab"};

// True if `name` ends with one of kPackageEndings. Ignores the case of letters.
inline bool IsPackageName(std::string_view name) {
  return std::any_of(std::begin(kPackageEndings), std::end(kPackageEndings),
                     [name](std::string_view ending) {
                       return name.size() >= ending.size() &&
                              strncasecmp(name.data() + name.size() - ending.size(), ending.data(),
                                          ending.size()) == 0;
                     });
}

}  // namespace simulator
