// The text of a JAR manifest or signature file, parsed into sections of attributes.
#pragma once

#include <map>
#include <string>
#include <vector>

class ManifestMf {
 public:
  using Section = std::map<std::string, std::string>;

  ManifestMf() = default;
  bool load(const std::string& text);
  explicit operator bool() const { return valid_; }
  const std::vector<Section>& getSections() const { return sections_; }

 private:
  bool parse();

  std::string text_;
  std::vector<Section> sections_;
  bool valid_ = false;
};
