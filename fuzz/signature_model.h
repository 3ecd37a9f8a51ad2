// What a signature block may say, by libcrypto: the judge of the targets that verify one.
#pragma once

#include "crypto/pkcs7.h"
#include "support/der.h"

// The signer's key if both signatures of the block are good, by libcrypto's arithmetic over the
// bytes at which the record points; else empty. Those bytes must lie in the block, and the exponent
// must be one with which a signature takes the private key.
Bytes VerifiedKey(const pkcs7& record, const Bytes& block, const Bytes& signature_file);

// Where the block is DER to the letter and its signer has no authenticated attributes, what the
// record says of it must be what a strict reader says.
void CompareWithStrictReader(const pkcs7& record, const Bytes& block);
