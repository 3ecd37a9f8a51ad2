// A compiled AndroidManifest.xml, as the tool reads it and as the phone's installer does. The two
// follow different rules, so a package can have one name for each of them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct AndroidManifest {
  // The strings of the document overlap. The platform's parser would use many times the size of
  // the document, so the document is not read.
  bool has_overlaps = false;
  // The package's name by the tool's own reader; none if it cannot read the document.
  std::optional<std::string> package_name;
  // The package's name by the installer's rules: the root's attribute "package" without a
  // namespace. UTF-8, up to the first NUL.
  std::string installer_name;
  // The attribute extractNativeLibs of the first application; none if it has no such attribute.
  std::optional<bool> extracts_libraries;
};

AndroidManifest ParseAndroidManifest(const std::vector<uint8_t>& bytes);

}  // namespace simulator
