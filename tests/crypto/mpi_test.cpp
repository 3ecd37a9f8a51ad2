// The big integers, compared with GMP. Other files test the results of mpi_mod_mpi, mpi_montmul and
// mpi_pow_mod. Here, the other operations that compute a value are called kRounds times with random
// operands. Many operands are made of limbs that cause carries.
#include "crypto/mpi.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <tuple>
#include <utility>
#include <vector>

#include "support/failing_malloc.h"
#include "support/numbers.h"

namespace {

constexpr int kRounds = 150000;

TEST(FailingMalloc, SeesBytesThatAreNotWiped) {
  FailingMalloc watch;
  void* volatile block = malloc(8);
  *static_cast<volatile char*>(block) = 1;
  free(block);
  EXPECT_EQ(1, watch.freed());
  EXPECT_EQ(1, watch.freed_unwiped());
}

TEST(MpiInit, SetsEachNumberToTheEmptyValue) {
  mpi a = {-1, 7, nullptr};
  mpi b = {-1, 7, nullptr};
  mpi c = {-1, 7, nullptr};
  mpi_init(&a, &b, nullptr);
  for (const mpi* X : {&a, &b}) {
    EXPECT_EQ(1, X->s);
    EXPECT_EQ(0, X->n);
    EXPECT_EQ(nullptr, X->p);
  }
  EXPECT_EQ(7, c.n);
}

TEST(MpiFree, WipesAndFreesEachNumber) {
  FailingMalloc watch;
  Number a({1, 2, 3}, -1);
  Number b({4});
  Number empty;
  mpi_free(&a, &empty, &b, nullptr);
  EXPECT_EQ(2, watch.freed());
  EXPECT_EQ(0, watch.freed_unwiped());
  EXPECT_EQ(0, watch.live());
  for (const mpi* X : {&a, &empty, &b}) {
    EXPECT_EQ(1, X->s);
    EXPECT_EQ(0, X->n);
    EXPECT_EQ(nullptr, X->p);
  }
}

TEST(MpiGrow, SmallerOrEqualCountKeepsTheLimbs) {
  Number X({1, 2, 3});
  const uint32_t* const limbs = X.p;
  for (int count : {3, 2, 0, -1, INT_MIN}) EXPECT_EQ(0, mpi_grow(&X, count));
  EXPECT_EQ(limbs, X.p);
  EXPECT_EQ(3, X.n);
  EXPECT_EQ(Value(X), Magnitude(3, limbs));
}

TEST(MpiGrow, WipesTheLimbsThatItReplaces) {
  FailingMalloc watch;
  Number X({1, 2, 3});
  EXPECT_EQ(0, mpi_grow(&X, 4));
  EXPECT_EQ(1, watch.freed());
  EXPECT_EQ(0, watch.freed_unwiped());
}

TEST(MpiGrow, LeavesTheNumberUnchangedWithoutMemory) {
  Number X({1, 2, 3}, -1);
  const uint32_t* const limbs = X.p;
  FailingMalloc failing(1);
  EXPECT_EQ(kMpiNoMemory, mpi_grow(&X, 4));
  EXPECT_EQ(limbs, X.p);
  EXPECT_EQ(3, X.n);
  EXPECT_EQ(-1, X.s);
}

TEST(MpiGrow, KeepsTheValueAndAddsZeros) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Number X(operands.Magnitude(8), operands.Sign());
    const mpz_class before = Value(X);
    const int limbs = X.n;
    const int count = static_cast<int>(operands.Below(12));
    ASSERT_EQ(0, mpi_grow(&X, count));
    ASSERT_EQ(std::max(limbs, count), X.n);
    ASSERT_EQ(before, Value(X));
  }
}

TEST(MpiAssign, CopiesTheValueAndClearsTheOldLimbs) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Number X(operands.Magnitude(8), operands.Sign());
    Number A(operands.Magnitude(8), operands.Sign());
    ASSERT_EQ(0, mpi_assign(&X, &A));
    ASSERT_EQ(Value(A), Value(X));
    ASSERT_EQ(0, mpi_assign(&A, &A));
    ASSERT_EQ(Value(X), Value(A));
  }
}

TEST(MpiMsb, IsZeroForZero) {
  Number empty;
  Number zero({0, 0});
  EXPECT_EQ(0, mpi_msb(&empty));
  EXPECT_EQ(0, mpi_msb(&zero));
}

