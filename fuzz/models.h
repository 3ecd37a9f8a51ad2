// Second parsers for the texts that the tool parses. The fuzz targets compare the results of these
// parsers with the tool's. These parsers work in another way, so that the same fault is unlikely in
// both.
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
