// The state machine that reads the text of a manifest.
//
// It is lenient where signing tools differ: lines may have any length, CR LF, LF CR, CR and LF end
// them, and a line without a colon only becomes part of the next name. It is strict about the byte
// after a colon. What it makes of odd line breaks decides which digest belongs to which entry, and
// is pinned by tests.
#pragma once

#include <cstdint>
#include <vector>

#include "apk/manifest_sections.h"

class ManifestParser {
 public:
  enum State : int {
    P_START = 0,         // before a name, at the start of the text or after an empty line
    P_KEY = 1,           // at a name
    P_COLON = 2,         // at the colon after a name
    P_VALUE = 3,         // at a value
    P_CONTINUATION = 4,  // at a continuation line
    P_EOL = 5,           // at a line break, what the next line is being open
  };

  // Reads `text`, of less than 4 GiB, into `sections`, which was reset to it; both are borrowed.
  // Continuation lines are moved up in the text, to stand right behind the value that they
  // continue, so that every value is one piece of it.
  ManifestParser(std::vector<uint8_t>& text, ManifestSections& sections, State state = P_START)
      : text_(text.data()), size_(text.size()), sections_(sections), state_(state) {}

  // To the end of the text. False, and logged, when a name has no colon before a NUL or the end,
  // and when another byte than a space, a CR or an LF follows a colon.
  bool parse();

 private:
  bool step();
  void skipToName();
  bool readName();
  bool passColon();
  void readValue();
  void continueValue();
  void endLine();
  void storePair();
  ManifestPiece readLine();
  // The byte at the end of the text reads as NUL, which stops every scan.
  char byteAt(size_t index) const { return index < size_ ? static_cast<char>(text_[index]) : '\0'; }

  uint8_t* const text_;
  const size_t size_;
  ManifestSections& sections_;

  State state_;
  size_t cursor_ = 0;
  ManifestAttribute pending_;  // not in the section yet
};
