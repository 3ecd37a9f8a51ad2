// The text of a JAR manifest or signature file (JAR File Specification, "JAR Manifest" and "Signed
// JAR File"), parsed into sections of attributes. The object owns its copy of the text and all
// sections. What does not parse is logged as an error, once per load().
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <vector>

// The reader is lenient where signing tools differ: lines may have any length, CR LF, LF CR, CR and
// LF end them, and a line without a colon only becomes part of the next name. It is strict about
// the byte after a colon. What it makes of odd line breaks decides which digest belongs to which
// entry, and is pinned by tests; comments in the parser mark it.
class ManifestMf {
 public:
  // Attribute values by name, in byte order of the names. Names and values are kept as written,
  // continuation lines joined; the later of two equal names wins; pairs with an empty value or an
  // empty name are left out.
  using Section = std::map<std::string, std::string>;

  // Holds no text and no sections, and is not valid.
  ManifestMf() = default;

  // Forgets everything and parses `text`, any bytes. False when it does not parse; the sections
  // that ended before the fault are there all the same.
  bool load(const std::string& text);

  // The result of the last load().
  explicit operator bool() const { return valid_; }

  // The sections of the last load() that an empty line ended, in the order of the text, the main
  // section first. The reference is good until the next load().
  const std::vector<Section>& getSections() const { return sections_; }

 private:
  friend class ManifestMfPeer;  // lets a test reach the guard of step()

  enum State : int {
    P_START = 0,         // before a name, at the start of the text or after an empty line
    P_KEY = 1,           // at a name
    P_COLON = 2,         // at the colon after a name
    P_VALUE = 3,         // at a value
    P_CONTINUATION = 4,  // at a continuation line
    P_EOL = 5,           // at a line break, what the next line is being open
  };

  // What parse() holds between two steps. The cursor is an index into the text and never beyond its
  // end; the byte at the end reads as NUL, which stops every scan.
  struct Progress {
    State state = P_START;
    size_t cursor = 0;
    std::string name;  // the pending pair, which is not in the section yet
    std::string value;
    Section section;  // the one being built

    void storePair();
  };

  bool parse();
  bool step(Progress& at);
  void skipToName(Progress& at) const;
  bool readName(Progress& at) const;
  bool passColon(Progress& at) const;
  std::string readLine(Progress& at) const;
  void endLine(Progress& at);

  std::string text_;
  std::vector<Section> sections_;
  bool valid_ = false;
};
