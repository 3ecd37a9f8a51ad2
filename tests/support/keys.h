// The fixed test keys of tests/support/keys, as the platform's libcrypto holds them.
#pragma once

#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/rsa.h>

#include <memory>
#include <string>

struct FreeBignum {
  void operator()(BIGNUM* number) const { BN_free(number); }
};
// A number of libcrypto's that is freed with its owner.
using Bignum = std::unique_ptr<BIGNUM, FreeBignum>;

// The path of the PEM file of key `name`, such as "rsa-2048".
std::string TestKeyPath(const std::string& name);

// The key `name`; loaded once and kept for the life of the program. Aborts when there is none.
EVP_PKEY* TestKey(const std::string& name);

// The same, as an RSA key.
RSA* TestRsaKey(const std::string& name);
