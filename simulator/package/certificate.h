// The facts of certificates, in forms that people can compare with the output of `apksigner verify
// --print-certs`. The platform's crypto library reads the certificates. Nothing is verified.
#pragma once

#include <openssl/sha.h>
#include <openssl/x509.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace simulator {

struct PublicKey {
  std::string algorithm;  // "RSA", "EC" or "DSA"; else the name that AlgorithmOf() returns
  int bits = 0;           // 0: not known
  std::string sha256;     // of the SubjectPublicKeyInfo; digests are in lower-case hexadecimal
  // The SHA-256 digest of an RSA key's modulus. The digested bytes do not begin with a zero byte.
  // Empty if the key is not an RSA key, or if the library cannot read the key.
  std::string modulus_sha256;
};

struct CertificateFacts {
  // The last RelativeDistinguishedName first, as apksigner writes names: "CN=Vault, O=Example".
  // UTF-8.
  std::string subject;
  std::string issuer;
  bool is_self_issued = false;  // issuer and subject are the same name
  std::string sha256;           // of the whole certificate
  std::string sha1;             // of the whole certificate; some app stores identify signers by it
  // The algorithm of the certificate's own signature, such as "SHA384withRSA".
  std::string signature_algorithm;
  bool has_known_digest = false;  // signed with RSA PKCS#1 v1.5 over MD5, SHA-1 or SHA-256
  // The end of the certificate's validity, in seconds since 1970 (UTC); none: it cannot be read.
  std::optional<int64_t> not_after;
  PublicKey key;
  // A SignerIdentifier (RFC 5652) names a certificate by issuer and serial number, or by the
  // subject key identifier. `issuer_and_serial` is the DER of the issuer, then the DER of the
  // serial number. `key_id` is the subject key identifier; empty if the certificate has none.
  std::string issuer_and_serial;
  std::string key_id;
};

// Parses the certificate at the start of `der`. None if `der` does not start with a certificate.
std::optional<CertificateFacts> ParseCertificate(std::string_view der);

struct AlgorithmFacts {
  int nid = 0;       // the library's number for it; 0: the library has none
  std::string name;  // the library's name, such as "SHA256"; else the object identifier
};

AlgorithmFacts AlgorithmOf(const ASN1_OBJECT* algorithm);
// Parses an AlgorithmIdentifier. The result is empty if `der` is malformed.
AlgorithmFacts ParseAlgorithm(std::string_view der);

// The digest in lower-case hexadecimal.
std::string Sha1Hex(std::string_view bytes);
std::string Sha256Hex(std::string_view bytes);

// The SHA-256 digest of bytes that are added in parts.
class Sha256 {
 public:
  Sha256() { SHA256_Init(&state_); }
  void Add(std::string_view bytes) { SHA256_Update(&state_, bytes.data(), bytes.size()); }
  // Returns the digest in lower-case hexadecimal. Call Hex() only once, after the last Add().
  std::string Hex();

 private:
  SHA256_CTX state_;
};

}  // namespace simulator
