#include "fuzz/rsa_model.h"

#include <openssl/bn.h>

#include <memory>

#include "fuzz/fuzz.h"
#include "support/keys.h"

namespace {

Bignum Number(const Bytes& bytes) { return Bignum(BN_bin2bn(bytes.data(), bytes.size(), nullptr)); }

}  // namespace

Bytes PublicOperation(const Bytes& number, const Bytes& modulus, uint32_t exponent) {
  const std::unique_ptr<BN_CTX, void (*)(BN_CTX*)> context(BN_CTX_new(), BN_CTX_free);
  const Bignum base = Number(number), m = Number(modulus), e(BN_new()), result(BN_new());
  const uint32_t magnitude = exponent >> 31 != 0 ? 0 - exponent : exponent;
  Bytes bytes(modulus.size());
  Require(BN_set_word(e.get(), magnitude) &&
              BN_mod_exp_mont(result.get(), base.get(), e.get(), m.get(), context.get(), nullptr) &&
              BN_bn2bin_padded(bytes.data(), bytes.size(), result.get()),
          "libcrypto computes the power");
  return bytes;
}

bool Verifies(const Bytes& modulus, uint32_t exponent, const Bytes& data, const Bytes& signature) {
  const Bignum m = Number(modulus), s = Number(signature);
  if (signature.size() != modulus.size() || BN_cmp(s.get(), m.get()) >= 0 || !BN_is_odd(m.get())) {
    return false;
  }
  const Bytes message = PublicOperation(signature, modulus, exponent);
  for (const Digest digest : {Digest::kMd5, Digest::kSha1, Digest::kSha256}) {
    if (message == EncodedMessage(digest, data, modulus.size())) return true;
  }
  return false;
}
