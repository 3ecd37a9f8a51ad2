// Builds the signature block of a signed JAR: a PKCS#7 SignedData (RFC 2315 §9) without content,
// with one signer.
//
// The defaults make a good block. The fields change parts of the block. If an optional field is
// set, Build uses the field's bytes in place of the DER that Build would make for this part.
#pragma once

#include <optional>
#include <string>

#include "support/certificate.h"
#include "support/der.h"

struct SignatureBlock {
  // The name of the signer's test key, and the digest algorithm of the signatures.
  std::string key = "rsa-2048";
  Digest digest = Digest::kSha256;
  // The key that signs the signer's certificate; empty: the signer's own key.
  std::string issuer_key;
  // The INTEGER of the serial number in the SignerInfo; unset: the serial number of the signer's
  // certificate.
  std::optional<Bytes> serial;
  // True: the signature covers authenticated attributes, which contain the digest of the signature
  // file.
  bool authenticated_attributes = false;
  // True: the signer digests and signs other bytes in place of the signature file.
  bool wrong_digest = false;

  // The contents of the element [0], which has the certificates. If set to no bytes, the element is
  // empty.
  std::optional<Bytes> certificates;
  std::optional<Bytes> digest_algorithm;  // the SignerInfo's
  std::optional<Bytes> encrypted_digest;  // the whole OCTET STRING
  std::optional<Bytes> signer_infos;      // the whole SET; no bytes: the block has no SET
  std::optional<Bytes> content_type;      // the ContentInfo's OBJECT IDENTIFIER
  std::optional<Bytes> signed_data;       // the whole SignedData

  // The signer's certificate. Build puts it into the block unless `certificates` is set.
  Certificate SignerCertificate() const;
  // The signer's SignerInfo for this signature file.
  Bytes SignerInfo(const Bytes& signature_file) const;
  // The whole signature block for this signature file.
  Bytes Build(const Bytes& signature_file) const;

 private:
  Bytes SignedData(const Bytes& signature_file) const;
};

// A block for the signature file. The block's certificate has the modulus of the RSA test key
// `victim`, but no private key is needed to make the block. The block has encoded messages in place
// of signatures. These messages count as signatures if the RSA public operation returns its
// argument, for example with the exponent 1. `exponent` is the contents of the INTEGER of the
// certificate's public exponent.
Bytes ForgedBlock(const Bytes& signature_file, const std::string& victim, const Bytes& exponent);
