// The fixed test keys of tests/support/keys, as objects of the platform's libcrypto.
#pragma once

#include <openssl/bn.h>
#include <openssl/evp.h>
#include <openssl/rsa.h>

#include <memory>
#include <string>

struct FreeBignum {
  void operator()(BIGNUM* number) const { BN_free(number); }
};
// Owns a libcrypto number, and frees it.
using Bignum = std::unique_ptr<BIGNUM, FreeBignum>;

// The path of the PEM file of key `name`, such as "rsa-2048".
std::string TestKeyPath(const std::string& name);

// The key `name`, loaded once and kept for the life of the program. Aborts if the key cannot be
// loaded.
EVP_PKEY* TestKey(const std::string& name);

// The key `name` as an RSA key; null if it is another kind of key.
RSA* TestRsaKey(const std::string& name);
