#include "support/signature_block.h"

#include "support/package.h"

namespace {

constexpr char kData[] = "1.2.840.113549.1.7.1";
constexpr char kSignedData[] = "1.2.840.113549.1.7.2";
constexpr char kRsaEncryption[] = "1.2.840.113549.1.1.1";
constexpr char kContentType[] = "1.2.840.113549.1.9.3";
constexpr char kMessageDigest[] = "1.2.840.113549.1.9.4";

// The contents of the authenticated attributes that RFC 2315 §9.2 requires.
Bytes Attributes(Digest digest, const Bytes& content) {
  return Concat({
      der::Sequence({der::Oid(kContentType), der::Set({der::Oid(kData)})}),
      der::Sequence(
          {der::Oid(kMessageDigest), der::Set({der::OctetString(DigestOf(digest, content))})}),
  });
}

}  // namespace

Certificate SignatureBlock::SignerCertificate() const {
  Certificate certificate;
  certificate.key = key;
  certificate.signing_key = issuer_key;
  certificate.digest = digest;
  return certificate;
}

Bytes SignatureBlock::Build(const Bytes& signature_file) const {
  return der::Sequence({
      content_type.value_or(der::Oid(kSignedData)),
      der::Context(0, signed_data.has_value() ? *signed_data : SignedData(signature_file)),
  });
}

Bytes SignatureBlock::SignedData(const Bytes& signature_file) const {
  return der::Sequence({
      der::Integer(1),
      der::Set({AlgorithmIdentifier(DigestOid(digest))}),
      der::Sequence({der::Oid(kData)}),
      der::Context(0, certificates.has_value() ? *certificates : SignerCertificate().Build()),
      signer_infos.has_value() ? *signer_infos : der::Set({SignerInfo(signature_file)}),
  });
}

Bytes SignatureBlock::SignerInfo(const Bytes& signature_file) const {
  const Certificate certificate = SignerCertificate();
  Bytes signed_bytes = signature_file;
  if (wrong_digest) signed_bytes.push_back('!');
  Bytes attributes;
  if (authenticated_attributes) {
    const Bytes contents = Attributes(digest, signed_bytes);
    attributes = der::Context(0, contents);
    signed_bytes = der::Element(der::kSet, contents);
  }
  return der::Sequence({
      der::Integer(1),
      der::Sequence({certificate.issuer, serial.value_or(certificate.serial)}),
      digest_algorithm.value_or(AlgorithmIdentifier(DigestOid(digest))),
      attributes,
      AlgorithmIdentifier(kRsaEncryption),
      encrypted_digest.has_value() ? *encrypted_digest
                                   : der::OctetString(SignWith(key, digest, signed_bytes)),
  });
}

Bytes ForgedBlock(const Bytes& signature_file, const std::string& victim, const Bytes& exponent) {
  const Bytes modulus = ModulusOf(victim);
  Certificate certificate;
  certificate.public_key_info = PublicKeyInfoAround(
      der::Sequence({der::Integer(Concat({{0}, modulus})), der::Integer(exponent)}));
  const auto encoded = [&](const Bytes& data) {
    return EncodedMessage(Digest::kSha256, data, modulus.size());
  };
  certificate.signature = der::BitString(encoded(certificate.Tbs()));
  SignatureBlock block;
  block.certificates = certificate.Build();
  block.encrypted_digest = der::OctetString(encoded(signature_file));
  return block.Build(signature_file);
}
