#include "apk/manifest_mf.h"

#include <algorithm>
#include <cstring>
#include <string>
#include <utility>

#include "util/log.h"

namespace {

bool IsLineBreak(char c) { return c == '\r' || c == '\n'; }

// The greatest of CR, LF and NUL, the bytes that end a line.
constexpr uint8_t kGreatestLineEnd = '\r';

// True if each of the eight bytes is greater than every byte that ends a line.
bool IsPlainText(const uint8_t* eight) {
  constexpr uint64_t kEachByte = 0x0101010101010101;
  constexpr uint64_t kHighBits = 0x80 * kEachByte;
  constexpr uint64_t kLeastPlain = (kGreatestLineEnd + 1) * kEachByte;
  uint64_t bytes;
  memcpy(&bytes, eight, sizeof(bytes));
  // Setting the high bit of each byte prevents a borrow from the next byte. The subtraction clears
  // that bit only if the byte's low seven bits are at most kGreatestLineEnd. A byte whose own high
  // bit is set is always plain: `| bytes` sets the bit again.
  return ((((bytes | kHighBits) - kLeastPlain) | bytes) & kHighBits) == kHighBits;
}

// The state machine that reads the text of a manifest.
//
// The parser is lenient where signing tools differ. Lines may have any length, and may end with
// CR LF, LF CR, CR or LF. A name extends to the next colon, and may contain line breaks. The parser
// is strict about the byte after this colon: it must be a space, CR or LF. Unusual line breaks can
// change which digest an entry gets, so tests pin how the parser reads them.
class Parser {
 public:
  Parser(std::vector<uint8_t>& text, ManifestSections& sections)
      : text_(text.data()), size_(text.size()), sections_(sections) {}

  // Deliberate: an attribute or section that is still open at the end of the text is dropped. Only
  // an empty line ends a section. Signing tools write an empty line even after the last section.
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
    P_EOL,           // at a line break; the kind of the next line is unknown
  };

  // Deliberate: each step sets one of the states above, so no test can reach the message below.
  // This check is for a state that somebody adds after P_EOL, without a case in step(). The parser
  // then refuses the manifest.
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

  // Deliberate: a line break does not end a name. If the line of the name has no colon, the name
  // continues on the next line. A name with a line break equals no name that the tool looks for. If
  // a name with a line break ends in "-Digest" or "-Digest-Manifest", it names an unsupported
  // digest.
  bool readName() {
    storePair();
    size_t end = cursor_;
    while (byteAt(end) != ':' && byteAt(end) != '\0') ++end;
    pending_.name = readTo(end);
    if (byteAt(end) == '\0') {
      // A log record has at most kLogTextSize bytes of text. The rest of a long name is not copied.
      const size_t shown = std::min<size_t>(pending_.name.length, kLogTextSize);
      const std::string name(reinterpret_cast<const char*>(text_) + pending_.name.start, shown);
      LogError("Parse manifest: Error: P_KEY: unexpected end of file after key '%s'\n",
               name.c_str());
      return false;
    }
    state_ = P_COLON;
    return true;
  }

  // Deliberate: if a line break follows the colon directly, the cursor skips the colon and one byte
  // of the line break. The parser then takes the next byte for the rest of the line break. This is
  // right for CR LF and LF CR. After a lone CR or LF, the next byte is the first byte of the next
  // line, and this byte is lost. The loss has one of three effects. If the next line is a name, the
  // name loses its first byte. If the next line is empty, it does not end the section. If the next
  // line is a continuation line with a single space, it is read as a name. Signing tools write
  // CR LF. Texts with other line breaks have always been read by this rule, so the rule must stay.
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

  // Appends the continuation line to the value. If the value is not empty, the line moves to the
  // end of the value in the text. The overwritten bytes are never read again.
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

  // Returns the rest of the cursor's line. The cursor is then on the byte that ended the line, or
  // at the end of the text.
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

  // Returns the bytes from the cursor to `end`, and moves the cursor there.
  ManifestPiece readTo(size_t end) {
    const size_t start = std::exchange(cursor_, end);
    return {static_cast<uint32_t>(start), static_cast<uint32_t>(end - start)};
  }

  // Deliberate: the byte under the cursor counts as a line break, even if it is a NUL that ended a
  // value. Two bytes are one break if the second is CR or LF and differs from the first.
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

  // Adds the pending pair to the section if the pair has a name and a value. Nothing is pending
  // afterwards.
  void storePair() {
    if (pending_.name.length != 0 && pending_.value.length != 0) sections_.add(pending_);
    pending_ = {};
  }

  // Every byte past the end of the text reads as NUL, which stops every scan.
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
