#include "util/digest.h"

#include <openssl/md5.h>
#include <openssl/sha.h>

void ComputeMD5Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out) {
  out.resize(MD5_DIGEST_LENGTH);
  MD5(in.data(), in.size(), out.data());
}

void ComputeSHA1Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out) {
  out.resize(SHA_DIGEST_LENGTH);
  SHA1(in.data(), in.size(), out.data());
}

void ComputeSHA256Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out) {
  out.resize(SHA256_DIGEST_LENGTH);
  SHA256(in.data(), in.size(), out.data());
}

Digests ComputeDigests(const std::vector<uint8_t>& in) {
  Digests digests;
  ComputeSHA1Digest(in, digests.sha1);
  ComputeSHA256Digest(in, digests.sha256);
  ComputeMD5Digest(in, digests.md5);
  return digests;
}
