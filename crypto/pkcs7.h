// Reads the values for the two RSA checks from the signature block of a signed JAR (the `.RSA`
// entry), a PKCS#7 SignedData (RFC 2315 §9). Walks the block by position and checks few labels.
// No allocation; the record points into the caller's block, which must outlive it. A failure
// prints one or two lines "CERT_PARCER [ERROR]: ..." on standard output and logs nothing.
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

// Reads the `length` bytes at `block` into `record`, which the caller has cleared. Takes the first
// certificate and the first signer, and does not match one with the other. Returns 0 for success
// and 1 for failure; `record` then keeps the fields that were stored before it.
//
// The block is trusted to be well formed: outer lengths are not compared with the element around
// them. The `modulus_length` bytes at `modulus` and the `signed_digest_length` bytes at
// `signed_digest` may end beyond the block: the caller must check. The other two lie in the block.
int processCert(const uint8_t* block, uint32_t length, pkcs7* record);
