// The signer of the fuzz targets. It repairs digests and signatures after a mutation. Mutated
// bytes then also reach the code behind the checks of digests and signatures.
#pragma once

#include <string>

#include "support/der.h"

// The test key of most seeds. It is the smallest test key. Its modulus is just long enough for an
// encoded message (RFC 8017 section 9.2) with a SHA-256 digest.
inline constexpr char kFuzzKey[] = "rsa-512";

// Writes good signatures into the signature block: the certificate's signature, and the signer's
// signature over the signature file. The block keeps its length and all other bytes. Leaves out a
// signature if any of its bytes would be outside the block. Does nothing if the block does not
// parse, if its modulus is not the fuzz key's, or if no private exponent exists for its public
// exponent.
void SignAgain(Bytes& block, const Bytes& signature_file);

// Writes the digests of `data` over the values of the attributes "SHA1-Digest" and
// "SHA-256-Digest". `suffix` is added to these two names, as in "SHA1-Digest-Manifest". If `name`
// is empty, changes these attributes in the whole text. Otherwise changes them only in the first
// section with the name `name`. The length of the text does not change.
void DigestAgain(std::string& text, const std::string& name, const std::string& suffix,
                 const Bytes& data);
