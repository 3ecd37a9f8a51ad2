// The type Bytes, and conversions of bytes from and to text, for tests.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

using Bytes = std::vector<uint8_t>;

// The pieces, one after the other.
Bytes Concat(const std::vector<Bytes>& pieces);
// The characters, as bytes.
Bytes ToBytes(const std::string& text);
// The bytes that the hexadecimal digits stand for; spaces are ignored.
Bytes FromHex(const std::string& digits);

// The bytes as lower-case hexadecimal digits.
std::string Hex(const void* data, size_t length);
std::string Hex(const Bytes& bytes);
