#include "apk/manifest_mf.h"

#include <utility>

#include "util/log.h"

namespace {

bool IsLineBreak(char c) { return c == '\r' || c == '\n'; }

}  // namespace

bool ManifestMf::load(const std::string& text) {
  text_ = text;
  sections_.clear();
  valid_ = parse();
  return valid_;
}

// Deliberate: what is pending at the end of the text is dropped. Only an empty line ends a section,
// the last one included, as signing tools write it; a section that was cut off does not count.
bool ManifestMf::parse() {
  Progress at;
  while (at.cursor < text_.size()) {
    if (!step(at)) return false;
  }
  return true;
}

bool ManifestMf::step(Progress& at) {
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
      at.value += readLine(at);
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
  while (IsLineBreak(text_[at.cursor]) || text_[at.cursor] == ' ') ++at.cursor;
  at.state = P_KEY;
}

// Deliberate: a line break does not end a name. A line without a colon is taken as the front part
// of the next line's name, which then names nothing that anybody looks for.
bool ManifestMf::readName(Progress& at) const {
  at.storePair();
  const size_t start = at.cursor;
  while (text_[at.cursor] != ':' && text_[at.cursor] != '\0') ++at.cursor;
  at.name.assign(text_, start, at.cursor - start);
  if (text_[at.cursor] == '\0') {
    LogError("Parse manifest: Error: P_KEY: unexpected end of file after key '%s'\n",
             at.name.c_str());
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
  const char next = text_[at.cursor + 1];
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
std::string ManifestMf::readLine(Progress& at) const {
  const size_t start = at.cursor;
  while (!IsLineBreak(text_[at.cursor]) && text_[at.cursor] != '\0') ++at.cursor;
  at.state = P_EOL;
  return text_.substr(start, at.cursor - start);
}

// Deliberate: the byte under the cursor is a line break whatever it is, a NUL that ended a value
// included. Two bytes are one break when the second is CR or LF and not the same again.
void ManifestMf::endLine(Progress& at) {
  const char first = text_[at.cursor++];
  if (IsLineBreak(text_[at.cursor]) && text_[at.cursor] != first) ++at.cursor;
  const char next = text_[at.cursor];
  if (IsLineBreak(next)) {
    at.storePair();
    sections_.push_back(std::exchange(at.section, {}));
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
  if (!name.empty() && !value.empty()) section[name] = value;
  name.clear();
  value.clear();
}
