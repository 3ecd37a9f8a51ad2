// Reads signature blocks by libcrypto: the judge of the targets that verify one.
#pragma once

#include "crypto/pkcs7.h"
#include "support/der.h"

// Returns the signer's key if both signatures of the block are good, by libcrypto's arithmetic over
// the bytes at which the record points; else empty. Those bytes must lie in the block, and the
// exponent must not be 1 or -1, with which anyone can sign.
Bytes VerifiedKey(const pkcs7& record, const Bytes& block, const Bytes& signature_file);

// If the block is strict DER and its signer has no authenticated attributes, the record must equal
// the one that a strict reader makes.
void CompareWithStrictReader(const pkcs7& record, const Bytes& block);
