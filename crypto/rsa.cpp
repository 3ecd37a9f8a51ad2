#include "crypto/rsa.h"

#include <cstddef>
#include <cstring>

#include "crypto/wrapping.h"
#include "util/log.h"

namespace {

constexpr size_t kMd5Size = 16;
constexpr size_t kSha1Size = 20;
constexpr size_t kSha256Size = 32;

// The start of a DigestInfo, before the digest (RFC 8017 §9.2, note 1). The starts for MD2, MD4 and
// MD5 differ in one byte, which is 0 in kMdPrefix.
constexpr uint8_t kMdPrefix[] = {0x30, 0x20, 0x30, 0x0c, 0x06, 0x08, 0x2a, 0x86, 0x48,
                                 0x86, 0xf7, 0x0d, 0x02, 0x00, 0x05, 0x00, 0x04, 0x10};
constexpr size_t kMdAlgorithmIndex = 13;
constexpr uint8_t kMd5Algorithm = 5;
constexpr uint8_t kSha1Prefix[] = {0x30, 0x21, 0x30, 0x09, 0x06, 0x05, 0x2b, 0x0e,
                                   0x03, 0x02, 0x1a, 0x05, 0x00, 0x04, 0x14};
constexpr uint8_t kSha256Prefix[] = {0x30, 0x31, 0x30, 0x0d, 0x06, 0x09, 0x60, 0x86, 0x48, 0x01,
                                     0x65, 0x03, 0x04, 0x02, 0x01, 0x05, 0x00, 0x04, 0x20};

void set_exponent(mpi* E, uint32_t exponent_value);
int public_operation(const rsa_context* ctx, const uint8_t* sig, uint8_t* em);
uint8_t* skip_padding(uint8_t* em, size_t len);
bool holds(const uint8_t* info, const uint8_t* prefix, size_t prefix_size, const uint8_t* digest,
           size_t size);
int check_md5(uint8_t* info, const uint8_t* md5);
int invalid_padding();

}  // namespace

int rsa_set_key(rsa_context* ctx, const uint8_t* modulus, const uint8_t* exponent,
                uint32_t exponent_value, uint32_t len) {
  mpi_init(&ctx->N, &ctx->E, nullptr);
  // Deliberate: an empty key loads without an error. It verifies nothing.
  if (len == 0) return 0;
  ctx->len = static_cast<int32_t>(len);
  if (modulus == nullptr) return 0;
  int result = mpi_from_bytes(&ctx->N, modulus, len);
  if (result == 0 && exponent != nullptr) result = mpi_from_bytes(&ctx->E, exponent, len);
  if (result != 0) {
    mpi_free(&ctx->E, &ctx->N, nullptr);
    return result | kRsaKeyFlag;
  }
  if (exponent == nullptr) set_exponent(&ctx->E, exponent_value);
  return 0;
}

int rsa_pkcs1_verify(const rsa_context* ctx, const uint8_t* sha1, const uint8_t* sha256,
                     const uint8_t* md5, const uint8_t* sig) {
  if (ctx == nullptr || sha1 == nullptr || sig == nullptr) return kRsaBadInput;
  const uint32_t len = static_cast<uint32_t>(ctx->len);
  if (len < kRsaMinModulusSize || len > kRsaMaxModulusSize) return kRsaBadInput;
  uint8_t em[kRsaMaxModulusSize];
  if (const int result = public_operation(ctx, sig, em)) return result;

  uint8_t* const info = skip_padding(em, len);
  if (info == nullptr) return kRsaInvalidPadding;
  // Deliberate: the log messages of this file keep their spelling and have no line end. Programs
  // that parse the log match on these messages.
  switch (em + len - info) {
    case sizeof(kSha256Prefix) + kSha256Size:
      if (sha256 == nullptr) return invalid_padding();
      if (holds(info, kSha256Prefix, sizeof(kSha256Prefix), sha256, kSha256Size)) return 0;
      LogError("SHA256 hash does not match");
      return kRsaVerifyFailed;
    case sizeof(kSha1Prefix) + kSha1Size:
      if (holds(info, kSha1Prefix, sizeof(kSha1Prefix), sha1, kSha1Size)) return 0;
      LogError("SHA hash check unsuccessfull");
      return kRsaVerifyFailed;
    case sizeof(kMdPrefix) + kMd5Size:
      return check_md5(info, md5);
    default:
      return invalid_padding();
  }
}

namespace {

// Stores `exponent_value`, read as a signed 32-bit number, in `E`. Deliberate: if memory runs out,
// the exponent stays empty and no error is returned. An empty exponent counts as 0. A number to the
// power of 0 is 1, and 1 has no valid padding. A key with an empty exponent therefore verifies no
// signature.
WRAPS_ON_PURPOSE void set_exponent(mpi* E, uint32_t exponent_value) {
  if (exponent_value == 0 || mpi_grow(E, 1) != 0) return;
  const bool negative = exponent_value > INT32_MAX;
  E->p[0] = negative ? 0 - exponent_value : exponent_value;
  E->s = negative ? -1 : 1;
}

// Recovers the encoded message, `len` bytes, from the signature. Deliberate: the sign of the
// exponent is ignored.
int public_operation(const rsa_context* ctx, const uint8_t* sig, uint8_t* em) {
  const size_t len = static_cast<size_t>(ctx->len);
  mpi_local T;
  if (const int result = mpi_from_bytes(&T, sig, len)) return result | kRsaPublicFlag;
  if (mpi_compare(&T, &ctx->N) >= 0) return kRsaBadInput;
  if (const int result = mpi_pow_mod(&T, &T, &ctx->E, &ctx->N)) return result | kRsaPublicFlag;
  if (const int result = mpi_to_bytes(&T, em, len)) return result | kRsaPublicFlag;
  return 0;
}

// Returns the start of the DigestInfo in a block of type 1, 00 01 FF ... FF 00 DigestInfo. Returns
// null if the block has another form. Deliberate: the run of FF may have any length, even 0. A
// minimum would refuse blocks that have always been accepted.
uint8_t* skip_padding(uint8_t* em, size_t len) {
  if (em[0] != 0x00 || em[1] != 0x01) return nullptr;
  size_t i = 2;
  for (; em[i] != 0x00; ++i) {
    if (em[i] != 0xFF || i >= len - 1) return nullptr;
  }
  return em + i + 1;
}

// True if the DigestInfo at `info` is this prefix followed by this digest.
bool holds(const uint8_t* info, const uint8_t* prefix, size_t prefix_size, const uint8_t* digest,
           size_t size) {
  return memcmp(info, prefix, prefix_size) == 0 && memcmp(info + prefix_size, digest, size) == 0;
}

// Deliberate: of MD2, MD4 and MD5, only MD5 is supported. A prefix that differs from MD5's only in
// the algorithm's byte, such as the prefix of MD2 or MD4, is refused and logged as invalid padding.
// A prefix that differs in another byte is refused without a message.
int check_md5(uint8_t* info, const uint8_t* md5) {
  const uint8_t algorithm = info[kMdAlgorithmIndex];
  info[kMdAlgorithmIndex] = 0;
  if (memcmp(info, kMdPrefix, sizeof(kMdPrefix)) != 0) return kRsaVerifyFailed;
  if (algorithm != kMd5Algorithm) return invalid_padding();
  if (memcmp(info + sizeof(kMdPrefix), md5, kMd5Size) == 0) return 0;
  LogError("MD5 hash does not match");
  return kRsaVerifyFailed;
}

int invalid_padding() {
  LogError("Invalid padding in RSA");
  return kRsaInvalidPadding;
}

}  // namespace
