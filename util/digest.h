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

// The digests that a signature may be over. Which of them it is, the signature itself tells.
struct Digests {
  std::vector<uint8_t> sha1;
  std::vector<uint8_t> sha256;
  std::vector<uint8_t> md5;
};

// All three of `in`.
Digests ComputeDigests(const std::vector<uint8_t>& in);
