// RSA PKCS#1 v1.5 (RFC 8017), computed with libcrypto's big numbers. The model accepts any
// exponent and any padding length, because rsa_pkcs1_verify (crypto/rsa.h) accepts them too.
#pragma once

#include <cstdint>

#include "support/certificate.h"

// number ^ |exponent| mod modulus, in as many bytes as the modulus has. The exponent is a key's
// 32-bit value, read as signed. The modulus must be odd, and the number must be less than the
// modulus.
Bytes PublicOperation(const Bytes& number, const Bytes& modulus, uint32_t exponent);

// True if the signature is good for the data with MD5, SHA-1 or SHA-256.
bool Verifies(const Bytes& modulus, uint32_t exponent, const Bytes& data, const Bytes& signature);
