// RSA key pairs, each with a context of crypto/rsa.h, and padded blocks to sign with the keys.
#pragma once

#include <gmpxx.h>
#include <gtest/gtest.h>
#include <openssl/bn.h>
#include <openssl/rsa.h>

#include <cstdint>
#include <string>

#include "crypto/rsa.h"
#include "support/der.h"
#include "support/keys.h"

inline Bytes BigEndian(const BIGNUM* number, size_t length) {
  Bytes bytes(length);
  EXPECT_TRUE(BN_bn2bin_padded(bytes.data(), length, number));
  return bytes;
}

inline Bytes BigEndian(const mpz_class& number, size_t length) {
  const size_t used = (mpz_sizeinbase(number.get_mpz_t(), 2) + 7) / 8;
  Bytes bytes(length);
  mpz_export(bytes.data() + (length - used), nullptr, 1, 1, 0, 0, number.get_mpz_t());
  return bytes;
}

inline mpz_class ToNumber(const Bytes& bytes) {
  mpz_class number;
  mpz_import(number.get_mpz_t(), bytes.size(), 1, 1, 0, 0, bytes.data());
  return number;
}

// One of the fixed keys (support/keys.h). libcrypto makes its signatures.
struct FixedKey {
  explicit FixedKey(const std::string& name)
      : rsa(TestRsaKey(name)),
        modulus(BigEndian(RSA_get0_n(rsa), RSA_size(rsa))),
        exponent(static_cast<uint32_t>(BN_get_word(RSA_get0_e(rsa)))) {
    EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, exponent,
                             static_cast<uint32_t>(modulus.size())));
  }

  Bytes Sign(int nid, const Bytes& digest) const {
    Bytes signature(modulus.size());
    unsigned size = 0;
    EXPECT_TRUE(RSA_sign(nid, digest.data(), static_cast<unsigned>(digest.size()), signature.data(),
                         &size, rsa));
    return signature;
  }

  // Only the private operation: `block` is padded already.
  Bytes SignBlock(const Bytes& block) const {
    Bytes signature(modulus.size());
    size_t size = 0;
    EXPECT_TRUE(RSA_sign_raw(rsa, &size, signature.data(), signature.size(), block.data(),
                             block.size(), RSA_NO_PADDING));
    return signature;
  }

  RSA* rsa;
  Bytes modulus;
  uint32_t exponent;
  rsa_local context;
};

// A key of a size for which libcrypto makes no keys. GMP finds the two primes, and the exponent is
// 65537. `size` is the length of the modulus in bytes.
struct SmallKey {
  explicit SmallKey(size_t size) {
    const mpz_class e = 65537;
    mpz_class p = mpz_class(3) << (4 * size - 2);
    mpz_class q = mpz_class(7) << (4 * size - 3);
    mpz_nextprime(p.get_mpz_t(), p.get_mpz_t());
    mpz_nextprime(q.get_mpz_t(), q.get_mpz_t());
    n = p * q;
    const mpz_class phi = (p - 1) * (q - 1);
    EXPECT_NE(0, mpz_invert(d.get_mpz_t(), e.get_mpz_t(), phi.get_mpz_t()));
    modulus = BigEndian(n, size);
    EXPECT_NE(0, modulus[0]);
    EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 65537,
                             static_cast<uint32_t>(modulus.size())));
  }

  Bytes SignBlock(const Bytes& block) const {
    mpz_class signature;
    const mpz_class number = ToNumber(block);
    mpz_powm(signature.get_mpz_t(), number.get_mpz_t(), d.get_mpz_t(), n.get_mpz_t());
    return BigEndian(signature, modulus.size());
  }

  mpz_class n;
  mpz_class d;
  Bytes modulus;
  rsa_local context;
};

// A padded block of `size` bytes with block type 1 and `info` at its end.
inline Bytes Block(size_t size, const Bytes& info) {
  return Concat({{0x00, 0x01}, Bytes(size - 3 - info.size(), 0xFF), {0x00}, info});
}
