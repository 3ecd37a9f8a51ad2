// crypto/mpi.h: compares sums, differences, products, remainders, shifts and bit lengths of any
// operands with those that GMP computes.
#include "crypto/mpi.h"

#include <gmp.h>

#include <algorithm>
#include <string>
#include <vector>

#include "fuzz/fuzz.h"

namespace {

// A number of the tool: an mpi that frees its limbs.
struct Number : mpi_local {
  void Set(const std::vector<uint32_t>& limbs, int sign) {
    Require(mpi_grow(this, static_cast<int>(limbs.size())) == 0, "mpi_grow succeeds");
    std::copy(limbs.begin(), limbs.end(), p);
    s = sign;
  }
};

// A number of GMP: a copy of an mpi, or a result that GMP computes.
class Expected {
 public:
  Expected() { mpz_init(value_); }
  explicit Expected(const mpi* number) : Expected() {
    if (number->n == 0) return;
    mpz_import(value_, static_cast<size_t>(number->n), -1, sizeof(uint32_t), 0, 0, number->p);
    if (number->s < 0) mpz_neg(value_, value_);
  }
  ~Expected() { mpz_clear(value_); }
  Expected(const Expected&) = delete;
  Expected& operator=(const Expected&) = delete;

  mpz_ptr get() { return value_; }
  bool operator==(Expected& other) { return mpz_cmp(value_, other.value_) == 0; }

