// RSA PKCS#1 v1.5 (RFC 8017) by libcrypto's big numbers. It has the tool's rules where these are
// more lenient than the standard: any exponent, any padding length.
#pragma once

#include <cstdint>

#include "support/certificate.h"

// number ^ |exponent| mod modulus, in as many bytes as the modulus has. The exponent is a key's
// 32-bit value, read as signed. The modulus must be odd, and the number below it.
Bytes PublicOperation(const Bytes& number, const Bytes& modulus, uint32_t exponent);

// True if the signature is good for the data, over any of the three digests.
bool Verifies(const Bytes& modulus, uint32_t exponent, const Bytes& data, const Bytes& signature);
