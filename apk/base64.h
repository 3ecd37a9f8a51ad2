// Base64 (RFC 4648 section 4) as manifests and signature files write their digests: line breaks may
// stand anywhere, and padding may be missing. Nothing is kept between calls, nothing is logged; all
// buffers are the caller's.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// The bytes that `text` encodes; empty when it holds a byte that base64decode() refuses.
std::vector<uint8_t> Base64Decode(const std::string& text);

// Decodes the `length` characters at `in` (may be null when there are none) to `out`, which has
// room for `*out_length` bytes (may be null when that is 0). CR, LF and NUL are skipped; the first
// '=' ends the text. The result is
//   0: `*out_length` is the number of bytes written;
//   1: a byte is neither skipped nor of the alphabet, or the room is too small. `*out_length` is as
//      it was, and `out` holds what was decoded until then.
extern "C" int base64decode(const char* in, size_t length, uint8_t* out, size_t* out_length);