 private:
  mpz_t value_;
};

void RequireEqual(const mpi* number, Expected& expected, const char* what) {
  Expected actual(number);
  Require(actual == expected, what);
}

// About half of the limbs have values that provoke errors of arithmetic, such as 0 and 0xffffffff.
// The others may have any value.
std::vector<uint32_t> Limbs(FuzzedDataProvider& input, size_t most) {
  constexpr uint32_t kEdges[] = {0, 1, 0xffffffff, 0x80000000, 0x7fffffff, 0xffff0000, 0x10000};
  std::vector<uint32_t> limbs(input.ConsumeIntegralInRange<size_t>(0, most));
  for (uint32_t& limb : limbs) {
    limb = input.ConsumeBool() ? input.ConsumeIntegral<uint32_t>() : input.PickValueInArray(kEdges);
  }
  return limbs;
}

void Fill(FuzzedDataProvider& input, Number& number, bool may_be_negative = true) {
  const int sign = may_be_negative && input.ConsumeBool() ? -1 : 1;
  number.Set(Limbs(input, 20), sign);
}

void Shift(FuzzedDataProvider& input) {
  Number x;
  Fill(input, x);
  const int count = input.ConsumeIntegralInRange(0, 300);
  Expected expected(&x);
  Require(static_cast<size_t>(mpi_msb(&x)) ==
              (mpz_sgn(expected.get()) == 0 ? 0 : mpz_sizeinbase(expected.get(), 2)),
          "mpi_msb returns the bit length that GMP computes");
  mpz_mul_2exp(expected.get(), expected.get(), static_cast<mp_bitcnt_t>(count));
  Require(mpi_shift_l(&x, count) == 0, "mpi_shift_l succeeds");
  RequireEqual(&x, expected, "mpi_shift_l shifts");
}

void AddOrSubtract(FuzzedDataProvider& input) {
  Number a, b, other;
  Fill(input, a);
  Fill(input, b);
  Fill(input, other);
  const mpi* const second = input.ConsumeBool() ? &b : &a;
  mpi* const results[] = {&other, &a, &b};
  mpi* const x = input.PickValueInArray(results);

  Expected abs_a(&a), abs_b(second), expected, before(x);
  mpz_abs(abs_a.get(), abs_a.get());
  mpz_abs(abs_b.get(), abs_b.get());
  if (input.ConsumeBool()) {
    mpz_add(expected.get(), abs_a.get(), abs_b.get());
    Require(mpi_add_abs(x, &a, second) == 0, "mpi_add_abs succeeds");
  } else if (mpz_cmp(abs_a.get(), abs_b.get()) < 0) {
    Require(mpi_sub_abs(x, &a, second) == 16, "mpi_sub_abs refuses a negative result");
    RequireEqual(x, before, "a refused mpi_sub_abs changes nothing");
    return;
  } else {
    mpz_sub(expected.get(), abs_a.get(), abs_b.get());
    Require(mpi_sub_abs(x, &a, second) == 0, "mpi_sub_abs succeeds");
  }
  RequireEqual(x, expected, "the sum or difference equals the one that GMP computes");
  Require(x->s == 1, "the sign of the result is +1");
}

void MultiplyByLimb(FuzzedDataProvider& input) {
  Number a, other;
  Fill(input, a);
  Fill(input, other);
  const auto limb = input.ConsumeIntegral<uint32_t>();
  mpi* const x = input.ConsumeBool() ? &other : &a;
  Expected expected(&a);
  mpz_mul_ui(expected.get(), expected.get(), limb);
  Require(mpi_mul_int(x, &a, limb) == 0, "mpi_mul_int succeeds");
  RequireEqual(x, expected, "mpi_mul_int multiplies");
}

void MultiplyAndAdd(FuzzedDataProvider& input) {
  std::vector<uint32_t> s = Limbs(input, 40);
  if (s.empty()) s.push_back(0);
  const auto b = input.ConsumeIntegral<uint32_t>();
  // d has one limb more than the sum can need.
  Number d;
  std::vector<uint32_t> sum = Limbs(input, s.size());
  sum.resize(s.size() + 2);
  d.Set(sum, 1);
  Number factor;
  factor.Set(s, 1);
  Expected expected(&d), product(&factor);
  mpz_addmul_ui(expected.get(), product.get(), b);
  mpi_mul_hlp(static_cast<int>(s.size()), s.data(), d.p, b);
  RequireEqual(&d, expected, "mpi_mul_hlp multiplies and adds");
}

void Remainder(FuzzedDataProvider& input) {
  Number a, b, other;
  Fill(input, a);
  Fill(input, b, false);
  mpi* const r = input.ConsumeBool() ? &other : &a;
  Expected divisor(&b), expected(&a);
  if (mpz_sgn(divisor.get()) == 0) {
    Require(mpi_mod_mpi(r, &a, &b) == 18, "mpi_mod_mpi refuses zero");
    return;
  }
  mpz_mod(expected.get(), expected.get(), divisor.get());
  Require(mpi_mod_mpi(r, &a, &b) == 0, "mpi_mod_mpi succeeds");
  RequireEqual(r, expected, "mpi_mod_mpi computes the same remainder as GMP");
}

// Sets `number` to the value of `limbs` modulo `m`. `number` then has at least `room` limbs.
void SetBelow(Number& number, std::vector<uint32_t> limbs, Expected& m, size_t room) {
  Number whole;
  whole.Set(limbs, 1);
  Expected value(&whole);
  mpz_mod(value.get(), value.get(), m.get());
  limbs.assign(std::max(room, limbs.size()), 0);
  size_t count = 0;
  mpz_export(limbs.data(), &count, -1, sizeof(uint32_t), 0, 0, value.get());
  limbs.resize(std::max(room, count));
  number.Set(limbs, 1);
}

void MontgomeryProduct(FuzzedDataProvider& input) {
  std::vector<uint32_t> modulus = Limbs(input, 40);
  if (modulus.empty()) modulus.push_back(3);
  modulus.front() |= 1;
  if (modulus.back() == 0) modulus.back() = 1;
  const size_t n = modulus.size();
  Number a, b, m, t;
  m.Set(modulus, 1);
  Expected expected_m(&m);

  // The operands are below the modulus. The first operand has the extra limb that the product
  // needs.
  SetBelow(a, Limbs(input, n), expected_m, n + 1);
  SetBelow(b, Limbs(input, n), expected_m, input.ConsumeBool() ? n + 1 : 1);
  t.Set(std::vector<uint32_t>(2 * (n + 1), 0x5a5a5a5a), 1);

  uint32_t inverse = 1;  // of modulus[0]; each step doubles the number of correct low bits
  for (int step = 0; step < 5; ++step) inverse *= 2 - modulus[0] * inverse;
  Expected expected(&a), factor(&b), radix;
  mpz_mul(expected.get(), expected.get(), factor.get());
  mpz_setbit(radix.get(), static_cast<mp_bitcnt_t>(32 * n));
  if (mpz_cmp_ui(expected_m.get(), 1) == 0) return;
  mpz_invert(radix.get(), radix.get(), expected_m.get());
  mpz_mul(expected.get(), expected.get(), radix.get());
  mpz_mod(expected.get(), expected.get(), expected_m.get());

  mpi_montmul(&a, &b, &m, 0 - inverse, &t);
  RequireEqual(&a, expected, "mpi_montmul multiplies");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  constexpr void (*kOperations[])(FuzzedDataProvider&) = {
      Shift, AddOrSubtract, MultiplyByLimb, MultiplyAndAdd, Remainder, MontgomeryProduct};
  FuzzedDataProvider input(data, size);
  input.PickValueInArray(kOperations)(input);
  return 0;
}
