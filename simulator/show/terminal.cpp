#include "simulator/show/terminal.h"

#include <langinfo.h>
#include <unistd.h>

#include <clocale>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "simulator/phone/text.h"

namespace simulator {

namespace {

bool IsShown(std::string_view character, const Look& look) {
  return (look.has_utf8 || character.size() == 1) && !IsHidden(character);
}

}  // namespace

Look LookOfStandardOutput() {
  setlocale(LC_CTYPE, "");
  const char* const no_color = getenv("NO_COLOR");
  Look look;
  look.has_colours = isatty(STDOUT_FILENO) != 0 && (no_color == nullptr || no_color[0] == '\0');
  look.has_utf8 = strcmp(nl_langinfo(CODESET), "UTF-8") == 0;
  return look;
}

std::string Printable(std::string_view bytes, const Look& look) {
  std::string out;
  if (!bytes.empty() && bytes.back() == '\n') bytes.remove_suffix(1);
  while (!bytes.empty()) {
    const size_t length = Utf8Length(bytes);
    if (length > 0 && IsShown(bytes.substr(0, length), look)) {
      out += bytes.substr(0, length);
      bytes.remove_prefix(length);
      continue;
    }
    char escape[8];
    snprintf(escape, sizeof(escape), "\\x%02x", static_cast<uint8_t>(bytes[0]));
    out += escape;
    bytes.remove_prefix(1);
  }
  return out;
}

std::string Coloured(const std::string& text, Colour colour, const Look& look) {
  constexpr const char* kCodes[] = {"", "\x1b[32m", "\x1b[31m", "\x1b[33m"};
  if (!look.has_colours || colour == Colour::kPlain) return text;
  return kCodes[static_cast<size_t>(colour)] + text + "\x1b[0m";
}

size_t Columns(std::string_view text) {
  size_t columns = 0;
  for (const char c : text) columns += (static_cast<uint8_t>(c) & 0xc0U) != 0x80 ? 1 : 0;
  return columns;
}

}  // namespace simulator
