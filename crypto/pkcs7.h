// The signature block of a signed JAR: what the two RSA checks need from its PKCS#7 SignedData.
#pragma once

#include <cstdint>

struct pkcs7 {
  const uint8_t* modulus;
  const uint8_t* cert_signature;
  const uint8_t* signed_digest;
  const uint8_t* tbs_data;
  uint32_t tbs_data_length;
  uint32_t cert_signature_length;
  uint32_t signed_digest_length;
  uint8_t exponent[4];
  uint32_t modulus_length;
};

int processCert(const uint8_t* block, uint32_t length, pkcs7* record);
