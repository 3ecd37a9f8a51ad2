#include "support/bytes.h"

#include <algorithm>
#include <cstdio>

Bytes Concat(const std::vector<Bytes>& pieces) {
  Bytes whole;
  for (const Bytes& piece : pieces) whole.insert(whole.end(), piece.begin(), piece.end());
  return whole;
}

Bytes ToBytes(const std::string& text) { return Bytes(text.begin(), text.end()); }

Bytes FromHex(const std::string& digits) {
  std::string packed = digits;
  packed.erase(std::remove(packed.begin(), packed.end(), ' '), packed.end());
  Bytes bytes;
  for (size_t i = 0; i + 1 < packed.size(); i += 2) {
    bytes.push_back(static_cast<uint8_t>(std::stoul(packed.substr(i, 2), nullptr, 16)));
  }
  return bytes;
}

std::string Hex(const void* data, size_t length) {
  std::string text;
  for (size_t i = 0; i < length; ++i) {
    char digits[3];
    snprintf(digits, sizeof(digits), "%02x", static_cast<const uint8_t*>(data)[i]);
    text += digits;
  }
  return text;
}

std::string Hex(const Bytes& bytes) { return Hex(bytes.data(), bytes.size()); }
