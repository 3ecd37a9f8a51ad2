// RSA PKCS#1 v1.5 (RFC 8017) by libcrypto's big numbers, with the rules of the tool where it is
// more lenient than the standard: any exponent, any padding length.
#pragma once

#include <cstdint>

#include "support/certificate.h"

// number ^ |exponent| mod modulus, in as many bytes as the modulus has. The exponent is the 32-bit
// value that a key carries, read as signed. The modulus must be odd, the number below it.
Bytes PublicOperation(const Bytes& number, const Bytes& modulus, uint32_t exponent);

// The encoded message of the data (section 9.2) in `size` bytes, with as much padding as there is
// room for, be it none; empty when it does not fit.
Bytes EncodedMessage(Digest digest, const Bytes& data, size_t size);

// Whether the signature is one of the data, over any of the three digests.
bool Verifies(const Bytes& modulus, uint32_t exponent, const Bytes& data, const Bytes& signature);