TEST(MpiMsb, IsOneForOne) {
  Number one({1, 0});
  EXPECT_EQ(1, mpi_msb(&one));
}

TEST(MpiMsb, Is33For2To32) {
  Number X({0, 1});
  EXPECT_EQ(33, mpi_msb(&X));
}

TEST(MpiMsb, IsTheLengthInBits) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Number X(operands.Magnitude(8), operands.Sign());
    const mpz_class x = Value(X);
    ASSERT_EQ(x == 0 ? 0 : mpz_sizeinbase(x.get_mpz_t(), 2), static_cast<size_t>(mpi_msb(&X)));
  }
}

TEST(MpiCompare, OrdersByMagnitudeAndBySign) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Number A(operands.Magnitude(3), operands.Sign());
    Number B(round % 4 == 0 ? LimbsOf(abs(Value(A))) : operands.Magnitude(3), operands.Sign());
    const mpz_class a = Value(A);
    const mpz_class b = Value(B);
    ASSERT_EQ(cmp(abs(a), abs(b)) < 0, mpi_compare_abs(&A, &B) < 0);
    ASSERT_EQ(cmp(abs(a), abs(b)) > 0, mpi_compare_abs(&A, &B) > 0);
    ASSERT_EQ(a < b, mpi_compare(&A, &B) < 0) << a << ' ' << b;
    ASSERT_EQ(a > b, mpi_compare(&A, &B) > 0) << a << ' ' << b;
  }
}

TEST(MpiCompare, ZeroIsBetweenNegativeAndPositiveNumbers) {
  for (const Limbs& zero : {Limbs{}, Limbs{0}, Limbs{0, 0}}) {
    for (const int sign : {1, -1}) {
      const Number nothing(zero, sign);
      for (const Limbs& limbs : {Limbs{1}, Limbs{UINT32_MAX}, Limbs{0, 1}}) {
        const Number positive(limbs);
        const Number negative(limbs, -1);
        EXPECT_GT(mpi_compare(&nothing, &negative), 0);
        EXPECT_LT(mpi_compare(&negative, &nothing), 0);
        EXPECT_LT(mpi_compare(&nothing, &positive), 0);
        EXPECT_GT(mpi_compare(&positive, &nothing), 0);
      }
    }
  }
}

TEST(MpiCompare, TwoZerosAreEqualWithAnySigns) {
  Number zero({0});
  Number negative({0, 0}, -1);
  EXPECT_EQ(0, mpi_compare(&zero, &negative));
  EXPECT_EQ(0, mpi_compare(&negative, &zero));
}

TEST(MpiBytes, AreBigEndian) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    std::vector<uint8_t> bytes(operands.Below(20));
    for (uint8_t& byte : bytes) byte = static_cast<uint8_t>(operands.Limb());
    for (size_t i = 0; i < bytes.size() && operands.Below(3) == 0; ++i) bytes[i] = 0;
    mpz_class z;
    mpz_import(z.get_mpz_t(), bytes.size(), 1, 1, 0, 0, bytes.data());
    Number X(operands.Magnitude(6), -1);
    ASSERT_EQ(0, mpi_from_bytes(&X, bytes.data(), bytes.size()));
    ASSERT_EQ(z, Value(X));
    std::vector<uint8_t> written(bytes.size(), 0xAA);
    ASSERT_EQ(0, mpi_to_bytes(&X, written.data(), written.size()));
    ASSERT_EQ(bytes, written);
  }
}

TEST(MpiBytes, AreReadIntoTheFewestLimbsButAtLeastOne) {
  const uint8_t bytes[] = {0, 0, 1, 2, 3, 4, 5};
  Number X;
  EXPECT_EQ(0, mpi_from_bytes(&X, bytes, sizeof(bytes)));
  EXPECT_EQ(2, X.n);
  Number zero;
  EXPECT_EQ(0, mpi_from_bytes(&zero, bytes, 2));
  EXPECT_EQ(1, zero.n);
  Number nothing;
  EXPECT_EQ(0, mpi_from_bytes(&nothing, nullptr, 0));
  EXPECT_EQ(1, nothing.n);
}

TEST(MpiBytes, AreNotWrittenIfTheNumberDoesNotFit) {
  Number X({0, 0x100});
  uint8_t bytes[6] = {7, 7, 7, 7, 7, 7};
  EXPECT_EQ(kMpiBufferTooSmall, mpi_to_bytes(&X, bytes, 5));
  for (uint8_t byte : bytes) EXPECT_EQ(7, byte);
  EXPECT_EQ(0, mpi_to_bytes(&X, bytes, 6));
  EXPECT_EQ(1, bytes[0]);
}

