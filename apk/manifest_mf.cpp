#include "apk/manifest_mf.h"

#include <algorithm>
#include <cstring>
#include <string>
#include <utility>

#include "util/log.h"

namespace {

bool IsLineBreak(char c) { return c == '\r' || c == '\n'; }

// Of CR, LF and NUL, which end a line.
constexpr uint8_t kGreatestLineEnd = '\r';

// Whether each of the eight bytes is above all that end a line.
bool IsPlainText(const uint8_t* eight) {
  constexpr uint64_t kEachByte = 0x0101010101010101;
  constexpr uint64_t kHighBits = 0x80 * kEachByte;
  constexpr uint64_t kLeastPlain = (kGreatestLineEnd + 1) * kEachByte;
  uint64_t bytes;
  memcpy(&bytes, eight, sizeof(bytes));
  // With its high bit set no byte borrows from the next, and it keeps that bit when its other bits
  // are not below the least.
  return ((((bytes | kHighBits) - kLeastPlain) | bytes) & kHighBits) == kHighBits;
}

// The state machine that reads the text of a manifest.
//
// It is lenient where signing tools differ: lines may have any length, CR LF, LF CR, CR and LF end
// them, and a line without a colon only becomes part of the next name. It is strict about the byte
// after a colon. What it makes of odd line breaks decides which digest belongs to which entry, and
// is pinned by tests.
class Parser {
 public:
  Parser(std::vector<uint8_t>& text, ManifestSections& sections)
      : text_(text.data()), size_(text.size()), sections_(sections) {}

  // Deliberate: what is pending at the end of the text is dropped. Only an empty line ends a
  // section, the last one included, as signing tools write it; a section that was cut off does not
  // count.
  bool parse() {
    while (cursor_ < size_) {
      if (!isExpectedState() || !step()) return false;
    }
    return true;
  }

 private:
  enum State {
    P_START,         // before a name, at the start of the text or after an empty line
    P_KEY,           // at a name
    P_COLON,         // at the colon after a name
    P_VALUE,         // at a value
    P_CONTINUATION,  // at a continuation line
    P_EOL,           // at a line break, what the next line is being open
  };

  // Deliberate: no step leaves another state behind, and no test gets here with one. The guard
  // stays, so that one which is added and not handled below cannot make a manifest pass.
  bool isExpectedState() const {
    const bool is_expected = state_ <= P_EOL;
    if (!is_expected) LogError("Parse manifest: Unexpected state.\n");
    return is_expected;
  }

  bool step() {
    switch (state_) {
      case P_START:
        skipToName();
        break;
      case P_KEY:
        return readName();
      case P_COLON:
        return passColon();
      case P_VALUE:
        pending_.value = readLine();
        break;
      case P_CONTINUATION:
        continueValue();
        break;
      case P_EOL:
        endLine();
        break;
    }
    return true;
  }

  // Deliberate: a TAB is not skipped; it starts a name.
  void skipToName() {
    while (IsLineBreak(byteAt(cursor_)) || byteAt(cursor_) == ' ') ++cursor_;
    state_ = P_KEY;
  }

  // Deliberate: a line break does not end a name. A line without a colon is taken as the front part
  // of the next line's name, which then names nothing that anybody looks for.
  bool readName() {
    storePair();
    size_t end = cursor_;
    while (byteAt(end) != ':' && byteAt(end) != '\0') ++end;
    pending_.name = readTo(end);
    if (byteAt(end) == '\0') {
      // No more of a long name than the log keeps.
      const size_t shown = std::min<size_t>(pending_.name.length, kLogTextSize);
      const std::string name(reinterpret_cast<const char*>(text_) + pending_.name.start, shown);
      LogError("Parse manifest: Error: P_KEY: unexpected end of file after key '%s'\n",
               name.c_str());
      return false;
    }
    state_ = P_COLON;
    return true;
  }

  // Deliberate: after a line break that follows the colon at once, the cursor is always two bytes
  // past the colon, where CR LF has its LF. With a lone LF or CR that byte begins the next line and
  // is taken for the line break: it is lost from a name, and neither an empty line nor a
  // continuation line is seen there. Signing tools write CR LF; other files read as they always
  // have.
  bool passColon() {
    const char next = byteAt(cursor_ + 1);
    if (next != ' ' && !IsLineBreak(next)) {
      const auto byte = static_cast<unsigned char>(next);
      LogError("Parse manifest: Error: P_COLON: unexpected 0x%02x after colon: %c\n", byte, byte);
      return false;
    }
    cursor_ += 2;
    state_ = next == ' ' ? P_VALUE : P_EOL;
    return true;
  }

  // The line moves up to the end of the value; what lies between the two is never read again.
  void continueValue() {
    const ManifestPiece line = readLine();
    ManifestPiece& value = pending_.value;
    if (value.length == 0) {
      value = line;
      return;
    }
    memmove(text_ + value.start + value.length, text_ + line.start, line.length);
    value.length += line.length;
  }

  // What is left of the line that the cursor is in; the cursor is then on the byte that ended it.
  ManifestPiece readLine() {
    size_t end = cursor_;
    for (;; ++end) {
      while (size_ - end >= 8 && IsPlainText(text_ + end)) end += 8;
      while (end < size_ && text_[end] > kGreatestLineEnd) ++end;
      if (byteAt(end) == '\0' || IsLineBreak(byteAt(end))) break;
    }
    state_ = P_EOL;
    return readTo(end);
  }

  // What lies from the cursor to `end`, where the cursor is then.
  ManifestPiece readTo(size_t end) {
    const size_t start = std::exchange(cursor_, end);
    return {static_cast<uint32_t>(start), static_cast<uint32_t>(end - start)};
  }

  // Deliberate: the byte under the cursor is a line break whatever it is, a NUL that ended a value
  // included. Two bytes are one break when the second is CR or LF and not the same again.
  void endLine() {
    const char first = byteAt(cursor_++);
    if (IsLineBreak(byteAt(cursor_)) && byteAt(cursor_) != first) ++cursor_;
    const char next = byteAt(cursor_);
    if (IsLineBreak(next)) {
      storePair();
      sections_.endSection();
      state_ = P_START;
    } else if (next == ' ') {
      ++cursor_;
      state_ = P_CONTINUATION;
    } else {
      state_ = P_KEY;
    }
  }

  // Moves the pending pair into the section, if it is whole; nothing is pending then.
  void storePair() {
    if (pending_.name.length != 0 && pending_.value.length != 0) sections_.add(pending_);
    pending_ = {};
  }

  // The byte at the end of the text reads as NUL, which stops every scan.
  char byteAt(size_t index) const { return index < size_ ? static_cast<char>(text_[index]) : '\0'; }

  uint8_t* const text_;
  const size_t size_;
  ManifestSections& sections_;

  State state_ = P_START;
  size_t cursor_ = 0;
  ManifestAttribute pending_;  // not in the section yet
};

}  // namespace

bool ManifestMf::load(std::vector<uint8_t> text) {
  text_ = std::move(text);
  sections_.reset(text_.data(), text_.size());
  valid_ = text_.size() <= UINT32_MAX && parse();
  return valid_;
}

bool ManifestMf::parse() { return Parser(text_, sections_).parse(); }
