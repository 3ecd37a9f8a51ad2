#include "fuzz/signature_model.h"

#include <openssl/bytestring.h>

#include <algorithm>
#include <cstring>

#include "fuzz/fuzz.h"
#include "fuzz/rsa_model.h"

namespace {

Bytes Copy(const uint8_t* place, size_t length, const Bytes& block) {
  if (!LiesIn(place, length, block.data(), block.size())) return {};
  return Bytes(place, place + length);
}

// The fields of a signature block that ReadStrictly finds. RFC 2315 section 9 and RFC 5280
// section 4.1 define their order.
struct StrictBlock {
  CBS tbs;  // header included
  CBS modulus, exponent, certificate_signature, encrypted_digest;
};

bool ReadPublicKey(CBS tbs, StrictBlock* out) {
  CBS fields, version, key_info, algorithm, bits, key;
  const bool found =
      CBS_get_asn1(&tbs, &fields, CBS_ASN1_SEQUENCE) &&
      CBS_get_asn1(&fields, &version, CBS_ASN1_CONTEXT_SPECIFIC | CBS_ASN1_CONSTRUCTED | 0) &&
      CBS_get_asn1(&fields, nullptr, CBS_ASN1_INTEGER) &&
      CBS_get_asn1(&fields, nullptr, CBS_ASN1_SEQUENCE) &&  // signature
      CBS_get_asn1(&fields, nullptr, CBS_ASN1_SEQUENCE) &&  // issuer
      CBS_get_asn1(&fields, nullptr, CBS_ASN1_SEQUENCE) &&  // validity
      CBS_get_asn1(&fields, nullptr, CBS_ASN1_SEQUENCE) &&  // subject
      CBS_get_asn1(&fields, &key_info, CBS_ASN1_SEQUENCE) &&
      CBS_get_asn1(&key_info, &algorithm, CBS_ASN1_SEQUENCE) &&
      CBS_get_asn1(&key_info, &bits, CBS_ASN1_BITSTRING) && CBS_skip(&bits, 1) &&
      CBS_get_asn1(&bits, &key, CBS_ASN1_SEQUENCE) &&
      CBS_get_asn1(&key, &out->modulus, CBS_ASN1_INTEGER) &&
      CBS_get_asn1(&key, &out->exponent, CBS_ASN1_INTEGER);
  return found;
}

bool ReadCertificate(CBS* certificates, StrictBlock* out) {
  CBS certificate;
  return CBS_get_asn1(certificates, &certificate, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1_element(&certificate, &out->tbs, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&certificate, nullptr, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&certificate, &out->certificate_signature, CBS_ASN1_BITSTRING) &&
         CBS_skip(&out->certificate_signature, 1) && ReadPublicKey(out->tbs, out);
}

bool ReadSigner(CBS* signer_infos, StrictBlock* out) {
  CBS signer;
  return CBS_get_asn1(signer_infos, &signer, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&signer, nullptr, CBS_ASN1_INTEGER) &&
         CBS_get_asn1(&signer, nullptr, CBS_ASN1_SEQUENCE) &&  // issuerAndSerialNumber
         CBS_get_asn1(&signer, nullptr, CBS_ASN1_SEQUENCE) &&  // digestAlgorithm
         CBS_get_asn1(&signer, nullptr, CBS_ASN1_SEQUENCE) &&  // digestEncryptionAlgorithm
         CBS_get_asn1(&signer, &out->encrypted_digest, CBS_ASN1_OCTETSTRING);
}

bool ReadStrictly(const Bytes& block, StrictBlock* out) {
  constexpr unsigned kContext0 = CBS_ASN1_CONTEXT_SPECIFIC | CBS_ASN1_CONSTRUCTED | 0;
  CBS whole, content_info, content, signed_data, certificates, signer_infos;
  CBS_init(&whole, block.data(), block.size());
  return CBS_get_asn1(&whole, &content_info, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&content_info, nullptr, CBS_ASN1_OBJECT) &&
         CBS_get_asn1(&content_info, &content, kContext0) &&
         CBS_get_asn1(&content, &signed_data, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&signed_data, nullptr, CBS_ASN1_INTEGER) &&
         CBS_get_asn1(&signed_data, nullptr, CBS_ASN1_SET) &&
         CBS_get_asn1(&signed_data, nullptr, CBS_ASN1_SEQUENCE) &&
         CBS_get_asn1(&signed_data, &certificates, kContext0) &&
         CBS_get_asn1(&signed_data, &signer_infos, CBS_ASN1_SET) &&
         ReadCertificate(&certificates, out) && ReadSigner(&signer_infos, out);
}

bool Same(const CBS& strict, const uint8_t* place, uint32_t length) {
  return CBS_data(&strict) == place && CBS_len(&strict) == length;
}

}  // namespace

Bytes VerifiedKey(const pkcs7& record, const Bytes& block, const Bytes& signature_file) {
  const size_t size = record.modulus_length;
  if (size < 16 || size > 512) return {};  // the tool's limits (crypto/rsa.h)
  const Bytes modulus = Copy(record.modulus, size, block);
  const Bytes tbs = Copy(record.tbs_data, record.tbs_data_length, block);
  if (modulus.empty() || tbs.empty()) return {};
  uint32_t exponent;
  memcpy(&exponent, record.exponent, sizeof(exponent));
  // If the exponent is 1 or -1, anyone can forge the key's signatures.
  if (exponent == 1 || exponent == 0xffffffff) return {};
  // A signature is read with the length of the modulus. The length in the block is ignored.
  const bool good =
      Verifies(modulus, exponent, tbs, Copy(record.cert_signature, size, block)) &&
      Verifies(modulus, exponent, signature_file, Copy(record.signed_digest, size, block));
  return good ? modulus : Bytes();
}

void CompareWithStrictReader(const pkcs7& record, const Bytes& block) {
  StrictBlock strict;
  if (!ReadStrictly(block, &strict)) return;
  Require(Same(strict.tbs, record.tbs_data, record.tbs_data_length),
          "the tool and the strict reader find the same signed part of the certificate");
  Require(Same(strict.certificate_signature, record.cert_signature, record.cert_signature_length),
          "the tool and the strict reader find the same signature of the certificate");
  Require(Same(strict.encrypted_digest, record.signed_digest, record.signed_digest_length),
          "the tool and the strict reader find the same signature in the SignerInfo");
  if (CBS_len(&strict.exponent) > sizeof(record.exponent)) return;
  Require(std::equal(CBS_data(&strict.exponent),
                     CBS_data(&strict.exponent) + CBS_len(&strict.exponent), record.exponent),
          "the tool and the strict reader find the same exponent");
  if (CBS_len(&strict.modulus) > 0 && CBS_data(&strict.modulus)[0] == 0)
    CBS_skip(&strict.modulus, 1);
  Require(Same(strict.modulus, record.modulus, record.modulus_length),
          "the tool and the strict reader find the same modulus");
}
