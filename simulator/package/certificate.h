// Certificates, in the forms in which people compare them: those that `apksigner verify
// --print-certs` prints. Read with the platform's crypto library; nothing is verified.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace simulator {

struct PublicKey {
  std::string algorithm;  // "RSA", "EC" or "DSA"; else the object identifier
  int bits = 0;           // 0: not known
  std::string sha256;     // of the SubjectPublicKeyInfo, in lower-case hexadecimal, as all digests
  // Of an RSA key alone: what the kernel gets, which is the digest of the modulus without leading
  // zeros, and the public exponent's contents as they are encoded.
  std::string modulus_sha256;
  std::string exponent;
};

struct CertificateFacts {
  std::string subject;  // as the JDK writes names
  std::string issuer;
  bool is_self_issued = false;  // issuer and subject are the same name
  std::string sha256;           // of the whole certificate
  // What it is signed with, such as "SHA384withRSA"; else the object identifier.
  std::string signature_algorithm;
  PublicKey key;
};

// None when the bytes are no certificate.
std::optional<CertificateFacts> ParseCertificate(std::string_view der);

// The SHA-256 digest in lower-case hexadecimal.
std::string Sha256Hex(std::string_view bytes);

// The lower-case hexadecimal digits of the bytes.
std::string HexText(std::string_view bytes);

}  // namespace simulator
