#include "simulator/phone/text.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>

namespace simulator {

namespace {

bool IsPrivateByte(std::string_view character);
uint32_t CodeOf(std::string_view character);
void AppendEscape(uint32_t code, std::string* out);

}  // namespace

std::string EncodeText(std::string_view bytes) {
  std::string out = "\"";
  while (!bytes.empty()) {
    const size_t length = Utf8Length(bytes);
    const std::string_view character = bytes.substr(0, std::max<size_t>(length, 1));
    if (length == 0 || IsPrivateByte(character)) {
      for (const char byte : character) AppendEscape(0xf700U | static_cast<uint8_t>(byte), &out);
    } else if (character == "\n") {
      out += "\\n";
    } else if (IsHidden(character)) {
      AppendEscape(CodeOf(character), &out);
    } else {
      if (character == "\"" || character == "\\") out += '\\';
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
      // In UTF-8, U+F780 to U+F7FF are the bytes EF 9E 80 to EF 9F BF.
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

std::string HexText(std::string_view bytes) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  for (const char byte : bytes) {
    text += kDigits[static_cast<uint8_t>(byte) >> 4];
    text += kDigits[static_cast<uint8_t>(byte) & 15];
  }
  return text;
}

// A valid character (RFC 3629 §4) is not in an overlong form, is not a surrogate, and is not above
// U+10FFFF.
size_t Utf8Length(std::string_view bytes) {
  constexpr uint32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};
  if (bytes.empty()) return 0;
  const uint8_t first = static_cast<uint8_t>(bytes[0]);
  if (first < 0x80) return 1;
  const size_t size = first < 0xc0 ? 0 : first < 0xe0 ? 2 : first < 0xf0 ? 3 : first < 0xf8 ? 4 : 0;
  if (size == 0 || bytes.size() < size) return 0;
  for (const char byte : bytes.substr(1, size - 1)) {
    if ((static_cast<uint8_t>(byte) & 0xc0U) != 0x80) return 0;
  }
  const uint32_t code = CodeOf(bytes.substr(0, size));
  const bool is_character = code >= kLeast[size] && code <= 0x10ffff && code >> 11 != 0x1b;
  return is_character ? size : 0;
}

bool IsHidden(std::string_view character) {
  constexpr struct {
    uint32_t first, last;
  } kHidden[] = {{0, 0x1f},        {0x7f, 0x9f},     {0xad, 0xad},     {0x61c, 0x61c},
                 {0x180e, 0x180e}, {0x200b, 0x200f}, {0x2028, 0x202e}, {0x2060, 0x206f},
                 {0xfeff, 0xfeff}, {0xfff9, 0xfffb}, {0xfffe, 0xffff}, {0xe0000, 0xe007f}};
  const uint32_t code = CodeOf(character);
  return std::any_of(std::begin(kHidden), std::end(kHidden), [code](const auto& range) {
    return code >= range.first && code <= range.last;
  });
}

std::vector<std::string> Split(const std::string& text, char separator) {
  std::vector<std::string> parts;
  size_t start = 0;
  for (size_t end; (end = text.find(separator, start)) != std::string::npos; start = end + 1) {
    parts.push_back(text.substr(start, end - start));
  }
  parts.push_back(text.substr(start));
  return parts;
}

namespace {

// True for the characters U+F780 to U+F7FF, which represent bytes.
bool IsPrivateByte(std::string_view character) {
  return character.size() == 3 && character[0] == '\xef' &&
         (character[1] == '\x9e' || character[1] == '\x9f');
}

uint32_t CodeOf(std::string_view character) {
  const uint8_t first = static_cast<uint8_t>(character[0]);
  const size_t size = character.size();
  uint32_t code = size == 1 ? first : first & (0x7fU >> size);
  for (const char byte : character.substr(1))
    code = code << 6 | (static_cast<uint8_t>(byte) & 0x3fU);
  return code;
}

// Writes a character above U+FFFF as two surrogates (RFC 8259 §7).
void AppendEscape(uint32_t code, std::string* out) {
  if (code > 0xffff) {
    AppendEscape(0xd7c0U + (code >> 10), out);
    code = 0xdc00U + (code & 0x3ffU);
  }
  char escape[8];
  snprintf(escape, sizeof(escape), "\\u%04x", code);
  *out += escape;
}

}  // namespace

}  // namespace simulator
