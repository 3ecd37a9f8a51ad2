// Which files of a directory are packages: known by their names. Nothing is kept, nothing is read.
#pragma once

#include <strings.h>

#include <algorithm>
#include <iterator>
#include <string_view>

namespace simulator {

// Packages, JARs, and what packages are delivered in.
inline constexpr std::string_view kPackageEndings[] = {".apk",  ".jar",  ".apks",
                                                       ".xapk", ".apkm", ".aab"};

// True if `name` ends so, in any letter case.
inline bool IsPackageName(std::string_view name) {
  return std::any_of(std::begin(kPackageEndings), std::end(kPackageEndings),
                     [name](std::string_view ending) {
                       return name.size() >= ending.size() &&
                              strncasecmp(name.data() + name.size() - ending.size(), ending.data(),
                                          ending.size()) == 0;
                     });
}

}  // namespace simulator
