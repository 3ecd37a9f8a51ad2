// Reads one X.509 certificate (RFC 5280 §4.1) into a record that points into the caller's bytes.
// Only the structure is read. Dates, signatures and chains are not checked here.
// x509_certificate_parse neither allocates nor logs. The caller's bytes must outlive the record.
#pragma once

#include <cstddef>
#include <cstdint>

#include "crypto/asn1.h"

// The numbers of a UTCTime or a GeneralizedTime. Their ranges are not checked. `year` has four
// digits, also for a UTCTime.
struct x509_parser_time {
  uint16_t year;
  uint8_t month, day, hour, minute, second;
};

// The types of the attributes that a name keeps: the values of x509_name_attribute::type.
enum : uint32_t {
  kX509DomainComponent = 1,
  kX509CommonName = 2,
  kX509CountryName = 3,
  kX509LocalityName = 4,
  kX509StateOrProvinceName = 5,
  kX509OrganizationName = 6,
  kX509OrganizationalUnitName = 7,
  kX509UserId = 8,
};

struct x509_name_attribute {
  uint32_t type;
  const uint8_t* value;  // contains no NUL, and is not NUL-terminated
  uint64_t value_length;
};

inline constexpr size_t kX509MaxAttributes = 20;

// A distinguished name. The issuer's record also has the names of the issuerAltName extension, and
// the subject's record has the names of the subjectAltName extension. A missing part is a null
// pointer with length 0; a missing `rid` has no arcs. Of several emailAddress attributes, the last
// one is kept. Of several alternative names of one kind, the last one is kept.
struct x509_name {
  x509_name_attribute attributes[kX509MaxAttributes];  // in order of appearance
  uint64_t attribute_count;
  const uint8_t* email;  // the emailAddress attribute, which is not among `attributes`
  uint64_t email_length;
  const uint8_t* alt_email;  // rfc822Name
  uint64_t alt_email_length;
  const uint8_t* dns;  // dNSName
  uint64_t dns_length;
  const uint8_t* uri;  // uniformResourceIdentifier
  uint64_t uri_length;
  const uint8_t* ip;  // iPAddress, network byte order
  uint64_t ip_length;
  asn1_oid rid;  // registeredID
};

// The bits of x509_certificate::extensions_present.
inline constexpr uint32_t kX509BasicConstraints = 1;
inline constexpr uint32_t kX509PathLenConstraint = 2;
inline constexpr uint32_t kX509KeyUsage = 4;
inline constexpr uint32_t kX509SubjectAltName = 8;
inline constexpr uint32_t kX509IssuerAltName = 16;

struct x509_certificate {
  x509_certificate* next;                        // for chains of records; left null
  uint32_t version;                              // 0 = v1, 1 = v2, 2 = v3
  uint32_t serial_number;                        // the low 32 bits
  asn1_oid signature_oid, signature_params_oid;  // of the tbsCertificate; params only if an OID
  x509_name issuer;
  x509_name subject;
  x509_parser_time not_before, not_after;
  asn1_oid public_key_oid, public_key_params_oid;
  const uint8_t* public_key;  // the BIT STRING after its count of unused bits
  uint64_t public_key_length;
  asn1_oid signature_algorithm_oid, signature_algorithm_params_oid;  // of the Certificate
  const uint8_t* signature_value;  // the BIT STRING after its count of unused bits
  uint64_t signature_value_length;
  uint32_t extensions_present;   // kX509BasicConstraints and so on
  uint32_t ca;                   // the BOOLEAN's byte: 0xFF for TRUE in DER
  uint32_t path_len_constraint;  // the low 32 bits
  uint32_t key_usage;            // RFC 5280 §4.2.1.3, digitalSignature in bit 0
  const uint8_t* cert_start;     // the Certificate, header included
  uint64_t cert_length;
  const uint8_t* tbs_start;  // the tbsCertificate, header included
  uint64_t tbs_length;
};

// Reads the certificate at the start of the `len` bytes at `buf` into `cert`. Bytes after the
// certificate are ignored. Returns 0, or
//   -2   `buf` or `cert` is null, or `len` is 0
//   -3   the Certificate or the tbsCertificate cannot be read or is not a SEQUENCE
//   -4   the signatureValue cannot be read or is not a BIT STRING
//   -5   the header of the version, of the serialNumber or of the first optional field cannot be
//        read, this optional field is not context-specific, or the signatureValue is empty
//   -6   the signatureValue has unused bits
//   -9   the version is not an INTEGER for v1, v2 or v3
//   -10  the serialNumber is not an INTEGER
//   -11  a signature's AlgorithmIdentifier is malformed
//   -12  the issuer or the subject is malformed, or has more than kX509MaxAttributes attributes of
//        the types that a name keeps
//   -13  the validity is malformed
//   -14  the subjectPublicKeyInfo is malformed
//   -15  an extension is malformed, is critical and unknown, or is in a v2 certificate
// After -2, `cert` is unchanged. After any other failure, `cert` contains the fields that were read
// before the failure.
int x509_certificate_parse(const uint8_t* buf, size_t len, x509_certificate* cert);
