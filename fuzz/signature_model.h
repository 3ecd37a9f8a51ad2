// Reads and verifies signature blocks with libcrypto. The fuzz targets that verify signature blocks
// compare the tool's results with this model.
#pragma once

#include "crypto/pkcs7.h"
#include "support/der.h"

// Returns the signer's key if libcrypto's arithmetic finds both signatures of the block good.
// Otherwise returns no bytes. The record points at the signed bytes, the key and the signatures,
// which must be in the block. The exponent must not be 1 or -1, because anyone can forge signatures
// for such a key.
Bytes VerifiedKey(const pkcs7& record, const Bytes& block, const Bytes& signature_file);

// If the block is strict DER and its signer has no authenticated attributes, the record must equal
// the one that a strict reader makes.
void CompareWithStrictReader(const pkcs7& record, const Bytes& block);
