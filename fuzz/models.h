// Second parsers for JAR manifests and for base64. The fuzz targets compare their results with
// those of the tool's parsers. The second parsers work in another way than the tool's, so that both
// are unlikely to have the same fault.
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

// The sections of a JAR manifest or signature file.
ManifestModel ReadManifest(const std::string& text);

// The bytes that the base64 text encodes, or nothing if the text is not base64.
std::optional<std::vector<uint8_t>> ReadBase64(const std::string& text);