TEST(MpiShiftL, KeepsTheValueForACountOfZero) {
  Number X({5, 6, 7}, -1);
  const mpz_class before = Value(X);
  EXPECT_EQ(0, mpi_shift_l(&X, 0));
  EXPECT_EQ(before, Value(X));
  EXPECT_EQ(3, X.n);
}

TEST(MpiShiftL, MovesWholeLimbsAndGrowsAsNeeded) {
  Number X({5, 6, 0}, -1);
  EXPECT_EQ(0, mpi_shift_l(&X, 32));
  EXPECT_EQ(3, X.n);
  EXPECT_EQ(0, mpi_shift_l(&X, 64));
  EXPECT_EQ(5, X.n);
  const uint32_t expected[] = {0, 0, 0, 5, 6};
  EXPECT_EQ(-Magnitude(5, expected), Value(X));
}

TEST(MpiShiftL, GrowsToJustTheLimbsThatTheProductNeeds) {
  const std::tuple<Limbs, int, int> cases[] = {
      {{1}, 31, 1}, {{1}, 32, 2}, {{0x80000000}, 32, 2}, {{0x80000000}, 33, 3}, {{}, 0, 0},
      {{}, 1, 1},   {{}, 32, 1},  {{}, 33, 2},           {{1, 0}, 5, 2}};
  for (const auto& [limbs, count, expected] : cases) {
    Number X(limbs);
    EXPECT_EQ(0, mpi_shift_l(&X, count));
    EXPECT_EQ(expected, X.n) << limbs.size() << " limbs by " << count;
  }
}

TEST(MpiShiftL, MultipliesByAPowerOfTwo) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Number X(operands.Magnitude(6), operands.Sign());
    const mpz_class before = Value(X);
    const uint32_t count = operands.Below(2) == 0 ? operands.Below(6) * 32 : operands.Below(200);
    ASSERT_EQ(0, mpi_shift_l(&X, static_cast<int>(count)));
    ASSERT_EQ(before * PowerOfTwo(count), Value(X));
  }
}

TEST(MpiShiftL, ChangesNothingForANegativeCount) {
  Number X({5});
  for (int count : {-1, -32, INT_MIN}) EXPECT_EQ(0, mpi_shift_l(&X, count));
  EXPECT_EQ(5, Value(X));
}

TEST(MpiShiftL, ReturnsNoMemoryIfTheBitLengthDoesNotFitInAnInt) {
  Number X({1});
  FailingMalloc watch;
  EXPECT_EQ(kMpiNoMemory, mpi_shift_l(&X, INT_MAX));
  EXPECT_EQ(0, watch.calls());
  EXPECT_EQ(1, Value(X));
}

TEST(MpiShiftL, NeedsMemoryToShiftZeroByTheGreatestCount) {
  Number zero;
  FailingMalloc failing(1);
  EXPECT_EQ(kMpiNoMemory, mpi_shift_l(&zero, INT_MAX));
  EXPECT_EQ(0, zero.n);
}

TEST(MpiAddAbs, AddsMagnitudes) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Aliased o(round % kAliases, &operands, operands.Magnitude(6), operands.Magnitude(6));
    const mpz_class sum = abs(Value(*o.A)) + abs(Value(*o.B));
    ASSERT_EQ(0, mpi_add_abs(o.X, o.A, o.B));
    ASSERT_EQ(sum, Value(*o.X));
    ASSERT_EQ(1, o.X->s);
  }
}

TEST(MpiAddAbs, CarriesIntoANewLimb) {
  Number A({UINT32_MAX, UINT32_MAX});
  Number B({1});
  Number X;
  EXPECT_EQ(0, mpi_add_abs(&X, &A, &B));
  EXPECT_EQ(3, X.n);
  EXPECT_EQ(PowerOfTwo(64), Value(X));
}

TEST(MpiSubAbs, SubtractsMagnitudes) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Limbs first = operands.Magnitude(6);
    Limbs second = operands.Magnitude(6);
    if (Magnitude(first.size(), first.data()) < Magnitude(second.size(), second.data()))
      std::swap(first, second);
    Aliased o(round % kAliases, &operands, first, second);
    const mpz_class difference = abs(Value(*o.A)) - abs(Value(*o.B));
    ASSERT_EQ(0, mpi_sub_abs(o.X, o.A, o.B));
    ASSERT_EQ(difference, Value(*o.X));
    ASSERT_EQ(1, o.X->s);
  }
}

