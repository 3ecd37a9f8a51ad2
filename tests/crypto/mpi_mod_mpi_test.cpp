// Long division, compared with GMP.
#include <gtest/gtest.h>

#include <ctime>

#include "crypto/mpi.h"
#include "support/numbers.h"

namespace {

constexpr int kRounds = 150000;

// About half of the dividends are random. Each other dividend is a multiple of the divisor, or 1 to
// 3 less than a multiple. Near multiples, the estimate of a quotient digit is wrong more often than
// elsewhere.
TEST(MpiModMpi, IsTheNonNegativeRemainder) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    const Limbs divisor = operands.Magnitude(8);
    Limbs dividend = operands.Magnitude(16);
    const mpz_class b = Magnitude(divisor.size(), divisor.data());
    if (b == 0) continue;
    if (round % 2 == 0) {
      const mpz_class near = b * Magnitude(dividend.size(), dividend.data()) - operands.Below(3);
      if (near >= 0) dividend = LimbsOf(near + operands.Below(2) * (b - 1));
    }
    Aliased o(round % kAliases, &operands, dividend, divisor);
    if (Value(*o.B) == 0) continue;
    if (o.A != o.B) o.B->s = 1;
    const mpz_class a = Value(*o.A);
    const mpz_class modulus = abs(Value(*o.B));
    mpz_class expected;
    mpz_mod(expected.get_mpz_t(), a.get_mpz_t(), modulus.get_mpz_t());
    ASSERT_EQ(0, mpi_mod_mpi(o.X, o.A, o.B));
    ASSERT_EQ(expected, Value(*o.X)) << a << " mod " << modulus;
    ASSERT_EQ(1, o.X->s);
  }
}

TEST(MpiModMpi, Returns18ForAZeroDivisor) {
  Number A({1});
  Number R({9});
  Number empty;
  Number zero({0, 0});
  EXPECT_EQ(18, mpi_mod_mpi(&R, &A, &empty));
  EXPECT_EQ(18, mpi_mod_mpi(&R, &A, &zero));
  EXPECT_EQ(9, Value(R));
}

TEST(MpiModMpi, IsNotNegativeForANegativeDividend) {
  Number B({7});
  Number R;
  for (uint32_t a = 0; a < 50; ++a) {
    Number A({a}, -1);
    EXPECT_EQ(0, mpi_mod_mpi(&R, &A, &B));
    EXPECT_EQ((7 - a % 7) % 7, Value(R).get_ui());
  }
}

TEST(MpiModMpi, IgnoresTheDivisorsSign) {
  Number A({0, 5}, -1);
  Number B({7}, -1);
  Number R;
  EXPECT_EQ(0, mpi_mod_mpi(&R, &A, &B));
  EXPECT_EQ(1, Value(R));  // 2^32 = 4 mod 7, 5 * 4 = 6 mod 7
}

// mpi_mod_mpi first shifts both numbers left, until the highest bit of the divisor's top limb is
// set. If this bit stayed clear, the estimate of a quotient digit would wrap for these numbers.
TEST(MpiModMpi, IsRightForADivisorWithATopLimbOf31Bits) {
  Number A({0x8712b8bc, 0xffffffff, 0x4000fffe});
  Number B({0x00000001, 0x4000ffff});
  Number R;
  EXPECT_EQ(0, mpi_mod_mpi(&R, &A, &B));
  EXPECT_EQ(mpz_class(Value(A) % Value(B)), Value(R));
}

TEST(MpiModMpi, IsRightForTopLimbsOfEveryBitLength) {
  Number R;
  for (int bit = 0; bit < 32; ++bit) {
    for (uint32_t low : {0u, 1u, 0xffffu, 0xffff0000u, 0xffffffffu}) {
      const uint32_t top = (1u << bit) | (0xffffu >> (31 - bit) / 2);
      Number B({low, top, 0});
      Number A({0x8712b8bc, 0xffffffff, top - 1, 0});
      EXPECT_EQ(0, mpi_mod_mpi(&R, &A, &B));
      EXPECT_EQ(mpz_class(Value(A) % Value(B)), Value(R));
    }
  }
}

TEST(MpiModMpi, IsRightFor2To8192AndAModulusOf128Limbs) {
  Operands operands;
  Limbs limbs(128);
  for (uint32_t& limb : limbs) limb = operands.Limb() | 1;
  Number N(limbs);
  Number RR({1});
  EXPECT_EQ(0, mpi_shift_l(&RR, 8192));
  EXPECT_EQ(0, mpi_mod_mpi(&RR, &RR, &N));
  EXPECT_EQ(mpz_class(PowerOfTwo(8192) % Value(N)), Value(RR));
}

// The numbers are hexadecimal. d, the top limb of the divisor, is 8000ffff. half_digit
// (crypto/mpi.cpp) first divides the top limb of A by the upper half of d: 48000000 / 8000 is 9000,
// with remainder 0. half_digit then multiplies the quotient by the lower half of d: the product is
// 9000 * ffff. It adds d to the remainder until the sum wraps or is at least this product. The
// first sum is d itself. This sum did not wrap and is less than the product, so d must be added
// again. If half_digit stopped after the first addition, it would subtract the product from a
// smaller sum, and the difference would wrap. estimate_digit, which calls half_digit, would then
// return a far too large digit, and quotient_digit would reduce this digit in steps of 1. This is
// slow.
TEST(MpiModMpi, IsFastIfTheFirstSumEqualsTheDivisorsTopLimb) {
  const Number A({0x12345678, 0x0000abcd, 0x48000000});
  const Number B({0xfedcba98, 0x8000ffff});
  Number R;
  const clock_t start = clock();
  for (int round = 0; round < 20000; ++round) ASSERT_EQ(0, mpi_mod_mpi(&R, &A, &B));
  EXPECT_LT(clock() - start, 5 * CLOCKS_PER_SEC);
  EXPECT_EQ(mpz_class(Value(A) % Value(B)), Value(R));
}

}  // namespace
