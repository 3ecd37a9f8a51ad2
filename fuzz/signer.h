// The signer of the fuzz targets. It repairs digests and signatures after a mutation, so that
// mutated bytes get past the checks that would stop them.
#pragma once

#include <string>

#include "support/der.h"

// The test key of all seeds. It is the smallest test key that is long enough for an encoded
// message.
inline constexpr char kFuzzKey[] = "rsa-512";

// Writes good signatures into the signature block: the certificate's signature, and the signer's
// signature over the signature file. The block keeps its length and all other bytes. Does nothing
// if the block does not parse, if its modulus is not the fuzz key's, if its exponent has no
// inverse, or if a signature does not fit.
void SignAgain(Bytes& block, const Bytes& signature_file);

// Writes the correct digests into the text. The length of the text does not change. Replaces each
// "SHA1-Digest" and "SHA-256-Digest" (followed by `suffix`) in the section that names `name` by the
// data's digest. An empty `name` means every section.
void DigestAgain(std::string& text, const std::string& name, const std::string& suffix,
                 const Bytes& data);
