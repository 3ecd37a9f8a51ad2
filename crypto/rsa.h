// RSA PKCS#1 v1.5 signature verification (RFC 8017 section 8.2.2) on the tool's own integers.
#pragma once

#include <cstdint>

#include "crypto/mpi.h"

struct rsa_context {
  int32_t len;
  mpi N;
  mpi E;
};

int rsa_set_key(rsa_context* ctx, const uint8_t* modulus, const uint8_t* exponent,
                uint32_t exponent_value, uint32_t len);
int rsa_pkcs1_verify(rsa_context* ctx, const uint8_t* sha1, const uint8_t* sha256,
                     const uint8_t* md5, const uint8_t* sig);
