// Three digests for the RSA tests. Verify passes all three to rsa_pkcs1_verify. The DigestInfo in
// the signature decides which of them is compared.
#pragma once

#include "crypto/rsa.h"

#include "support/der.h"

inline const Bytes kMd5(16, 0x55);
inline const Bytes kSha1(20, 0x11);
inline const Bytes kSha256(32, 0x22);

inline uint32_t Length(const Bytes& bytes) { return static_cast<uint32_t>(bytes.size()); }

inline int Verify(const rsa_context& context, const Bytes& signature) {
  return rsa_pkcs1_verify(&context, kSha1.data(), kSha256.data(), kMd5.data(), signature.data());
}
