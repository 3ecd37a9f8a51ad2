// A compiled AndroidManifest.xml, read by the rules of the tool and by the rules of the phone's
// installer. The rules differ, so a package can have two names: one for the tool, and one for the
// installer.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct AndroidManifest {
  // The strings of the document overlap so much that their total length exceeds the document's
  // size. The platform's parser could then use many times this size in memory, so the document is
  // not read.
  bool has_overlaps = false;
  // The package's name as the tool's own code reads it; none if `has_overlaps` is true, or if the
  // platform's parser refuses the document.
  std::optional<std::string> package_name;
  // The package's name by the installer's rules: the root's attribute "package" without a
  // namespace. UTF-8, up to the first NUL.
  std::string installer_name;
  // The attribute extractNativeLibs, in any namespace, of the first <application> element after the
  // root's start. None if the element or the attribute is missing, or if the attribute's value is
  // neither boolean nor integer.
  std::optional<bool> extracts_libraries;
};

AndroidManifest ParseAndroidManifest(const std::vector<uint8_t>& bytes);

}  // namespace simulator
