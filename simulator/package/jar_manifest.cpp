#include "simulator/package/jar_manifest.h"

namespace simulator {

namespace {

// More attributes than this are not read; a package of 65,535 entries has a tenth of them.
constexpr size_t kMostAttributes = 1 << 20;

// The next line, without its end (CR LF, LF or CR), off the front of `text`.
std::string_view TakeLine(std::string_view* text) {
  const size_t end = text->find_first_of("\r\n");
  const std::string_view line = text->substr(0, end);
  if (end == std::string_view::npos) {
    text->remove_prefix(text->size());
    return line;
  }
  const bool has_two = text->compare(end, 2, "\r\n") == 0;
  text->remove_prefix(end + (has_two ? 2 : 1));
  return line;
}

bool EndsWith(std::string_view text, std::string_view end) {
  return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

}  // namespace

std::vector<ManifestSection> ParseJarManifest(std::string_view text) {
  std::vector<ManifestSection> sections(1);
  size_t count = 0;
  while (!text.empty() && count < kMostAttributes) {
    const std::string_view line = TakeLine(&text);
    ManifestSection& section = sections.back();
    if (line.empty()) {
      if (!section.empty()) sections.emplace_back();
    } else if (line[0] == ' ') {
      if (!section.empty()) section.back().second += line.substr(1);
    } else if (const size_t colon = line.find(": "); colon != std::string_view::npos) {
      section.emplace_back(line.substr(0, colon), line.substr(colon + 2));
      ++count;
    }
  }
  if (sections.back().empty()) sections.pop_back();
  return sections;
}

std::set<std::string> ListedEntries(std::string_view manifest) {
  std::set<std::string> listed;
  for (const ManifestSection& section : ParseJarManifest(manifest)) {
    std::string name;
    bool has_digest = false;
    for (const auto& [key, value] : section) {
      if (key == "Name") name = value;
      has_digest = has_digest || EndsWith(key, "-Digest");
    }
    if (has_digest && !name.empty()) listed.insert(name);
  }
  return listed;
}

std::string ClaimedSchemes(std::string_view signature_file) {
  const std::vector<ManifestSection> sections = ParseJarManifest(signature_file);
  if (sections.empty()) return {};
  for (const auto& [key, value] : sections[0]) {
    if (key == "X-Android-APK-Signed") return value;
  }
  return {};
}

bool StatesManifestDigest(std::string_view signature_file) {
  for (const ManifestSection& section : ParseJarManifest(signature_file)) {
    for (const auto& attribute : section) {
      if (EndsWith(attribute.first, "-Digest-Manifest")) return true;
    }
  }
  return false;
}

}  // namespace simulator
