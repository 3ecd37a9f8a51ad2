// crypto/x509.h: any bytes as a certificate. If x509_certificate_parse and the platform's libcrypto
// can both read the certificate, they must find the same signed bytes, public key and signature.
#include "crypto/x509.h"

#include <openssl/mem.h>
#include <openssl/x509.h>

#include <cstring>
#include <memory>

#include "fuzz/fuzz.h"

namespace {

struct FreeX509 {
  void operator()(X509* certificate) const { X509_free(certificate); }
};

void CheckName(const x509_name& name, const uint8_t* data, size_t size) {
  Require(name.attribute_count <= 20, "a name has at most 20 attributes");
  for (uint64_t i = 0; i < name.attribute_count; ++i) {
    const x509_name_attribute& attribute = name.attributes[i];
    Require(attribute.type >= 1 && attribute.type <= 8, "an attribute has a known type");
    Require(LiesIn(attribute.value, attribute.value_length, data, size),
            "an attribute's value is in the input");
    Require(attribute.value_length == 0 ||
                memchr(attribute.value, 0, attribute.value_length) == nullptr,
            "an attribute's value contains no NUL");
  }
  Require(LiesIn(name.email, name.email_length, data, size), "the email is in the input");
  Require(LiesIn(name.alt_email, name.alt_email_length, data, size),
          "the alt_email is in the input");
  Require(LiesIn(name.dns, name.dns_length, data, size), "the dns is in the input");
  Require(LiesIn(name.uri, name.uri_length, data, size), "the uri is in the input");
  Require(LiesIn(name.ip, name.ip_length, data, size), "the ip is in the input");
  Require(name.rid.len <= 20, "the rid has at most 20 arcs");
}

void CheckRecord(const x509_certificate& record, const uint8_t* data, size_t size) {
  Require(record.next == nullptr, "the record has no next record");
  Require(record.version <= 2, "the version is at most 2");
  Require(LiesIn(record.cert_start, record.cert_length, data, size),
          "the certificate is in the input");
  Require(LiesIn(record.tbs_start, record.tbs_length, record.cert_start, record.cert_length),
          "the to-be-signed part is in the certificate");
  Require(record.public_key != nullptr && LiesIn(record.public_key, record.public_key_length,
                                                 record.tbs_start, record.tbs_length),
          "the public key is in the to-be-signed part");
  Require(record.signature_value != nullptr &&
              LiesIn(record.signature_value, record.signature_value_length, record.cert_start,
                     record.cert_length),
          "the signature is in the certificate");
  CheckName(record.issuer, data, size);
  CheckName(record.subject, data, size);
}

bool Same(const uint8_t* a, uint64_t a_length, const uint8_t* b, int b_length) {
  return a_length == static_cast<uint64_t>(b_length) && memcmp(a, b, a_length) == 0;
}

void CompareWithLibcrypto(const x509_certificate& record) {
  const uint8_t* cursor = record.cert_start;
  const std::unique_ptr<X509, FreeX509> other(
      d2i_X509(nullptr, &cursor, static_cast<long>(record.cert_length)));
  if (other == nullptr) return;
  const ASN1_BIT_STRING* signature = nullptr;
  X509_get0_signature(&signature, nullptr, other.get());
  Require(Same(record.signature_value, record.signature_value_length, signature->data,
               signature->length),
          "libcrypto finds the same signature");
  const ASN1_BIT_STRING* key = X509_get0_pubkey_bitstr(other.get());
  Require(Same(record.public_key, record.public_key_length, key->data, key->length),
          "libcrypto finds the same public key");
  uint8_t* tbs = nullptr;
  const int tbs_length = i2d_X509_tbs(other.get(), &tbs);
  if (tbs_length <= 0) return;
  Require(Same(record.tbs_start, record.tbs_length, tbs, tbs_length),
          "libcrypto finds the same signed bytes");
  OPENSSL_free(tbs);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  x509_certificate record;
  const int result = x509_certificate_parse(data, size, &record);
  Require(result <= 0 && result >= -15, "the result is a known code");
  if (result != 0) return 0;
  CheckRecord(record, data, size);
  CompareWithLibcrypto(record);
  return 0;
}
