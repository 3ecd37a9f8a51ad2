// Tests rsa_set_key, and rsa_pkcs1_verify with the keys that rsa_set_key has set.
#include "crypto/rsa.h"

#include <gtest/gtest.h>
#include <openssl/nid.h>

#include <tuple>

#include "crypto/rsa_digests.h"
#include "support/der.h"
#include "support/failing_malloc.h"
#include "support/guarded_bytes.h"
#include "support/rsa_keys.h"

namespace {

TEST(RsaSetKey, ReadsTheModulusWithoutItsLeadingZeros) {
  const Bytes modulus = FromHex("0000000102030405060708");
  rsa_local context;
  EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 3, Length(modulus)));
  EXPECT_EQ(11, context.len);
  ASSERT_EQ(2, context.N.n);
  EXPECT_EQ(1, context.N.s);
  EXPECT_EQ(0x05060708u, context.N.p[0]);
  EXPECT_EQ(0x01020304u, context.N.p[1]);
  ASSERT_EQ(1, context.E.n);
  EXPECT_EQ(3u, context.E.p[0]);
  EXPECT_EQ(1, context.E.s);
}

TEST(RsaSetKey, ModulusOfZerosIsOneZeroLimb) {
  const Bytes modulus(16);
  rsa_local context;
  EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 3, 16));
  ASSERT_EQ(1, context.N.n);
  EXPECT_EQ(0u, context.N.p[0]);
  EXPECT_EQ(5, Verify(context, Bytes(16)));
}

TEST(RsaSetKey, LengthOfZeroGivesAnEmptyKeyThatVerifiesNothing) {
  rsa_local context;
  context.len = 128;
  const Bytes modulus(128, 0xFF);
  EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 3, 0));
  EXPECT_EQ(128, context.len);
  EXPECT_EQ(0, context.N.n);
  EXPECT_EQ(0, context.E.n);
  EXPECT_EQ(5, Verify(context, Bytes(128)));
}

TEST(RsaSetKey, NullModulusGivesAnEmptyKeyThatVerifiesNothing) {
  rsa_local context;
  EXPECT_EQ(0, rsa_set_key(&context, nullptr, nullptr, 3, 128));
  EXPECT_EQ(128, context.len);
  EXPECT_EQ(0, context.N.n);
  EXPECT_EQ(0, context.E.n);
  EXPECT_EQ(5, Verify(context, Bytes(128)));
}

TEST(RsaSetKey, DiscardsTheContextsOldKey) {
  const Bytes modulus(16, 0xFF);
  rsa_local context;
  context.N = {-1, 7, nullptr};
  context.E = {-1, 7, nullptr};
  EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 0, 16));
  EXPECT_EQ(4, context.N.n);
  EXPECT_EQ(0, context.E.n);
}

TEST(RsaSetKey, ReadsTheExponentValueAsASignedNumber) {
  const Bytes modulus(16, 0xFF);
  const std::tuple<uint32_t, uint32_t, int> cases[] = {{1, 1, 1},
                                                       {0x7fffffff, 0x7fffffff, 1},
                                                       {0x80000000, 0x80000000, -1},
                                                       {0x80000001, 0x7fffffff, -1},
                                                       {0xffffffff, 1, -1}};
  for (const auto& [value, magnitude, sign] : cases) {
    rsa_local context;
    EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, value, 16));
    ASSERT_EQ(1, context.E.n);
    EXPECT_EQ(magnitude, context.E.p[0]);
    EXPECT_EQ(sign, context.E.s);
  }
}

// The readable memory ends right after the 128 bytes of the exponent.
TEST(RsaSetKey, ReadsExactlyAsManyBytesOfTheExponentAsTheModulusHas) {
  const FixedKey key("rsa-1024");
  Bytes bytes(128, 0);
  bytes[125] = 1;
  bytes[127] = 1;
  GuardedBytes exponent(bytes);
  rsa_local context;
  EXPECT_EQ(0, rsa_set_key(&context, key.modulus.data(), exponent.data(), 3, 128));
  ASSERT_EQ(1, context.E.n);
  EXPECT_EQ(65537u, context.E.p[0]);
  EXPECT_EQ(0, Verify(context, key.Sign(NID_sha256, kSha256)));
  mpi_free(&context.N, &context.E, nullptr);

  exponent.data()[0] = 0x80;
  EXPECT_EQ(0, rsa_set_key(&context, key.modulus.data(), exponent.data(), 3, 128));
  EXPECT_EQ(1024, mpi_msb(&context.E));
}

TEST(RsaSetKey, Returns9WithoutMemoryForModulusOrExponentBytes) {
  const Bytes modulus(128, 0xFF);
  const Bytes exponent(128, 0x03);
  for (int call : {1, 2}) {
    rsa_local context;
    FailingMalloc failing(call);
    EXPECT_EQ(9, rsa_set_key(&context, modulus.data(), exponent.data(), 0, 128));
    EXPECT_TRUE(failing.failed());
    EXPECT_EQ(0, failing.live());
    EXPECT_EQ(0, failing.freed_unwiped());
    EXPECT_EQ(0, context.N.n);
    EXPECT_EQ(0, context.E.n);
  }
  rsa_local context;
  FailingMalloc failing(3);
  EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), exponent.data(), 0, 128));
  EXPECT_FALSE(failing.failed());
}

TEST(RsaSetKey, LeavesTheExponentEmptyWithoutMemoryForItsValue) {
  const Bytes modulus(128, 0xFF);
  rsa_local context;
  FailingMalloc failing(2);
  EXPECT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 65537, 128));
  EXPECT_TRUE(failing.failed());
  EXPECT_EQ(32, context.N.n);
  EXPECT_EQ(0, context.E.n);
  EXPECT_EQ(1, context.E.s);
}

}  // namespace
