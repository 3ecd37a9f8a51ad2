// RSA PKCS#1 v1.5 signature verification (RFC 8017 §8.2.2) with the integers of crypto/mpi.h.
//
// An rsa_context owns the limbs of its modulus and exponent; an rsa_local releases them. No pointer
// to the caller's bytes is kept after a call. rsa_pkcs1_verify logs a refusal, at error priority,
// only if it refuses the DigestInfo. Exception: a DigestInfo of the length for MD5 is refused
// without a message if a byte of its prefix other than the algorithm's byte is wrong.
#pragma once

#include <cstdint>

#include "crypto/mpi.h"

// A public key.
struct rsa_context {
  int32_t len;  // length in bytes of the modulus, with its leading zeros, and of every signature
  mpi N;        // the modulus
  mpi E;        // the public exponent
};

inline void mpi_apply(void (*call)(mpi* X, ...), rsa_context* ctx) {
  call(&ctx->N, &ctx->E, nullptr);
}

// A context that starts empty and is released when its scope ends.
using rsa_local = mpi_owner<rsa_context>;

// The least and the greatest length, in bytes, of a modulus that rsa_pkcs1_verify accepts.
inline constexpr uint32_t kRsaMinModulusSize = 16;
inline constexpr uint32_t kRsaMaxModulusSize = 512;

// True if anyone can forge signatures for a key with this exponent. The caller must refuse these
// keys. Deliberate: only 1 and -1 are refused. The arithmetic ignores the exponent's sign
// (mpi_pow_mod). A number to the power of 1 is itself, so the encoded message would be its own
// signature. Anyone can write this message (docs/decisions/exponent-of-one.md).
constexpr bool rsa_is_forgeable(uint32_t exponent_value) {
  return exponent_value == 1 || exponent_value == UINT32_MAX;
}

// Results; 0 is success. kRsaKeyFlag and kRsaPublicFlag are combined with a code of crypto/mpi.h.
inline constexpr int kRsaBadInput = 5;
inline constexpr int kRsaInvalidPadding = 7;
inline constexpr int kRsaVerifyFailed = 18;
inline constexpr int kRsaKeyFlag = 8;
inline constexpr int kRsaPublicFlag = 16;

// Loads a public key into `ctx`, which must not be null. Limbs that `ctx` owned before are not
// freed.
//
// `modulus` is unsigned, big-endian, and has `len` bytes. If `modulus` is null, both numbers are
// empty afterwards. `exponent` has the same form and length. If `exponent` is null, the exponent is
// `exponent_value`, read as a signed number. A `len` of 0 leaves both numbers empty and does not
// change the context's `len`. A context with an empty modulus verifies nothing.
//
// Returns 0, or kRsaKeyFlag | kMpiNoMemory (9) with both numbers empty. Exception: if memory runs
// out only for `exponent_value`, returns 0 and leaves the exponent empty. The key then verifies
// nothing.
int rsa_set_key(rsa_context* ctx, const uint8_t* modulus, const uint8_t* exponent,
                uint32_t exponent_value, uint32_t len);

// Checks the signature `sig` against the digests of the signed data. `sig` is big-endian and has
// the context's `len` bytes. The signature itself names its digest algorithm. `sha1` has 20 bytes.
// `md5` has 16 bytes and must not be null; this is not checked. If `sha256` (32 bytes) is null, no
// SHA-256 signature verifies.
//
// Returns 0 if the signature contains the right digest, and otherwise
//   kRsaBadInput (5)        null `ctx`, `sha1` or `sig`; `len` outside 16..512; signature not below
//                           the modulus
//   kRsaInvalidPadding (7)  not a block of type 1 (RFC 8017 §9.2); a DigestInfo of an unknown
//                           length; a prefix that differs from MD5's only in the algorithm's
//                           byte; a SHA-256 DigestInfo, but `sha256` is null
//   kRsaVerifyFailed (18)   another wrong prefix, or a wrong digest
//   kRsaPublicFlag | kMpiNoMemory (17), kMpiBadModulus (20: the modulus is even) or
//                           kMpiBufferTooSmall (24: the result is longer than `len` bytes)
int rsa_pkcs1_verify(const rsa_context* ctx, const uint8_t* sha1, const uint8_t* sha256,
                     const uint8_t* md5, const uint8_t* sig);
