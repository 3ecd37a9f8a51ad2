// Parses the text of a JAR manifest or signature file (JAR File Specification, "JAR Manifest" and
// "Signed JAR File") into sections of attributes. A ManifestMf owns the text; the names and values
// of the attributes point into the text. A syntax error in the text is logged, once per load().
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "apk/manifest_sections.h"

class ManifestMf {
 public:
  using Section = ManifestSection;
  using Sections = ManifestSections;

  // A new object has no text and no sections, and is not valid. A moved-from object has no
  // sections, but keeps the result of its last load(). Views into the moved text stay valid: the
  // object that received the text owns it.
  ManifestMf() = default;
  ManifestMf(ManifestMf&&) = default;
  ManifestMf& operator=(ManifestMf&&) = default;

  // Discards the former text and parses `text`, which may have any bytes. Returns false if `text`
  // does not parse. The sections that ended before the fault are then kept. Also returns false,
  // without a message, for a text of 4 GiB or more. The tool never loads a text of this length,
  // because a ZipEntry has lengths of 32 bits.
  bool load(std::vector<uint8_t> text);
  bool load(const std::string& text) {
    return load(std::vector<uint8_t>(text.begin(), text.end()));
  }

  // The result of the last load().
  explicit operator bool() const { return valid_; }

  // The sections that the last load() found, in the order of the text, the main section first. A
  // section without an empty line at its end is left out. The returned reference must not be used
  // after the object was loaded again or moved.
  const Sections& getSections() const { return sections_; }

 private:
  bool parse();

  std::vector<uint8_t> text_;  // with continuation lines joined to the lines that they continue
  Sections sections_;          // of the text
  bool valid_ = false;
};
