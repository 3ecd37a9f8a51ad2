// The signer of the fuzz targets: makes good what a mutation broke, so that mutated bytes get past
// the checks that they would only bounce off.
#pragma once

#include <string>

#include "support/der.h"

// The test key of all seeds: the smallest for which an encoded message has room.
inline constexpr char kFuzzKey[] = "rsa-512";

// Writes good signatures into the signature block: the certificate's own and the signer's, over the
// signature file. The block keeps its length and all of its other bytes. Does nothing when the
// block does not parse, holds another modulus than the fuzz key's or an exponent that has no
// inverse, or has no room for a signature.
void SignAgain(Bytes& block, const Bytes& signature_file);

// Writes the right digests into the text, which keeps its length: for each "SHA1-Digest" and
// "SHA-256-Digest" (and then `suffix`) in the section that names `name`, or anywhere when `name` is
// empty, the digest of the data.
void DigestAgain(std::string& text, const std::string& name, const std::string& suffix,
                 const Bytes& data);
