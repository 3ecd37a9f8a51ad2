// A compiled AndroidManifest.xml, as the tool reads it and as the phone's installer does. The two
// follow different rules, so a package can have one name for each of them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct AndroidManifest {
  // The strings of the document lie in one another, so that the platform's parser would take a
  // multiple of its size in memory; it is not read.
  bool has_overlaps = false;
  // The package's name by the tool's own reader; none when that does not read the document.
  std::optional<std::string> package_name;
  // The same as the installer reads it: the attribute "package" of no namespace, of the root.
  // UTF-8, up to the first NUL.
  std::string installer_name;
  // The attribute extractNativeLibs of the first application; none when it is not there.
  std::optional<bool> extracts_libraries;
};

AndroidManifest ParseAndroidManifest(const std::vector<uint8_t>& bytes);

}  // namespace simulator
