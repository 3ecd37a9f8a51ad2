// Operands for the tests of the integers in crypto/mpi.h: made of given limbs or drawn at random.
// Other functions convert these integers, or their limbs, to GMP's numbers. LimbsOf() converts a
// GMP number to limbs.
#pragma once

#include <gmpxx.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <vector>

#include "crypto/mpi.h"
#include "support/failing_malloc.h"

using Limbs = std::vector<uint32_t>;

inline void Set(mpi* X, const Limbs& limbs, int sign = 1) {
  mpi_free(X, nullptr);
  ASSERT_EQ(0, mpi_grow(X, static_cast<int>(limbs.size())));
  for (size_t i = 0; i < limbs.size(); ++i) X->p[i] = limbs[i];
  X->s = sign;
}

// A number made of these limbs, least significant limb first.
struct Number : mpi_local {
  explicit Number(const Limbs& limbs = {}, int sign = 1) { Set(this, limbs, sign); }
};

inline mpz_class Magnitude(size_t count, const uint32_t* limbs) {
  mpz_class z;
  if (count > 0) mpz_import(z.get_mpz_t(), count, -1, sizeof(uint32_t), 0, 0, limbs);
  return z;
}

inline mpz_class Value(const mpi& X) {
  const mpz_class magnitude = Magnitude(static_cast<size_t>(X.n), X.p);
  return X.s < 0 ? mpz_class(-magnitude) : magnitude;
}

inline Limbs LimbsOf(const mpz_class& z) {
  Limbs limbs((mpz_sizeinbase(z.get_mpz_t(), 2) + 31) / 32 + 1);
  mpz_export(limbs.data(), nullptr, -1, sizeof(uint32_t), 0, 0, z.get_mpz_t());
  return limbs;
}

inline mpz_class PowerOfTwo(unsigned long exponent) { return mpz_class(1) << exponent; }

// Makes operands. Their limbs are random, or have values that provoke carries, borrows and wrong
// estimates of a quotient.
class Operands {
 public:
  uint32_t Below(uint32_t bound) { return static_cast<uint32_t>(random_() % bound); }
  int Sign() { return Below(2) == 0 ? 1 : -1; }

  uint32_t Limb() {
    static constexpr uint32_t kEdges[] = {0,          1,          2,          0x7fffffff,
                                          0x80000000, 0x80000001, 0xffffffff, 0xfffffffe,
                                          0xffff0000, 0x0000ffff, 0x00010000, 0x4000ffff};
    return Below(2) == 0 ? static_cast<uint32_t>(random_()) : kEdges[Below(std::size(kEdges))];
  }

  // 0 to `max` limbs. All are random, or all are from Limb(), or all are equal. Sometimes the most
  // significant limbs are then set to zero.
  Limbs Magnitude(uint32_t max) {
    Limbs limbs(Below(max + 1));
    const uint32_t kind = Below(3);
    const uint32_t same = Limb();
    for (uint32_t& limb : limbs)
      limb = kind == 0 ? static_cast<uint32_t>(random_()) : kind == 1 ? Limb() : same;
    for (uint32_t i = 0; i < limbs.size() && Below(4) == 0; ++i) limbs[limbs.size() - 1 - i] = 0;
    return limbs;
  }

 private:
  std::mt19937 random_;
};

// Says which of X, A and B are the same object in an operation X = A op B.
enum Alias { kNone, kXIsA, kXIsB, kAIsB, kAllOne, kAliases };

struct Aliased {
  Number x, a, b;
  mpi *X, *A, *B;

  Aliased(int alias, Operands* operands, const Limbs& first, const Limbs& second) {
    Set(&x, operands->Magnitude(6), operands->Sign());
    Set(&a, first, operands->Sign());
    Set(&b, second, operands->Sign());
    A = &a;
    B = alias == kAIsB || alias == kAllOne ? A : &b;
    X = alias == kXIsA || alias == kAllOne ? A : alias == kXIsB ? B : &x;
  }
};

// Calls `operation` repeatedly. In call n, allocation n fails, and `operation` must return
// kMpiNoMemory. In the last call, no allocation fails, and `operation` must return 0. No call may
// leak a block, or free a block that is not wiped.
template <typename Operation>
void ExpectNoMemoryAtEveryAllocation(const Operation& operation) {
  for (int call = 1;; ++call) {
    FailingMalloc failing(call);
    const int result = operation();
    EXPECT_EQ(0, failing.live()) << "leak when call " << call << " fails";
    EXPECT_EQ(0, failing.freed_unwiped());
    if (!failing.failed()) {
      EXPECT_EQ(0, result);
      EXPECT_GT(call, 1) << "nothing was allocated";
      return;
    }
    EXPECT_EQ(kMpiNoMemory, result) << "call " << call;
  }
}
