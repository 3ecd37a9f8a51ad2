// Reads and verifies signature blocks with libcrypto. The fuzz targets that verify signature blocks
// compare the tool's results with this model.
#pragma once

#include "crypto/pkcs7.h"
#include "support/der.h"

// Returns the modulus of the signer's key if libcrypto's arithmetic finds both signatures good: the
// certificate's and the signer's. Otherwise returns no bytes. `record` points at the certificate's
// signed bytes, the modulus and the signatures. The result is also empty if one of these is not in
// `block`, if the modulus does not have 16 to 512 bytes, or if the exponent is 1 or -1
// (0xffffffff). With these exponents, anyone can forge the key's signatures.
Bytes VerifiedKey(const pkcs7& record, const Bytes& block, const Bytes& signature_file);

// Requires that the record has the signed bytes, signatures, modulus and exponent that a strict DER
// reader finds. Checks nothing if the strict reader refuses the block, for example because the
// signer has authenticated attributes. Checks neither the exponent nor the modulus if the block's
// exponent is longer than `record.exponent`.
void CompareWithStrictReader(const pkcs7& record, const Bytes& block);
