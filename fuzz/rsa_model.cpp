#include "fuzz/rsa_model.h"

#include <openssl/bn.h>

#include <memory>

#include "fuzz/fuzz.h"

namespace {

struct FreeBignum {
  void operator()(BIGNUM* number) const { BN_free(number); }
};
using Bignum = std::unique_ptr<BIGNUM, FreeBignum>;

Bignum Number(const Bytes& bytes) { return Bignum(BN_bin2bn(bytes.data(), bytes.size(), nullptr)); }

Bytes DigestInfoPrefix(Digest digest) {
  switch (digest) {
    case Digest::kMd5:
      return FromHex("3020300c06082a864886f70d020505000410");
    case Digest::kSha1:
      return FromHex("3021300906052b0e03021a05000414");
    case Digest::kSha256:
      return FromHex("3031300d060960864801650304020105000420");
  }
  abort();
}

}  // namespace

Bytes PublicOperation(const Bytes& number, const Bytes& modulus, uint32_t exponent) {
  const std::unique_ptr<BN_CTX, void (*)(BN_CTX*)> context(BN_CTX_new(), BN_CTX_free);
  const Bignum base = Number(number), m = Number(modulus), e(BN_new()), result(BN_new());
  const uint32_t magnitude = exponent >> 31 != 0 ? 0 - exponent : exponent;
  Bytes bytes(modulus.size());
  Require(BN_set_word(e.get(), magnitude) &&
              BN_mod_exp_mont(result.get(), base.get(), e.get(), m.get(), context.get(), nullptr) &&
              BN_bn2bin_padded(bytes.data(), bytes.size(), result.get()),
          "libcrypto computes");
  return bytes;
}

Bytes EncodedMessage(Digest digest, const Bytes& data, size_t size) {
  const Bytes digest_info = Concat({DigestInfoPrefix(digest), DigestOf(digest, data)});
  if (digest_info.size() + 3 > size) return {};
  const Bytes padding(size - 3 - digest_info.size(), 0xff);
  return Concat({{0, 1}, padding, {0}, digest_info});
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