TEST(MpiSubAbs, Returns16AndChangesNothingIfTheSubtrahendIsGreater) {
  Number A({1, 2}, -1);
  Number B({2, 2}, -1);
  Number X({9}, -1);
  EXPECT_EQ(16, mpi_sub_abs(&X, &A, &B));
  EXPECT_EQ(-9, Value(X));
  EXPECT_EQ(16, mpi_sub_abs(&B, &A, &B));
  EXPECT_EQ(-Magnitude(2, B.p), Value(B));
}

TEST(MpiSubAbs, MayStoreTheDifferenceInTheSubtrahend) {
  Number A({0, 0, 1});
  Number B({1});
  EXPECT_EQ(0, mpi_sub_abs(&B, &A, &B));
  EXPECT_EQ(PowerOfTwo(64) - 1, Value(B));
}

TEST(MpiMulInt, MultipliesByOneLimb) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    Aliased o(round % 2 == 0 ? kNone : kXIsA, &operands, operands.Magnitude(20), {});
    const uint32_t b = operands.Limb();
    const mpz_class product = Value(*o.A) * b;
    const int sign = o.A->s;
    ASSERT_EQ(0, mpi_mul_int(o.X, o.A, b));
    ASSERT_EQ(product, Value(*o.X));
    ASSERT_EQ(sign, o.X->s);
    ASSERT_GE(o.X->n, 1);
  }
}

TEST(MpiMulInt, ResultHasOneExtraLimbUnlessTheMultiplierIsZero) {
  const Number A({1, 2, 3, 0});
  const Number empty;
  const std::tuple<const mpi*, uint32_t, int> cases[] = {
      {&A, 1, 4}, {&A, 0, 3}, {&empty, 1, 1}, {&empty, 0, 1}};
  for (const auto& [factor, b, limbs] : cases) {
    Number X;
    EXPECT_EQ(0, mpi_mul_int(&X, factor, b));
    EXPECT_EQ(limbs, X.n) << b;
    EXPECT_EQ(mpz_class(Value(*factor) * b), Value(X));
  }
}

TEST(MpiMulHlp, AddsAProductAndPropagatesTheCarry) {
  Operands operands;
  for (int round = 0; round < kRounds; ++round) {
    const size_t count = operands.Below(40);
    Limbs s(count);
    Limbs d(count + 2);
    for (uint32_t& limb : s) limb = operands.Limb();
    for (uint32_t& limb : d) limb = operands.Limb();
    d.push_back(0);
    d.push_back(0x12345678);
    const uint32_t b = operands.Limb();
    const mpz_class sum = Magnitude(d.size(), d.data()) + Magnitude(count, s.data()) * mpz_class(b);
    mpi_mul_hlp(static_cast<int>(count), s.data(), d.data(), b);
    ASSERT_EQ(sum, Magnitude(d.size(), d.data())) << count << " limbs";
  }
}

TEST(Mpi, ReportsEachAllocationThatFails) {
  const Number A({UINT32_MAX, UINT32_MAX, UINT32_MAX}, -1);
  const Number B({1});
  const uint8_t bytes[] = {1, 2, 3};
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    return mpi_assign(&X, &A);
  });
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    return mpi_from_bytes(&X, bytes, sizeof(bytes));
  });
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    return mpi_add_abs(&X, &A, &B);
  });
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    const int result = mpi_assign(&X, &A);
    return result != 0 ? result : mpi_sub_abs(&X, &A, &X);
  });
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    const int result = mpi_assign(&X, &A);
    return result != 0 ? result : mpi_mul_int(&X, &X, 2);
  });
  ExpectNoMemoryAtEveryAllocation([&] {
    Number X;
    const int result = mpi_assign(&X, &A);
    return result != 0 ? result : mpi_shift_l(&X, 1);
  });
  ExpectNoMemoryAtEveryAllocation([&] {
    Number R;
    return mpi_mod_mpi(&R, &A, &B);
  });
  // A is negative, so its remainder is negative until the divisor is added.
  const Number divisor({7, 0xffff});
  ExpectNoMemoryAtEveryAllocation([&] {
    Number R;
    return mpi_mod_mpi(&R, &A, &divisor);
  });
}

}  // namespace
