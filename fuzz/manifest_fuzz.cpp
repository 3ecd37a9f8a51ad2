// apk/manifest_mf.h: any text as a manifest. ManifestMf and a second parser (ReadManifest in
// fuzz/models.h) must find the same sections.
#include "apk/manifest_mf.h"

#include <map>
#include <string>
#include <vector>

#include "fuzz/fuzz.h"
#include "fuzz/models.h"

namespace {

std::vector<std::map<std::string, std::string>> SectionsOf(const ManifestMf& manifest) {
  std::vector<std::map<std::string, std::string>> sections;
  for (const ManifestMf::Section& section : manifest.getSections()) {
    sections.emplace_back(section.begin(), section.end());
  }
  return sections;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  ManifestMf manifest;
  const bool valid = manifest.load(text);
  Require(valid == static_cast<bool>(manifest),
          "the manifest, converted to bool, is the result of load()");

  const ManifestModel expected = ReadManifest(text);
  Require(valid == expected.valid, "both parsers accept the text, or both refuse it");
  Require(SectionsOf(manifest) == expected.sections, "both parsers find the same sections");

  manifest.load(text);
  Require(SectionsOf(manifest) == expected.sections, "a second load() keeps nothing of the first");
  return 0;
}
