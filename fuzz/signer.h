// The signer of the fuzz targets. It repairs digests and signatures after a mutation, so that
// mutated bytes get past the checks that would stop them.
#pragma once

#include <string>

#include "support/der.h"

// The test key of most seeds. It is the smallest test key, and just long enough for an encoded
// message.
inline constexpr char kFuzzKey[] = "rsa-512";

// Writes good signatures into the signature block: the certificate's signature, and the signer's
// signature over the signature file. The block keeps its length and all other bytes. Does not write
// a signature that would end beyond the block. Does nothing if the block does not parse, if its
// modulus is not the fuzz key's, or if its exponent has no inverse.
void SignAgain(Bytes& block, const Bytes& signature_file);

// Writes the correct digests into the text. The length of the text does not change. Only the
// section with the name `name` is changed, or the whole text if `name` is empty. There, each
// "SHA1-Digest" and "SHA-256-Digest" gets the digest of `data` as its value. `suffix` follows these
// attribute names, as in "SHA1-Digest-Manifest".
void DigestAgain(std::string& text, const std::string& name, const std::string& suffix,
                 const Bytes& data);
