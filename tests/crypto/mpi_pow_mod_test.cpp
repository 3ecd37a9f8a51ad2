// Montgomery products, and the exponentiation built on them, compared with GMP.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "crypto/mpi.h"
#include "support/failing_malloc.h"
#include "support/numbers.h"

namespace {

constexpr int kRounds = 100000;

// The bit lengths of the exponent at which the window grows, with the new window size.
constexpr struct {
  int bits;
  int window;
} kWindows[] = {{24, 3}, {80, 4}, {240, 5}, {672, 6}};

// An odd modulus of `count` limbs.
Limbs OddModulus(Operands* operands, size_t count) {
  Limbs limbs(count);
  for (uint32_t& limb : limbs) limb = operands->Limb();
  limbs.front() |= 1;
  if (limbs.back() == 0) limbs.back() = 1;
  return limbs;
}

// A number of exactly `bits` bits.
mpz_class OfBits(Operands* operands, int bits) {
  mpz_class z = 0;
  for (int i = 0; i < bits; i += 32) z = (z << 32) + operands->Limb();
  const mpz_class top = PowerOfTwo(static_cast<unsigned long>(bits - 1));
  return z % top + top;
}

// -1 / N mod 2^32.
uint32_t MontgomeryConstant(const mpz_class& N) {
  mpz_class inverse;
  mpz_invert(inverse.get_mpz_t(), N.get_mpz_t(), PowerOfTwo(32).get_mpz_t());
  return static_cast<uint32_t>(mpz_class(PowerOfTwo(32) - inverse).get_ui());
}

void ExpectPower(const mpz_class& a, const mpz_class& e, const Limbs& modulus) {
  const Number N(modulus);
  const Number A(LimbsOf(a));
  const Number E(LimbsOf(e));
  mpz_class expected;
  mpz_powm(expected.get_mpz_t(), a.get_mpz_t(), e.get_mpz_t(), Value(N).get_mpz_t());
  Number X;
  ASSERT_EQ(0, mpi_pow_mod(&X, &A, &E, &N));
  ASSERT_EQ(N.n + 1, X.n);
  ASSERT_EQ(expected, Value(X)) << modulus.size() << " limbs, exponent " << e;
}

// Returns the number of allocations of an exponentiation: those for the window table, and a
// constant number of others.
int AllocationsForExponent(const mpz_class& e) {
  const Number N({0xfffffff1, 0xfffffff1});
  const Number A({3});
  const Number E(LimbsOf(e));
  Number X;
  FailingMalloc watch;
  EXPECT_EQ(0, mpi_pow_mod(&X, &A, &E, &N));
  return watch.calls();
}

TEST(MpiMontmul, IsTheProductDividedByR) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    const size_t n = 1 + operands.Below(round % 50 == 0 ? 40 : 6);
    const Number N(OddModulus(&operands, n));
    const mpz_class modulus = Value(N);
    const Limbs limbs = operands.Magnitude(static_cast<uint32_t>(n));
    const mpz_class a = Magnitude(limbs.size(), limbs.data()) % modulus;
    const mpz_class b = round % 3 == 0 ? a : mpz_class(OfBits(&operands, 1 + round % 64) % modulus);
    Number A(LimbsOf(a));
    Number B(LimbsOf(b));
    Number T(Limbs(2 * (n + 1), 0xAAAAAAAA));
    ASSERT_EQ(0, mpi_grow(&A, static_cast<int>(n) + 1));
    const bool square = round % 3 == 0;
    mpi_montmul(&A, square ? &A : &B, &N, MontgomeryConstant(modulus), &T);
    ASSERT_LT(Value(A), modulus);
    ASSERT_EQ(mpz_class(a * b % modulus), mpz_class((Value(A) << (32 * n)) % modulus));
  }
}

TEST(MpiMontmul, AcceptsAFactorShorterOrLongerThanTheModulus) {
  const Number N({0xfffffff1, 0xfffffff1});
  const mpz_class modulus = Value(N);
  Limbs longer(20);
  longer[0] = 5;
  for (const Limbs& limbs : {Limbs{5}, Limbs{5, 0}, longer}) {
    Number A({7, 8, 0});
    Number B(limbs);
    Number T(Limbs(6));
    const mpz_class product = Value(A) * 5 % modulus;
    mpi_montmul(&A, &B, &N, MontgomeryConstant(modulus), &T);
    EXPECT_EQ(product, mpz_class((Value(A) << 64) % modulus));
  }
}

TEST(MpiMontmul, IsZeroIfTheModulusDividesTheProduct) {
  const std::pair<uint32_t, uint32_t> cases[] = {{3, 5}, {5, 3}, {0, 7}, {7, 0}, {0, 0}};
  const Number N({15});
  for (const auto& [a, b] : cases) {
    Number A({a, 0});
    const Number B({b});
    Number T(Limbs(4));
    mpi_montmul(&A, &B, &N, MontgomeryConstant(15), &T);
    EXPECT_EQ(0, Value(A)) << a << " * " << b;
  }
}

// Here, N is 2^32 - 1. So R, which is 2^32, is congruent to 1 modulo N. Therefore, the Montgomery
// product A * B / R is congruent to A * B modulo N.
TEST(MpiMontmul, SubtractsAlsoWhereTheProductIsBelowTheModulus) {
  const Number N({UINT32_MAX});
  Number A({3, 0});
  const Number B({5});
  Number T(Limbs(4));
  mpi_montmul(&A, &B, &N, 1, &T);
  EXPECT_EQ(15, Value(A));
  // After the multiplication, limb 0 of T contained 3, which was A's value, and limb 1 contained
  // the product, 15. As the product is below N, mpi_montmul subtracted 15 from limb 0 of T. This
  // borrowed 1 from limb 1.
  EXPECT_EQ(static_cast<uint32_t>(3 - 15), T.p[0]);
  EXPECT_EQ(14u, T.p[1]);
}

