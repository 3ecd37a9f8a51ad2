// Parses the text of a JAR manifest or signature file (JAR File Specification, "JAR Manifest" and
// "Signed JAR File") into sections of attributes. The object owns the text; everything it returns
// points into that text. A text that does not parse is logged as an error, once per load().
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "apk/manifest_sections.h"

class ManifestMf {
 public:
  using Section = ManifestSection;
  using Sections = ManifestSections;

  // Holds no text and no sections, and is not valid. A moved-from object has no sections either,
  // but keeps the result. Views into its text now point into the object that received the text.
  ManifestMf() = default;
  ManifestMf(ManifestMf&&) = default;
  ManifestMf& operator=(ManifestMf&&) = default;

  // Forgets everything and parses `text`, which may be any bytes. Returns false if it does not
  // parse; the sections that ended before the fault are kept. A text of 4 GiB or more does not
  // parse and is not logged: no entry of an archive is that long.
  bool load(std::vector<uint8_t> text);
  bool load(const std::string& text) {
    return load(std::vector<uint8_t>(text.begin(), text.end()));
  }

  // The result of the last load().
  explicit operator bool() const { return valid_; }

  // The sections of the last load() that an empty line ended, in the order of the text, the main
  // section first. Valid until the object is loaded again or moved.
  const Sections& getSections() const { return sections_; }

 private:
  bool parse();

  std::vector<uint8_t> text_;  // with continuation lines joined to the lines that they continue
  Sections sections_;          // of the text
  bool valid_ = false;
};
