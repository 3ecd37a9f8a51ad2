// A certificate and the record that x509_certificate_parse makes of it, for the parser's tests.
#pragma once

#include <string>

#include "crypto/x509.h"
#include "support/certificate.h"
#include "support/guarded_bytes.h"

// A certificate with arbitrary bytes as its signature. The parser does not verify the signature,
// and a real signature would take time to make.
inline Certificate Unsigned() {
  Certificate certificate;
  certificate.signature = der::BitString(Bytes(8, 0x5a));
  return certificate;
}

// A parsed certificate. Its bytes end where readable memory ends (GuardedBytes), so that reading
// past them crashes.
struct ParsedCertificate {
  explicit ParsedCertificate(const Bytes& der) : bytes(der) {
    result = x509_certificate_parse(bytes.data(), bytes.size(), &cert);
  }
  explicit ParsedCertificate(const Certificate& certificate)
      : ParsedCertificate(certificate.Build()) {}
  ParsedCertificate(const ParsedCertificate&) = delete;
  ParsedCertificate& operator=(const ParsedCertificate&) = delete;

  const GuardedBytes bytes;
  int result;
  x509_certificate cert;
};

inline int ResultOf(const Certificate& certificate) {
  return ParsedCertificate(certificate).result;
}

inline int ResultOf(const Bytes& der) { return ParsedCertificate(der).result; }

// A field of the record, as bytes or as text.
inline Bytes Field(const uint8_t* value, uint64_t length) { return Bytes(value, value + length); }
inline std::string TextField(const uint8_t* value, uint64_t length) {
  return std::string(value, value + length);
}

inline std::string DottedText(const asn1_oid& oid) {
  char text[80];
  asn1_oid_to_str(&oid, text, sizeof(text));
  return text;
}
