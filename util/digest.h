// One-shot digests of bytes in memory, by the platform's crypto library: MD5 (RFC 1321), SHA-1 and
// SHA-256 (FIPS 180-4). The functions keep no state, log nothing and cannot fail. The caller owns
// `in` and `out`, which must be two different vectors.
#pragma once

#include <cstdint>
#include <vector>

// Each of the next three functions replaces the contents of `out` with the digest of all bytes of
// `in`. `in` may be empty.

// 16 bytes.
void ComputeMD5Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
// 20 bytes.
void ComputeSHA1Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
// 32 bytes.
void ComputeSHA256Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);

// The digests of signed data with the three algorithms above. A signature's verification gets all
// three: the caller does not know the digest algorithm, which only the signature names.
struct Digests {
  std::vector<uint8_t> sha1;
  std::vector<uint8_t> sha256;
  std::vector<uint8_t> md5;
};

// Computes all three digests of `in`.
Digests ComputeDigests(const std::vector<uint8_t>& in);
