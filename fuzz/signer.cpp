#include "fuzz/signer.h"

#include <openssl/bn.h>
#include <openssl/rsa.h>

#include <algorithm>
#include <cstring>
#include <memory>

#include "crypto/pkcs7.h"
#include "fuzz/fuzz.h"
#include "fuzz/rsa_model.h"
#include "support/jar.h"
#include "support/keys.h"
#include "support/package.h"

namespace {

using Context = std::unique_ptr<BN_CTX, void (*)(BN_CTX*)>;

// Reads `exponent` as a signed number. Returns the fuzz key's private exponent for the number's
// absolute value, or null if this value has no inverse.
Bignum PrivateExponent(uint32_t exponent) {
  const RSA* const key = TestRsaKey(kFuzzKey);
  const Context context(BN_CTX_new(), BN_CTX_free);
  const Bignum p(BN_dup(RSA_get0_p(key))), q(BN_dup(RSA_get0_q(key))), order(BN_new()), e(BN_new());
  BN_sub_word(p.get(), 1);
  BN_sub_word(q.get(), 1);
  BN_mul(order.get(), p.get(), q.get(), context.get());
  BN_set_word(e.get(), exponent >> 31 != 0 ? 0 - exponent : exponent);
  return Bignum(BN_mod_inverse(nullptr, e.get(), order.get(), context.get()));
}

Bytes Sign(const Bytes& data, const BIGNUM* private_exponent, size_t size) {
  const Context context(BN_CTX_new(), BN_CTX_free);
  const Bytes message = EncodedMessage(Digest::kSha256, data, size);
  const Bignum base(BN_bin2bn(message.data(), message.size(), nullptr)), result(BN_new());
  Bytes signature(size);
  Require(BN_mod_exp_mont(result.get(), base.get(), private_exponent,
                          RSA_get0_n(TestRsaKey(kFuzzKey)), context.get(), nullptr) &&
              BN_bn2bin_padded(signature.data(), size, result.get()),
          "libcrypto signs");
  return signature;
}

// Copies `piece` into `block` at `place`. Returns false, and copies nothing, if a part of the copy
// would be outside the block.
bool Put(const Bytes& piece, const uint8_t* place, Bytes& block) {
  if (!LiesIn(place, piece.size(), block.data(), block.size())) return false;
  std::copy(piece.begin(), piece.end(), block.begin() + (place - block.data()));
  return true;
}

}  // namespace

void SignAgain(Bytes& block, const Bytes& signature_file) {
  static const Bytes modulus = ModulusOf(kFuzzKey);
  pkcs7 record = {};
  if (processCert(block.data(), static_cast<uint32_t>(block.size()), &record) != 0 ||
      record.modulus_length != modulus.size() ||
      !LiesIn(record.modulus, modulus.size(), block.data(), block.size()) ||
      memcmp(record.modulus, modulus.data(), modulus.size()) != 0) {
    return;
  }
  uint32_t exponent;
  memcpy(&exponent, record.exponent, sizeof(exponent));
  const Bignum private_exponent = PrivateExponent(exponent);
  if (private_exponent == nullptr) return;
  const Bytes tbs(record.tbs_data, record.tbs_data + record.tbs_data_length);
  Put(Sign(tbs, private_exponent.get(), modulus.size()), record.cert_signature, block);
  Put(Sign(signature_file, private_exponent.get(), modulus.size()), record.signed_digest, block);
}

void DigestAgain(std::string& text, const std::string& name, const std::string& suffix,
                 const Bytes& data) {
  size_t begin = 0, end = text.size();
  if (!name.empty()) {
    begin = text.find("Name: " + name + "\r\n");
    if (begin == std::string::npos) return;
    end = std::min(text.find("\r\n\r\n", begin), text.size());
  }
  for (const std::string attribute : {"SHA1-Digest", "SHA-256-Digest"}) {
    const std::string label = attribute + suffix + ": ";
    const std::string digest = DigestText(attribute, data);
    for (size_t at = begin; (at = text.find(label, at)) < end; ++at) {
      const size_t value = at + label.size();
      if (text.size() - value >= digest.size()) text.replace(value, digest.size(), digest);
    }
  }
}
