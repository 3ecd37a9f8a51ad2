// Writing characters as UTF-8 (RFC 3629 §3).
#pragma once

#include <cstdint>
#include <string>

namespace simulator {

// `code` is at most U+10FFFF.
inline void AppendUtf8(uint32_t code, std::string* out) {
  const auto byte = [out](uint32_t bits) { *out += static_cast<char>(bits); };
  const auto tail = [&](unsigned shift) { byte(0x80U | (code >> shift & 0x3fU)); };
  if (code < 0x80) {
    byte(code);
  } else if (code < 0x800) {
    byte(0xc0U | code >> 6);
    tail(0);
  } else if (code < 0x10000) {
    byte(0xe0U | code >> 12);
    tail(6);
    tail(0);
  } else {
    byte(0xf0U | code >> 18);
    tail(12);
    tail(6);
    tail(0);
  }
}

}  // namespace simulator
