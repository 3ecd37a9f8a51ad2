// Building the signature block of a signed JAR: a PKCS#7 SignedData (RFC 2315 §9) without content,
// with one signer.
//
// The defaults make a good block; each field changes one thing about it. Optional fields hold DER
// that takes the place of what would be made.
#pragma once

#include <optional>
#include <string>

#include "support/certificate.h"
#include "support/der.h"

struct SignatureBlock {
  // The signer's key, and the digest that it signs.
  std::string key = "rsa-2048";
  Digest digest = Digest::kSha256;
  // The key that issued the signer's certificate; empty: its own.
  std::string issuer_key;
  // The serial number by which the signer is known; not set: its certificate's.
  std::optional<Bytes> serial;
  // The signature covers authenticated attributes, which hold the digest of the signature file.
  bool authenticated_attributes = false;
  // The signature covers other bytes than the signature file.
  bool wrong_digest = false;

  // Contents of the [0] of certificates; an empty value is an empty set.
  std::optional<Bytes> certificates;
  std::optional<Bytes> digest_algorithm;  // the SignerInfo's
  std::optional<Bytes> encrypted_digest;  // the whole OCTET STRING
  std::optional<Bytes> signer_infos;      // the whole SET; empty: none
  std::optional<Bytes> content_type;      // the ContentInfo's OBJECT IDENTIFIER
  std::optional<Bytes> signed_data;       // the whole SignedData

  // The signer's certificate as the block holds it, unless `certificates` is set.
  Certificate SignerCertificate() const;
  // The signer's SignerInfo over the signature file's bytes, and the block.
  Bytes SignerInfo(const Bytes& signature_file) const;
  Bytes Build(const Bytes& signature_file) const;

 private:
  Bytes SignedData(const Bytes& signature_file) const;
};

// The block over the signature file as somebody makes it who knows no more of the RSA test key
// `victim` than everyone does, and writes the encoded messages themselves where signatures belong:
// good ones, if these contents of the exponent INTEGER leave them as they are.
Bytes ForgedBlock(const Bytes& signature_file, const std::string& victim, const Bytes& exponent);
