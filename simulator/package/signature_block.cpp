#include "simulator/package/signature_block.h"

#include <openssl/nid.h>

#include "simulator/package/cbs.h"
#include "simulator/package/certificate.h"

namespace simulator {

namespace {

constexpr unsigned kContext0 = CBS_ASN1_CONSTRUCTED | CBS_ASN1_CONTEXT_SPECIFIC | 0;
constexpr unsigned kContext1 = CBS_ASN1_CONSTRUCTED | CBS_ASN1_CONTEXT_SPECIFIC | 1;

bool EnterSignedData(CBS block, CBS* signed_data);
bool ReadSigners(CBS signers, SignatureBlockFacts* facts);
bool ReadSigner(CBS signer, SignatureBlockFacts* facts);

}  // namespace

SignatureBlockFacts ParseSignatureBlock(std::string_view block) {
  SignatureBlockFacts facts;
  CBS signed_data, certificates, certificate, signers;
  if (!EnterSignedData(ToCbs(block), &signed_data) ||
      !CBS_get_asn1(&signed_data, &certificates, kContext0)) {
    return facts;
  }
  if (CBS_get_asn1_element(&certificates, &certificate, CBS_ASN1_SEQUENCE)) {
    facts.certificate = ToView(certificate);
  }
  facts.is_whole = CBS_get_optional_asn1(&signed_data, nullptr, nullptr, kContext1) &&
                   CBS_get_asn1(&signed_data, &signers, CBS_ASN1_SET) &&
                   ReadSigners(signers, &facts);
  return facts;
}

namespace {

// Enters the SignedData, and skips the fields before the certificates.
bool EnterSignedData(CBS block, CBS* signed_data) {
  CBS content_info, content, skipped;
  return CBS_get_asn1(&block, &content_info, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&content_info, &skipped, CBS_ASN1_OBJECT) &&
         CBS_get_asn1(&content_info, &content, kContext0) &&
         CBS_get_asn1(&content, signed_data, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(signed_data, &skipped, CBS_ASN1_INTEGER) &&
         CBS_get_asn1(signed_data, &skipped, CBS_ASN1_SET) &&
         CBS_get_asn1(signed_data, &skipped, CBS_ASN1_SEQUENCE);
}

bool ReadSigners(CBS signers, SignatureBlockFacts* facts) {
  CBS signer;
  while (CBS_len(&signers) > 0) {
    if (!CBS_get_asn1(&signers, &signer, CBS_ASN1_SEQUENCE)) return false;
    if (facts->signer_count++ == 0 && !ReadSigner(signer, facts)) return false;
  }
  return facts->signer_count > 0;
}

// A SignerInfo begins with these fields: version, signer identifier, digest algorithm, signed
// attributes (optional), signature algorithm, signature.
bool ReadSigner(CBS signer, SignatureBlockFacts* facts) {
  CBS skipped, identifier, digest, algorithm;
  int has_attributes = 0;
  unsigned tag = 0;
  if (!CBS_get_asn1(&signer, &skipped, CBS_ASN1_INTEGER) ||
      !CBS_get_any_asn1(&signer, &identifier, &tag) ||
      !CBS_get_asn1_element(&signer, &digest, CBS_ASN1_SEQUENCE) ||
      !CBS_get_optional_asn1(&signer, &skipped, &has_attributes, kContext0) ||
      !CBS_get_asn1_element(&signer, &algorithm, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&signer, &skipped, CBS_ASN1_OCTETSTRING)) {
    return false;
  }
  facts->signer_id = ToView(identifier);
  facts->has_signed_attributes = has_attributes != 0;
  const AlgorithmFacts over = ParseAlgorithm(ToView(digest));
  facts->digest = over.name;
  facts->has_known_digest = over.nid == NID_md5 || over.nid == NID_sha1 || over.nid == NID_sha256;
  facts->has_pss = ParseAlgorithm(ToView(algorithm)).nid == NID_rsassaPss;
  return true;
}

}  // namespace

}  // namespace simulator
