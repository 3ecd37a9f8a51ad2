// Second parsers for JAR manifests and for base64, for the fuzz targets. A fuzz target compares the
// results of these parsers with the results of the tool's parsers. A second parser works in another
// way than the tool's parser, so the two are unlikely to have the same fault.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

struct ManifestModel {
  bool valid = false;
  std::vector<std::map<std::string, std::string>> sections;
};

// The sections of a JAR manifest or signature file. A section without an empty line after it
// is left out. If the text is malformed, `valid` is false, and `sections` has the sections before
// the fault.
ManifestModel ReadManifest(const std::string& text);

// The bytes that the base64 text encodes, or nothing if base64decode() refuses a character.
std::optional<std::vector<uint8_t>> ReadBase64(const std::string& text);
