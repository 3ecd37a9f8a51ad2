#include "simulator/journal.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>

namespace {

bool IsPrivateByte(std::string_view character);
void AppendEscape(unsigned code, std::string* out);

}  // namespace

Event::Event(const char* name) : line_("{\"event\":") { line_ += EncodeText(name); }

Event& Event::Number(const char* key, int64_t value) {
  Key(key);
  line_ += std::to_string(value);
  return *this;
}

Event& Event::Text(const char* key, std::string_view bytes) {
  Key(key);
  line_ += EncodeText(bytes);
  return *this;
}

Event& Event::Hex(const char* key, std::string_view bytes) {
  constexpr char kDigits[] = "0123456789abcdef";
  Key(key);
  line_ += '"';
  for (const char byte : bytes) {
    line_ += kDigits[static_cast<uint8_t>(byte) >> 4];
    line_ += kDigits[static_cast<uint8_t>(byte) & 15];
  }
  line_ += '"';
  return *this;
}

Event& Event::Null(const char* key) {
  Key(key);
  line_ += "null";
  return *this;
}

bool Event::AppendTo(int journal) const {
  const std::string line = line_ + "}\n";
  return write(journal, line.data(), line.size()) == static_cast<ssize_t>(line.size());
}

Event& Event::Key(const char* key) {
  line_ += ",\"";
  line_ += key;
  line_ += "\":";
  return *this;
}

int OpenJournal(const char* path) {
  const int fd = open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0666);
  return fd < 0 ? fd : MoveHigh(fd);
}

int MoveHigh(int fd) {
  constexpr rlim_t kEnough = 1024;
  rlimit limit = {};
  if (getrlimit(RLIMIT_NOFILE, &limit) != 0) return fd;
  const int from = static_cast<int>(std::min(limit.rlim_cur, kEnough) / 4 * 3);
  const int high = fcntl(fd, F_DUPFD_CLOEXEC, from);
  if (high < 0) return fd;
  close(fd);
  return high;
}

std::string EncodeText(std::string_view bytes) {
  std::string out = "\"";
  while (!bytes.empty()) {
    const size_t length = Utf8Length(bytes);
    const std::string_view character = bytes.substr(0, std::max<size_t>(length, 1));
    const uint8_t first = static_cast<uint8_t>(character[0]);
    if (length == 0 || IsPrivateByte(character)) {
      for (const char byte : character) AppendEscape(0xf700U | static_cast<uint8_t>(byte), &out);
    } else if (first < 0x20 || first == 0x7f) {
      if (first == '\n') {
        out += "\\n";
      } else {
        AppendEscape(first, &out);
      }
    } else {
      if (first == '"' || first == '\\') out += '\\';
      out += character;
    }
    bytes.remove_prefix(character.size());
  }
  return out + '"';
}

std::string DecodeText(std::string_view utf8) {
  std::string bytes;
  while (!utf8.empty()) {
    const std::string_view character = utf8.substr(0, std::max<size_t>(Utf8Length(utf8), 1));
    if (IsPrivateByte(character)) {
      // U+F780 to U+F7FF is EF 9E 80 to EF 9F BF.
      const unsigned high = static_cast<uint8_t>(character[1]) & 3U;
      const unsigned low = static_cast<uint8_t>(character[2]) & 0x3fU;
      bytes += static_cast<char>((high << 6 | low) & 0xffU);
    } else {
      bytes += character;
    }
    utf8.remove_prefix(character.size());
  }
  return bytes;
}

// Well-formed as RFC 3629 §4 has it: no overlong forms, no surrogates, nothing above U+10FFFF.
size_t Utf8Length(std::string_view bytes) {
  const auto byte = [&bytes](size_t i) {
    return i < bytes.size() ? static_cast<uint8_t>(bytes[i]) : 0U;
  };
  const auto is_tail = [&byte](size_t i) { return (byte(i) & 0xc0U) == 0x80; };
  const unsigned first = byte(0);
  if (bytes.empty()) return 0;
  if (first < 0x80) return 1;
  if (first >= 0xc2 && first <= 0xdf) return is_tail(1) ? 2 : 0;
  if (first >= 0xe0 && first <= 0xef) {
    const bool overlong = first == 0xe0 && byte(1) < 0xa0;
    const bool surrogate = first == 0xed && byte(1) > 0x9f;
    return is_tail(1) && is_tail(2) && !overlong && !surrogate ? 3 : 0;
  }
  if (first >= 0xf0 && first <= 0xf4) {
    const bool overlong = first == 0xf0 && byte(1) < 0x90;
    const bool too_high = first == 0xf4 && byte(1) > 0x8f;
    return is_tail(1) && is_tail(2) && is_tail(3) && !overlong && !too_high ? 4 : 0;
  }
  return 0;
}

namespace {

// One of the characters U+F780 to U+F7FF, which stand for bytes.
bool IsPrivateByte(std::string_view character) {
  return character.size() == 3 && character[0] == '\xef' &&
         (character[1] == '\x9e' || character[1] == '\x9f');
}

void AppendEscape(unsigned code, std::string* out) {
  char escape[8];
  snprintf(escape, sizeof(escape), "\\u%04x", code);
  *out += escape;
}

}  // namespace
