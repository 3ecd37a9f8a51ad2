// The signature block of a signed JAR (the `.RSA` entry): what the two RSA checks need from its
// PKCS#7 SignedData (RFC 2315 §9). The block is walked by position, and few labels are looked at.
// No allocation; the record points into the caller's block, which must outlive it. Failures are
// told on standard output, one or two lines "CERT_PARCER [ERROR]: ..." each, and not in the log.
#pragma once

#include <cstdint>

// Lengths in bytes, numbers big-endian.
struct pkcs7 {
  const uint8_t* modulus;         // of the certificate's RSA key, less one leading zero byte
  const uint8_t* cert_signature;  // the certificate's signatureValue
  const uint8_t* signed_digest;   // the SignerInfo's encryptedDigest
  const uint8_t* tbs_data;        // the certificate's tbsCertificate, header included
  uint32_t tbs_data_length;
  uint32_t cert_signature_length;
  uint32_t signed_digest_length;
  uint8_t exponent[4];  // the public exponent's bytes, first byte first, then zeros
  uint32_t modulus_length;
};

// Reads the `length` bytes at `block` into `record`, which the caller has cleared. Of several
// certificates and signers the first is taken, and the certificate is not matched with the signer.
// Returns 0, or 1 for a failure, which leaves in `record` what was stored before it.
//
// The block is trusted to be well formed: outer lengths are not compared with what holds them, so
// `modulus_length` bytes at `modulus`, and `signed_digest_length` bytes at `signed_digest`, may end
// beyond the block, and it is for the caller to compare. The other two always lie in the block.
int processCert(const uint8_t* block, uint32_t length, pkcs7* record);
