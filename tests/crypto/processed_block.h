// A signature block and the record that processCert makes of it, for the tests of processCert.
#pragma once

#include <gtest/gtest.h>

#include <cinttypes>
#include <string>

#include "crypto/pkcs7.h"
#include "support/guarded_bytes.h"
#include "support/signature_block.h"

// Lines that processCert prints when it fails.
inline constexpr char kHeaderTrailer[] = "CERT_PARCER [ERROR]: processPKCS7Header() error\n";
inline constexpr char kKeyTrailer[] = "CERT_PARCER [ERROR]: processPublicKey() error\n";
inline constexpr char kSignerTrailer[] = "CERT_PARCER [ERROR]: processSignHeader() error\n";
inline constexpr char kUnreadable[] =
    "CERT_PARCER [ERROR]: PUBLIC KEY ERROR: reading asn1 tag fail\n";
inline constexpr char kNoSequence[] =
    "CERT_PARCER [ERROR]: PUBLIC KEY ERROR: processing SEQUENCE tag fail\n";
inline constexpr char kNoInteger[] =
    "CERT_PARCER [ERROR]: PUBLIC KEY ERROR: processing INTEGER tag fail\n";
inline constexpr char kNoAlgorithm[] =
    "CERT_PARCER [ERROR]: PUBLIC KEY ERROR: parse algorithm identifier\n";

inline const Bytes kSignatureFile = ToBytes("Signature-Version: 1.0\r\n\r\n");

// The block ends where readable memory ends, so that reading past the block crashes.
struct ProcessedBlock {
  explicit ProcessedBlock(const Bytes& block) : bytes(block) {
    testing::internal::CaptureStdout();
    result = processCert(bytes.data(), static_cast<uint32_t>(bytes.size()), &record);
    output = testing::internal::GetCapturedStdout();
  }
  explicit ProcessedBlock(const SignatureBlock& block)
      : ProcessedBlock(block.Build(kSignatureFile)) {}
  ProcessedBlock(const ProcessedBlock&) = delete;
  ProcessedBlock& operator=(const ProcessedBlock&) = delete;

  // The line about an unreadable header whose tag was decoded as `tag`. The offset in this line is
  // 0 minus the address of the block, as an unsigned 64-bit number.
  std::string UnreadableTag(int32_t tag) const {
    char line[128];
    snprintf(line, sizeof(line),
             "CERT_PARCER [ERROR]: CANT PROCESS CERTIFICATE TAG = %" PRId32 ", offset = 0x%" PRIx64
             "\n",
             tag, ~reinterpret_cast<uint64_t>(bytes.data()) + 1);
    return line;
  }

  const GuardedBytes bytes;
  pkcs7 record = {};
  int result;
  std::string output;
};

// A block with a certificate whose key BIT STRING contains `public_key`. The signatures are
// invented.
inline SignatureBlock WithPublicKey(const Bytes& public_key) {
  SignatureBlock block;
  Certificate certificate;
  certificate.public_key_info = PublicKeyInfoAround(public_key);
  certificate.signature = der::BitString(Bytes(8, 0x5a));
  block.certificates = certificate.Build();
  block.encrypted_digest = der::OctetString(Bytes(8, 0xa5));
  return block;
}

inline SignatureBlock WithRsaKey(const Bytes& modulus, const Bytes& exponent) {
  return WithPublicKey(der::Sequence({der::Integer(modulus), der::Integer(exponent)}));
}

// A block that ends with `certificates`. These bytes must start with the [0] of the certificates.
// The enclosing elements have the indefinite form. processCert reads this form as length 0, so the
// enclosing elements never end beyond the block.
inline Bytes BlockEndingIn(const Bytes& certificates) {
  return Concat({FromHex("30 80"), der::Oid("1.2.840.113549.1.7.2"),
                 FromHex("a0 80 30 80 02 01 01 31 00 30 00"), certificates});
}

inline Bytes Field(const uint8_t* value, uint32_t length) { return Bytes(value, value + length); }
