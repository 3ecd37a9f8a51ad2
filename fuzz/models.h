// Second readers of what the tool reads as text, written only to be compared with the tool's: they
// cut the text into pieces where the tool walks over its bytes.
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

// What the base64 text stands for, if it is one.
std::optional<std::vector<uint8_t>> ReadBase64(const std::string& text);
