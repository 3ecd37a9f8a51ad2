// RSA PKCS#1 v1.5 (RFC 8017) by libcrypto's big numbers, with the rules of the tool where it is
// more lenient than the standard: any exponent, any padding length.
#pragma once

#include <cstdint>

#include "support/certificate.h"

// number ^ |exponent| mod modulus, in as many bytes as the modulus has. The exponent is the 32-bit
// value that a key carries, read as signed. The modulus must be odd, the number below it.
Bytes PublicOperation(const Bytes& number, const Bytes& modulus, uint32_t exponent);

// Whether the signature is one of the data, over any of the three digests.
bool Verifies(const Bytes& modulus, uint32_t exponent, const Bytes& data, const Bytes& signature);
