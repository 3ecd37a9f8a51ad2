#include "simulator/package/signature_block.h"

#include "simulator/package/der.h"

namespace simulator {

namespace {

constexpr unsigned kContext0 = CBS_ASN1_CONSTRUCTED | CBS_ASN1_CONTEXT_SPECIFIC | 0;
constexpr unsigned kContext1 = CBS_ASN1_CONSTRUCTED | CBS_ASN1_CONTEXT_SPECIFIC | 1;

bool EnterSignedData(CBS block, CBS* signed_data);
void ReadCertificates(CBS certificates, SignatureBlockFacts* facts);
bool ReadSigners(CBS signers, SignatureBlockFacts* facts);
bool ReadSigner(CBS signer, SignatureBlockFacts* facts);

}  // namespace

SignatureBlockFacts ParseSignatureBlock(std::string_view block) {
  SignatureBlockFacts facts;
  CBS signed_data;
  CBS certificates;
  CBS signers;
  if (!EnterSignedData(ToCbs(block), &signed_data) ||
      !CBS_get_asn1(&signed_data, &certificates, kContext0)) {
    return facts;
  }
  ReadCertificates(certificates, &facts);
  facts.is_whole = CBS_get_optional_asn1(&signed_data, nullptr, nullptr, kContext1) &&
                   CBS_get_asn1(&signed_data, &signers, CBS_ASN1_SET) &&
                   ReadSigners(signers, &facts);
  return facts;
}

namespace {

// Up to where the certificates come.
bool EnterSignedData(CBS block, CBS* signed_data) {
  CBS content_info;
  CBS content;
  CBS skipped;
  return CBS_get_asn1(&block, &content_info, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&content_info, &skipped, CBS_ASN1_OBJECT) &&
         CBS_get_asn1(&content_info, &content, kContext0) &&
         CBS_get_asn1(&content, signed_data, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(signed_data, &skipped, CBS_ASN1_INTEGER) &&
         CBS_get_asn1(signed_data, &skipped, CBS_ASN1_SET) &&
         CBS_get_asn1(signed_data, &skipped, CBS_ASN1_SEQUENCE);
}

void ReadCertificates(CBS certificates, SignatureBlockFacts* facts) {
  CBS certificate;
  while (CBS_get_asn1_element(&certificates, &certificate, CBS_ASN1_SEQUENCE)) {
    if (facts->certificate_count++ == 0) facts->certificate = ToView(certificate);
  }
}

bool ReadSigners(CBS signers, SignatureBlockFacts* facts) {
  CBS signer;
  while (CBS_len(&signers) > 0) {
    if (!CBS_get_asn1(&signers, &signer, CBS_ASN1_SEQUENCE)) return false;
    if (facts->signer_count++ == 0 && !ReadSigner(signer, facts)) return false;
  }
  return facts->signer_count > 0;
}

// SignerInfo: version, whose certificate, digest, signed attributes or none, algorithm, signature.
bool ReadSigner(CBS signer, SignatureBlockFacts* facts) {
  CBS skipped;
  CBS digest;
  CBS algorithm;
  int has_attributes = 0;
  unsigned tag = 0;
  if (!CBS_get_asn1(&signer, &skipped, CBS_ASN1_INTEGER) ||
      !CBS_get_any_asn1(&signer, &skipped, &tag) ||
      !CBS_get_asn1(&signer, &digest, CBS_ASN1_SEQUENCE) ||
      !CBS_get_optional_asn1(&signer, &skipped, &has_attributes, kContext0) ||
      !CBS_get_asn1(&signer, &algorithm, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&signer, &skipped, CBS_ASN1_OCTETSTRING)) {
    return false;
  }
  facts->has_signed_attributes = has_attributes != 0;
  facts->digest = DigestName(digest);
  facts->signature_algorithm = SignatureAlgorithmName(algorithm);
  return true;
}

}  // namespace

}  // namespace simulator
