// What a compiled AndroidManifest.xml says, as the tool reads it and as the phone's installer does:
// the two go by other rules, and a package can be named for each of them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct AndroidManifest {
  // The package's name as the installer reads it: the attribute "package" of no namespace, of the
  // root. UTF-8, up to the first NUL.
  std::string installer_name;
  // The attribute extractNativeLibs of the first application; none when it is not there.
  std::optional<bool> extracts_libraries;
  // The package's name as the tool reads it; none where ToolPackageName was not asked, or has none.
  std::optional<std::string> package_name;
};

// As the installer reads it. What does not read is not there.
AndroidManifest ParseAndroidManifest(const std::vector<uint8_t>& bytes);

// The package's name by the tool's own reader. None for what is no compiled XML, and for a document
// that would have the platform's parser take a multiple of its size in memory.
std::optional<std::string> ToolPackageName(const std::vector<uint8_t>& bytes);

}  // namespace simulator
