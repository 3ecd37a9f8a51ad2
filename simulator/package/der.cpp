#include "simulator/package/der.h"

#include <openssl/mem.h>

namespace simulator {

namespace {

struct NamedOid {
  const char* oid;
  const char* name;
};

constexpr NamedOid kSignatures[] = {
    {"1.2.840.113549.1.1.2", "MD2withRSA"},     {"1.2.840.113549.1.1.4", "MD5withRSA"},
    {"1.2.840.113549.1.1.5", "SHA1withRSA"},    {"1.2.840.113549.1.1.14", "SHA224withRSA"},
    {"1.2.840.113549.1.1.11", "SHA256withRSA"}, {"1.2.840.113549.1.1.12", "SHA384withRSA"},
    {"1.2.840.113549.1.1.13", "SHA512withRSA"}, {"1.2.840.113549.1.1.10", "RSASSA-PSS"},
    {"1.2.840.10045.4.1", "SHA1withECDSA"},     {"1.2.840.10045.4.3.2", "SHA256withECDSA"},
    {"1.2.840.10045.4.3.3", "SHA384withECDSA"}, {"1.2.840.10045.4.3.4", "SHA512withECDSA"},
    {"1.2.840.10040.4.3", "SHA1withDSA"},       {"2.16.840.1.101.3.4.3.2", "SHA256withDSA"},
};

constexpr NamedOid kDigests[] = {
    {"1.2.840.113549.2.2", "MD2"},          {"1.2.840.113549.2.4", "MD4"},
    {"1.2.840.113549.2.5", "MD5"},          {"1.3.14.3.2.26", "SHA-1"},
    {"2.16.840.1.101.3.4.2.4", "SHA-224"},  {"2.16.840.1.101.3.4.2.1", "SHA-256"},
    {"2.16.840.1.101.3.4.2.2", "SHA-384"},  {"2.16.840.1.101.3.4.2.3", "SHA-512"},
    {"2.16.840.1.101.3.4.2.8", "SHA3-256"},
};

template <size_t kCount>
std::string NameOf(CBS algorithm, const NamedOid (&names)[kCount]) {
  CBS oid;
  if (!CBS_get_asn1(&algorithm, &oid, CBS_ASN1_OBJECT)) return {};
  std::string text = OidText(oid);
  for (const NamedOid& known : names) {
    if (text == known.oid) return known.name;
  }
  return text;
}

}  // namespace

std::string OidText(const CBS& contents) {
  char* const text = CBS_asn1_oid_to_text(&contents);
  if (text == nullptr) return {};
  std::string copy = text;
  OPENSSL_free(text);
  return copy;
}

std::string SignatureAlgorithmName(CBS algorithm) { return NameOf(algorithm, kSignatures); }

std::string DigestName(CBS algorithm) { return NameOf(algorithm, kDigests); }

}  // namespace simulator
