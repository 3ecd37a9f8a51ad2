// One-shot digests of bytes in memory, by the platform's crypto library: MD5 (RFC 1321), SHA-1 and
// SHA-256 (FIPS 180-4). Nothing is kept between calls, nothing is logged, and none can fail. The
// caller owns both vectors, which must be two different ones.
#pragma once

#include <cstdint>
#include <vector>

// Each makes `out`, whatever it held, the digest of all of `in`; an empty `in` is digested too.

// 16 bytes.
void ComputeMD5Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
// 20 bytes.
void ComputeSHA1Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
// 32 bytes.
void ComputeSHA256Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
