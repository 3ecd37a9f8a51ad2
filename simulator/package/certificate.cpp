#include "simulator/package/certificate.h"

#include <openssl/sha.h>

#include "simulator/package/der.h"
#include "simulator/package/distinguished_name.h"

namespace simulator {

namespace {

PublicKey ReadKey(CBS info);
void ReadRsaKey(CBS bits, PublicKey* key);
int CurveBits(CBS parameters);
int NumberBits(std::string_view contents);
std::string_view WithoutLeadingZeros(std::string_view number);

}  // namespace

// Certificate, tbsCertificate and SubjectPublicKeyInfo are those of RFC 5280 §4.1.
std::optional<CertificateFacts> ParseCertificate(std::string_view der) {
  CBS input = ToCbs(der);
  CBS certificate;
  CBS tbs;
  CBS algorithm;
  if (!CBS_get_asn1(&input, &certificate, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&certificate, &tbs, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&certificate, &algorithm, CBS_ASN1_SEQUENCE)) {
    return {};
  }
  constexpr unsigned kVersion = CBS_ASN1_CONSTRUCTED | CBS_ASN1_CONTEXT_SPECIFIC | 0;
  CBS serial;
  CBS same_algorithm;
  CBS issuer;
  CBS validity;
  CBS subject;
  CBS key;
  if (!CBS_get_optional_asn1(&tbs, nullptr, nullptr, kVersion) ||
      !CBS_get_asn1(&tbs, &serial, CBS_ASN1_INTEGER) ||
      !CBS_get_asn1(&tbs, &same_algorithm, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1_element(&tbs, &issuer, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&tbs, &validity, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1_element(&tbs, &subject, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1_element(&tbs, &key, CBS_ASN1_SEQUENCE)) {
    return {};
  }
  CertificateFacts facts;
  facts.subject = NameText(ToView(subject));
  facts.issuer = NameText(ToView(issuer));
  facts.is_self_issued = ToView(subject) == ToView(issuer);
  facts.sha256 = Sha256Hex(der.substr(0, der.size() - CBS_len(&input)));
  facts.signature_algorithm = SignatureAlgorithmName(algorithm);
  facts.key = ReadKey(key);
  return facts;
}

std::string Sha256Hex(std::string_view bytes) {
  uint8_t digest[SHA256_DIGEST_LENGTH];
  SHA256(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size(), digest);
  return HexText({reinterpret_cast<const char*>(digest), sizeof(digest)});
}

std::string HexText(std::string_view bytes) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  for (const char byte : bytes) {
    text += kDigits[static_cast<uint8_t>(byte) >> 4];
    text += kDigits[static_cast<uint8_t>(byte) & 15];
  }
  return text;
}

namespace {

// `info` is the whole SubjectPublicKeyInfo.
PublicKey ReadKey(CBS info) {
  PublicKey key;
  key.sha256 = Sha256Hex(ToView(info));
  CBS contents;
  CBS algorithm;
  CBS oid;
  CBS bits;
  uint8_t unused_bits = 0;
  if (!CBS_get_asn1(&info, &contents, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&contents, &algorithm, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&algorithm, &oid, CBS_ASN1_OBJECT) ||
      !CBS_get_asn1(&contents, &bits, CBS_ASN1_BITSTRING) || !CBS_get_u8(&bits, &unused_bits)) {
    return key;
  }
  const std::string name = OidText(oid);
  key.algorithm = name;
  if (name == "1.2.840.113549.1.1.1") {
    key.algorithm = "RSA";
    ReadRsaKey(bits, &key);
  } else if (name == "1.2.840.10045.2.1") {
    key.algorithm = "EC";
    key.bits = CurveBits(algorithm);
  } else if (name == "1.2.840.10040.4.1") {
    key.algorithm = "DSA";
    CBS parameters;
    CBS prime;
    if (CBS_get_asn1(&algorithm, &parameters, CBS_ASN1_SEQUENCE) &&
        CBS_get_asn1(&parameters, &prime, CBS_ASN1_INTEGER)) {
      key.bits = NumberBits(ToView(prime));
    }
  }
  return key;
}

// RSAPublicKey of RFC 8017 §A.1.1.
void ReadRsaKey(CBS bits, PublicKey* key) {
  CBS numbers;
  CBS modulus;
  CBS exponent;
  if (!CBS_get_asn1(&bits, &numbers, CBS_ASN1_SEQUENCE) ||
      !CBS_get_asn1(&numbers, &modulus, CBS_ASN1_INTEGER)) {
    return;
  }
  key->bits = NumberBits(ToView(modulus));
  key->modulus_sha256 = Sha256Hex(WithoutLeadingZeros(ToView(modulus)));
  if (CBS_get_asn1(&numbers, &exponent, CBS_ASN1_INTEGER)) key->exponent = ToView(exponent);
}

int CurveBits(CBS parameters) {
  constexpr struct {
    const char* oid;
    int bits;
  } kCurves[] = {{"1.2.840.10045.3.1.1", 192}, {"1.3.132.0.33", 224}, {"1.2.840.10045.3.1.7", 256},
                 {"1.3.132.0.10", 256},        {"1.3.132.0.34", 384}, {"1.3.132.0.35", 521}};
  CBS oid;
  if (!CBS_get_asn1(&parameters, &oid, CBS_ASN1_OBJECT)) return 0;
  const std::string name = OidText(oid);
  for (const auto& curve : kCurves) {
    if (name == curve.oid) return curve.bits;
  }
  return 0;
}

int NumberBits(std::string_view contents) {
  contents = WithoutLeadingZeros(contents);
  if (contents.empty()) return 0;
  int bits = static_cast<int>(contents.size() - 1) * 8;
  for (unsigned first = static_cast<uint8_t>(contents[0]); first != 0; first >>= 1) ++bits;
  return bits;
}

std::string_view WithoutLeadingZeros(std::string_view number) {
  const size_t first = number.find_first_not_of('\0');
  return first == std::string_view::npos ? std::string_view() : number.substr(first);
}

}  // namespace

}  // namespace simulator
