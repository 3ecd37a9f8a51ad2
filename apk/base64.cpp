#include "apk/base64.h"

#include <string_view>

namespace {

// The index of a character is the 6-bit value that the character encodes.
constexpr std::string_view kAlphabet =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

}  // namespace

std::vector<uint8_t> Base64Decode(const std::string& text) {
  std::vector<uint8_t> bytes(text.size());
  size_t length = bytes.size();
  if (base64decode(text.data(), text.size(), bytes.data(), &length) != 0) length = 0;
  bytes.resize(length);
  return bytes;
}

int base64decode(const char* in, size_t length, uint8_t* out, size_t* out_length) {
  size_t written = 0;
  uint32_t accumulator = 0;
  int collected = 0;  // number of 6-bit values in the accumulator
  // Writes the complete bytes of the accumulator to `out`. Returns false if `out` has too little
  // space. Deliberate: bits that do not fill a byte are dropped without an error. A single 6-bit
  // value is thus dropped.
  const auto flush = [&] {
    const size_t count = collected < 2 ? 0 : static_cast<size_t>(collected) - 1;
    if (*out_length - written < count) return false;
    for (int shift = 6 * collected - 8; shift >= 0; shift -= 8) {
      out[written++] = static_cast<uint8_t>(accumulator >> shift);
    }
    collected = 0;
    return true;
  };
  for (size_t i = 0; i < length; ++i) {
    if (in[i] == '\0' || in[i] == '\n' || in[i] == '\r') continue;
    if (in[i] == '=') break;
    const size_t value = kAlphabet.find(in[i]);
    if (value == std::string_view::npos) return 1;
    accumulator = accumulator << 6 | static_cast<uint32_t>(value);
    if (++collected == 4 && !flush()) return 1;
  }
  if (!flush()) return 1;
  *out_length = written;
  return 0;
}
