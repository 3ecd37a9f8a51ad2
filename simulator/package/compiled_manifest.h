// The two facts that explaining needs of a compiled AndroidManifest.xml: the package's name, and
// whether it wants its native libraries extracted. Read by an own bounded reader, since whoever
// made the bytes may mean harm; what does not read is not there.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace simulator {

struct AndroidManifest {
  std::string package_name;  // empty: not found
  // The attribute android:extractNativeLibs of the application; none when it is not there.
  std::optional<bool> extracts_libraries;
};

AndroidManifest ParseCompiledManifest(std::string_view bytes);

}  // namespace simulator
