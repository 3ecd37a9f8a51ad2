// Base64 (RFC 4648 section 4) as manifests and signature files use it for digests: line breaks may
// be anywhere, and padding may be missing. The functions keep no state and log nothing. All buffers
// belong to the caller.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// The bytes that `text` encodes; empty if base64decode() returns 1.
std::vector<uint8_t> Base64Decode(const std::string& text);

// Decodes the `length` characters at `in` into `out`, which has space for `*out_length` bytes. `in`
// may be null if `length` is 0, and `out` may be null if `*out_length` is 0. CR, LF and NUL are
// skipped; the first '=' ends the text. Returns
//   0: `*out_length` is now the number of bytes written;
//   1: a character is not allowed, or `out` is too small. `*out_length` is unchanged, and `out`
//      contains the bytes of the groups of four characters that were decoded before the failure.
extern "C" int base64decode(const char* in, size_t length, uint8_t* out, size_t* out_length);
