#include "apk/manifest_mf.h"

#include <algorithm>
#include <cstring>
#include <functional>

#include "util/log.h"

namespace {

bool IsLineBreak(char c) { return c == '\r' || c == '\n'; }

bool EndsLine(uint8_t byte) { return byte == '\r' || byte == '\n' || byte == '\0'; }

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

}  // namespace

bool ManifestMf::load(std::vector<uint8_t> text, const Visitor& visit) {
  text_ = std::move(text);
  end_ = 0;
  valid_ = parse(visit);
  return valid_;
}

ManifestMf::Sections ManifestMf::getSections() const { return Sections(this); }

ManifestMf::Section ManifestMf::readSection(size_t position) const {
  Progress at;
  at.cursor = position;
  read(at);
  return std::move(at.section);
}

bool ManifestMf::holds(std::string_view view) const {
  const auto* const text = reinterpret_cast<const char*>(text_.data());
  const std::less_equal<const char*> not_behind;
  return not_behind(text, view.data()) &&
         not_behind(view.data() + view.size(), text + text_.size());
}

// Deliberate: what is pending at the end of the text is dropped. Only an empty line ends a section,
// the last one included, as signing tools write it; a section that was cut off does not count.
bool ManifestMf::parse(const Visitor& visit) {
  Progress at;
  while (at.cursor < text_.size()) {
    if (!step(at)) return false;
    if (at.state != P_START) continue;
    if (visit) {
      at.section.sort();
      visit(at.section, end_);
    }
    at.section.clear();
    end_ = at.cursor;
  }
  return true;
}

// Reads the section at the cursor, one of those that parse() came to the end of.
void ManifestMf::read(Progress& at) const {
  at.section.clear();
  do {
    step(at);
  } while (at.state != P_START);
  at.section.sort();
}

bool ManifestMf::step(Progress& at) const {
  switch (at.state) {
    case P_START:
      skipToName(at);
      return true;
    case P_KEY:
      return readName(at);
    case P_COLON:
      return passColon(at);
    case P_VALUE:
      at.value = readLine(at);
      return true;
    case P_CONTINUATION:
      continueValue(at);
      return true;
    case P_EOL:
      endLine(at);
      return true;
  }
  LogError("Parse manifest: Unexpected state.\n");
  return false;
}

// Deliberate: a TAB is not skipped; it starts a name.
void ManifestMf::skipToName(Progress& at) const {
  while (IsLineBreak(byteAt(at.cursor)) || byteAt(at.cursor) == ' ') ++at.cursor;
  at.state = P_KEY;
}

// Deliberate: a line break does not end a name. A line without a colon is taken as the front part
// of the next line's name, which then names nothing that anybody looks for.
bool ManifestMf::readName(Progress& at) const {
  at.storePair();
  const size_t start = at.cursor;
  const size_t size = text_.size();
  const uint8_t* const text = text_.data();
  size_t end = start;
  while (end < size && text[end] != ':' && text[end] != '\0') ++end;
  at.name = view(start, end);
  at.cursor = end;
  if (byteAt(at.cursor) == '\0') {
    LogError("Parse manifest: Error: P_KEY: unexpected end of file after key '%s'\n",
             std::string(at.name).c_str());
    return false;
  }
  at.state = P_COLON;
  return true;
}

// Deliberate: after a line break that follows the colon at once, the cursor is always two bytes
// past the colon, where CR LF has its LF. With a lone LF or CR that byte begins the next line and
// is taken for the line break: it is lost from a name, and neither an empty line nor a continuation
// line is seen there. Signing tools write CR LF; other files read as they always have.
bool ManifestMf::passColon(Progress& at) const {
  const char next = byteAt(at.cursor + 1);
  if (next != ' ' && !IsLineBreak(next)) {
    const auto byte = static_cast<unsigned char>(next);
    LogError("Parse manifest: Error: P_COLON: unexpected 0x%02x after colon: %c\n", byte, byte);
    return false;
  }
  at.cursor += 2;
  at.state = next == ' ' ? P_VALUE : P_EOL;
  return true;
}

// What is left of the line that the cursor is in; the cursor is then on the byte that ended it.
std::string_view ManifestMf::readLine(Progress& at) const {
  const size_t start = at.cursor;
  const size_t size = text_.size();
  const uint8_t* const text = text_.data();
  size_t end = start;
  for (;; ++end) {
    while (size - end >= 8 && IsPlainText(text + end)) end += 8;
    while (end < size && text[end] > kGreatestLineEnd) ++end;
    if (end == size || EndsLine(text[end])) break;
  }
  at.cursor = end;
  at.state = P_EOL;
  return view(start, end);
}

// A value that one line holds stays where it is; the first line that adds to it makes it a string
// of its own.
void ManifestMf::continueValue(Progress& at) const {
  const std::string_view line = readLine(at);
  if (at.value.empty()) {
    at.value = line;
    return;
  }
  if (holds(at.value)) at.section.joined_.emplace_front(at.value);
  at.value = at.section.joined_.front().append(line);
}

// Deliberate: the byte under the cursor is a line break whatever it is, a NUL that ended a value
// included. Two bytes are one break when the second is CR or LF and not the same again.
void ManifestMf::endLine(Progress& at) const {
  const char first = byteAt(at.cursor++);
  if (IsLineBreak(byteAt(at.cursor)) && byteAt(at.cursor) != first) ++at.cursor;
  const char next = byteAt(at.cursor);
  if (IsLineBreak(next)) {
    at.storePair();
    at.state = P_START;
  } else if (next == ' ') {
    ++at.cursor;
    at.state = P_CONTINUATION;
  } else {
    at.state = P_KEY;
  }
}

// Moves the pending pair into the section, if it is whole; nothing is pending then.
void ManifestMf::Progress::storePair() {
  if (!name.empty() && !value.empty()) section.attributes_.emplace_back(name, value);
  name = value = {};
}

void ManifestMf::Section::clear() {
  attributes_.clear();
  joined_.clear();
}

// Orders the attributes, which are in the order of the text, by their names.
void ManifestMf::Section::sort() {
  std::sort(attributes_.begin(), attributes_.end(), [](const value_type& a, const value_type& b) {
    const int order = a.first.compare(b.first);
    return order != 0 ? order < 0 : a.first.data() < b.first.data();
  });
  // Of equal names the last is the one that stays.
  const auto same_name = [](const value_type& a, const value_type& b) {
    return a.first == b.first;
  };
  const auto kept = std::unique(attributes_.rbegin(), attributes_.rend(), same_name);
  attributes_.erase(attributes_.begin(), kept.base());
}

ManifestMf::SectionIterator::SectionIterator(const ManifestMf* manifest, size_t position)
    : manifest_(manifest), position_(position) {
  at_.cursor = position;
  read();
}

ManifestMf::SectionIterator& ManifestMf::SectionIterator::operator++() {
  position_ = at_.cursor;
  read();
  return *this;
}

// At the end there is nothing to be read.
void ManifestMf::SectionIterator::read() {
  if (position_ != manifest_->end_) manifest_->read(at_);
}