TEST(MpiPowMod, IsRightForModuliOf1To128Limbs) {
  Operands operands;
  for (size_t n = 1; n <= 128; ++n) {
    const Limbs modulus = OddModulus(&operands, n);
    const mpz_class a = OfBits(&operands, static_cast<int>(32 * n));
    ExpectPower(a % Magnitude(n, modulus.data()), 65537, modulus);
    ExpectPower(a, OfBits(&operands, 1 + static_cast<int>(n)), modulus);
  }
}

TEST(MpiPowMod, IsRightForEveryWindow) {
  Operands operands;
  for (size_t n : {1, 2, 3, 7, 8, 9, 15, 16, 17, 24, 31, 33}) {
    const Limbs modulus = OddModulus(&operands, n);
    for (const auto& window : kWindows) {
      for (int bits : {window.bits - 1, window.bits, window.bits + 1, window.bits + 37}) {
        ExpectPower(OfBits(&operands, static_cast<int>(32 * n)), OfBits(&operands, bits), modulus);
        ExpectPower(2, PowerOfTwo(static_cast<unsigned long>(bits)) - 1, modulus);
        ExpectPower(2, PowerOfTwo(static_cast<unsigned long>(bits - 1)), modulus);
      }
    }
  }
}

TEST(MpiPowMod, IsRightForAModulusOf128LimbsAndWideWindows) {
  Operands operands;
  const Limbs modulus = OddModulus(&operands, 128);
  for (const auto& window : kWindows)
    ExpectPower(OfBits(&operands, 4096), OfBits(&operands, window.bits), modulus);
}

TEST(MpiPowMod, IsRightForManySmallOperands) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    const Limbs modulus = OddModulus(&operands, 1 + operands.Below(3));
    const Limbs a = operands.Magnitude(4);
    const Limbs e = operands.Magnitude(1);
    ExpectPower(Magnitude(a.size(), a.data()), Magnitude(e.size(), e.data()), modulus);
  }
}

TEST(MpiPowMod, UsesAWindowOfOneForExponents3And65537) {
  EXPECT_EQ(AllocationsForExponent(1), AllocationsForExponent(3));
  EXPECT_EQ(AllocationsForExponent(1), AllocationsForExponent(65537));
  EXPECT_EQ(AllocationsForExponent(1), AllocationsForExponent(PowerOfTwo(23) - 1));
}

// The table for a window of one bit has only the base itself. The table for w > 1 bits also has
// 2^(w-1) powers of the base. No window has 2 bits.
TEST(MpiPowMod, WidensTheWindowWithTheExponent) {
  const int fixed = AllocationsForExponent(1);
  int before = fixed;
  for (const auto& window : kWindows) {
    const auto bits = static_cast<unsigned long>(window.bits);
    EXPECT_EQ(before, AllocationsForExponent(PowerOfTwo(bits - 1) - 1)) << bits;
    before = fixed + (1 << (window.window - 1));
    EXPECT_EQ(before, AllocationsForExponent(PowerOfTwo(bits - 1))) << bits;
  }
}

TEST(MpiPowMod, Returns4ForAnEvenModulus) {
  const Number A({3});
  const Number E({3});
  Number X({9});
  for (const Limbs& limbs : {Limbs{}, Limbs{0}, Limbs{0xfffffff0}, Limbs{0, 1}}) {
    const Number N(limbs);
    EXPECT_EQ(4, mpi_pow_mod(&X, &A, &E, &N));
  }
  EXPECT_EQ(9, Value(X));
}

TEST(MpiPowMod, Returns4ForANegativeModulus) {
  const Number A({3});
  const Number E({3});
  const Number N({7}, -1);
  Number X({9});
  EXPECT_EQ(4, mpi_pow_mod(&X, &A, &E, &N));
  EXPECT_EQ(9, Value(X));
}

TEST(MpiPowMod, IsZeroForAModulusOfOne) {
  ExpectPower(5, 3, {1});
  ExpectPower(5, 0, {1, 0});
}

TEST(MpiPowMod, IsOneForAnEmptyExponent) {
  const Number A({3});
  const Number E;
  const Number N({7});
  Number X;
  EXPECT_EQ(0, mpi_pow_mod(&X, &A, &E, &N));
  EXPECT_EQ(1, Value(X));
}

TEST(MpiPowMod, IgnoresTheExponentsSign) {
  const Number A({3});
  const Number E({4}, -1);
  const Number N({101});
  Number X;
  EXPECT_EQ(0, mpi_pow_mod(&X, &A, &E, &N));
  EXPECT_EQ(81, Value(X));
}

TEST(MpiPowMod, MayStoreTheResultInTheBase) {
  Number A({3}, 1);
  const Number E({4});
  const Number N({101});
  EXPECT_EQ(0, mpi_pow_mod(&A, &A, &E, &N));
  EXPECT_EQ(81, Value(A));
}

TEST(MpiPowMod, ReportsEachAllocationThatFails) {
  const Number A({1, 2, 3});
  const Number E(LimbsOf(PowerOfTwo(671)));
  const Number N({5, 0x4000ffff});
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    return mpi_pow_mod(&X, &A, &E, &N);
  });
}

}  // namespace
