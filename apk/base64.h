// Base64 (RFC 4648 section 4) as manifests and signature files use it for digests: line breaks may
// stand anywhere, and padding may be missing. The functions keep no state and log nothing. All
// buffers belong to the caller.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// The bytes that `text` encodes; empty if base64decode() refuses it.
std::vector<uint8_t> Base64Decode(const std::string& text);

// Decodes the `length` characters at `in` (may be null if `length` is 0) into `out`, which has room
// for `*out_length` bytes (may be null if that is 0). CR, LF and NUL are skipped; the first '='
// ends the text. Returns
//   0: `*out_length` is now the number of bytes written;
//   1: a character is neither skipped nor in the alphabet, or the room is too small. `*out_length`
//      is unchanged, and `out` holds the bytes decoded before the failure.
extern "C" int base64decode(const char* in, size_t length, uint8_t* out, size_t* out_length);
