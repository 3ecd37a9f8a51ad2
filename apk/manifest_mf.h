// The text of a JAR manifest or signature file (JAR File Specification, "JAR Manifest" and "Signed
// JAR File"), read as sections of attributes. The object owns its text; sections are not stored but
// read from it as they are asked for, and point into it. What does not parse is logged as an error,
// once per load().
#pragma once

#include <cstddef>
#include <cstdint>
#include <forward_list>
#include <functional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

// The reader is lenient where signing tools differ: lines may have any length, CR LF, LF CR, CR and
// LF end them, and a line without a colon only becomes part of the next name. It is strict about
// the byte after a colon. What it makes of odd line breaks decides which digest belongs to which
// entry, and is pinned by tests; comments in the parser mark it.
class ManifestMf {
 public:
  // Attribute values by name, in byte order of the names: an ordered map. Names and values are kept
  // as written, continuation lines joined; the later of two equal names wins; pairs with an empty
  // value or an empty name are left out. They point into the manifest's text or, when joined, into
  // the section.
  class Section {
   public:
    using value_type = std::pair<std::string_view, std::string_view>;
    using const_iterator = std::vector<value_type>::const_iterator;

    Section() = default;
    Section(Section&&) = default;
    Section& operator=(Section&&) = default;

    const_iterator begin() const { return attributes_.begin(); }
    const_iterator end() const { return attributes_.end(); }

   private:
    friend class ManifestMf;

    void clear();
    void sort();

    std::vector<value_type> attributes_;
    std::forward_list<std::string> joined_;
  };

  class SectionIterator;
  class Sections;
  // Sees a section, and where it starts in the text.
  using Visitor = std::function<void(const Section& section, size_t position)>;

  // Holds no text and no sections, and is not valid.
  ManifestMf() = default;
  // The text stays where it is in memory, and what points into it good. What was moved from can
  // only be loaded again.
  ManifestMf(ManifestMf&&) = default;
  ManifestMf& operator=(ManifestMf&&) = default;

  // Forgets everything and parses `text`, any bytes. False when it does not parse; the sections
  // that ended before the fault are there all the same. `visit`, unless it is empty, is called for
  // each section when that has ended.
  bool load(std::vector<uint8_t> text, const Visitor& visit = {});
  bool load(const std::string& text) { return load({text.begin(), text.end()}, {}); }

  // The result of the last load().
  explicit operator bool() const { return valid_; }

  // The sections of the last load() that an empty line ended, in the order of the text, the main
  // section first: a range to walk through, good until the object is loaded again or moved.
  Sections getSections() const;

  // The section that starts at `position`, as a visitor was told.
  Section readSection(size_t position) const;

  // Whether `view` lies in the text, and hence is good for as long as the text is.
  bool holds(std::string_view view) const;

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

  // What is held between two steps. The cursor is an index into the text and never beyond its end;
  // the byte at the end reads as NUL, which stops every scan.
  struct Progress {
    State state = P_START;
    size_t cursor = 0;
    std::string_view name;  // the pending pair, which is not in the section yet
    std::string_view value;
    Section section;  // the one being read; its attributes are in the order of the text

    void storePair();
  };

  bool parse(const Visitor& visit);
  void read(Progress& at) const;
  bool step(Progress& at) const;
  void skipToName(Progress& at) const;
  bool readName(Progress& at) const;
  bool passColon(Progress& at) const;
  std::string_view readLine(Progress& at) const;
  void continueValue(Progress& at) const;
  void endLine(Progress& at) const;
  char byteAt(size_t index) const {
    return index < text_.size() ? static_cast<char>(text_[index]) : '\0';
  }
  std::string_view view(size_t start, size_t end) const {
    return {reinterpret_cast<const char*>(text_.data()) + start, end - start};
  }

  std::vector<uint8_t> text_;
  size_t end_ = 0;  // of the last section that an empty line ended
  bool valid_ = false;
};

// Reads one section after the other, each into the same object.
class ManifestMf::SectionIterator {
 public:
  const Section& operator*() const { return at_.section; }
  SectionIterator& operator++();
  bool operator!=(const SectionIterator& other) const { return position_ != other.position_; }

 private:
  friend class ManifestMf;

  SectionIterator(const ManifestMf* manifest, size_t position);
  void read();

  const ManifestMf* manifest_;
  size_t position_;
  Progress at_;
};

class ManifestMf::Sections {
 public:
  SectionIterator begin() const { return {manifest_, 0}; }
  SectionIterator end() const { return {manifest_, manifest_->end_}; }

 private:
  friend class ManifestMf;
  explicit Sections(const ManifestMf* manifest) : manifest_(manifest) {}
  const ManifestMf* manifest_;
};
