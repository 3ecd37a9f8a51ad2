// Reads the signature block of a signed JAR: the `.RSA` entry, a PKCS#7 SignedData (RFC 2315 §9).
// Fills in a record (struct pkcs7) with the values that are needed to verify two RSA signatures:
// the certificate's signature and the signature file's signature. Finds the elements by their
// position and checks few tags. Allocates nothing. The record points into the caller's block. The
// block must outlive the record. A failure prints one or two lines "CERT_PARCER [ERROR]: ..." on
// standard output and logs nothing.
#pragma once

#include <cstdint>

// Lengths are in bytes. The modulus and the signatures are big-endian numbers.
struct pkcs7 {
  const uint8_t* modulus;         // of the certificate's RSA key; one leading zero byte is left out
  const uint8_t* cert_signature;  // the certificate's signatureValue
  const uint8_t* signed_digest;   // the SignerInfo's encryptedDigest
  const uint8_t* tbs_data;        // the certificate's tbsCertificate, header included
  uint32_t tbs_data_length;
  uint32_t cert_signature_length;
  uint32_t signed_digest_length;
  uint8_t exponent[4];  // first four bytes of the big-endian exponent; zeros after a shorter one
  uint32_t modulus_length;
};

// Reads the `length` bytes at `block` into `record`, which the caller has cleared. Uses the first
// certificate and the first SignerInfo, and does not check that they belong together. Returns 0 for
// success and 1 for failure. After a failure, `record` keeps the fields that were stored before the
// failure.
//
// The outer elements are those from the start of the block to the [0] of the certificates. Their
// lengths are trusted: they are not compared with the end of the enclosing element. If the exponent
// has more than four bytes, its fifth to eighth byte overwrite `modulus_length`. The
// `modulus_length` bytes at `modulus` and the `signed_digest_length` bytes at `signed_digest` may
// end beyond the block. The caller must therefore check where these bytes end. The bytes at
// `cert_signature` and `tbs_data` are inside the block.
int processCert(const uint8_t* block, uint32_t length, pkcs7* record);
