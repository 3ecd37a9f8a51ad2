#include "crypto/mpi.h"

#include <algorithm>
#include <climits>
#include <cstdarg>
#include <cstdlib>
#include <cstring>
#include <utility>

#include "crypto/wrapping.h"

// Deliberate: limbs have 32 bits, and this source code computes every sum and product of limbs in
// 32 bits, even for 64-bit processors. It multiplies half limbs, so the compiler needs no
// double-width type. The object code for the device has no wider multiplication either
// (scripts/check android checks this). A compiler for another processor can choose a wider
// multiplication. For example, gcc for x86-64 chooses one for a vector of half limbs.

namespace {

constexpr int kLimbBytes = kMpiLimbBits / 8;

void release_limbs(mpi* X);
void clear_limbs(mpi* X);
int used_limbs(const mpi* X);
int sign_of(const mpi* X);
int compare_limbs(int count, const uint32_t* a, const uint32_t* b);
uint32_t add_limbs(int count, const uint32_t* s, uint32_t* d);
uint32_t subtract_limbs(int count, const uint32_t* s, uint32_t* d);
void subtract_with_borrow(int count, const uint32_t* s, uint32_t* d);
template <int kCount>
WRAPS_ON_PURPOSE uint32_t multiply_add(const uint32_t* s, uint32_t* d, uint32_t b, uint32_t c);
int reduce(mpi* X, const mpi* B);
uint32_t quotient_digit(const mpi* X, int i, const mpi* Y, int t);
uint32_t estimate_digit(uint32_t high, uint32_t low, uint32_t d);
uint32_t half_digit(uint32_t* rest, uint32_t next, uint32_t d);
void shift_r(mpi* X, int count);

}  // namespace

void mpi_init(mpi* X, ...) {
  va_list rest;
  va_start(rest, X);
  for (; X != nullptr; X = va_arg(rest, mpi*)) *X = {1, 0, nullptr};
  va_end(rest);
}

void mpi_free(mpi* X, ...) {
  va_list rest;
  va_start(rest, X);
  for (; X != nullptr; X = va_arg(rest, mpi*)) {
    release_limbs(X);
    *X = {1, 0, nullptr};
  }
  va_end(rest);
}

int mpi_grow(mpi* X, int nblimbs) {
  if (X->n >= nblimbs) return 0;
  const size_t old_size = static_cast<size_t>(X->n) * kLimbBytes;
  const size_t size = static_cast<size_t>(nblimbs) * kLimbBytes;
  uint32_t* const p = static_cast<uint32_t*>(malloc(size));
  if (p == nullptr) return kMpiNoMemory;
  if (X->n > 0) memcpy(p, X->p, old_size);
  memset(p + X->n, 0, size - old_size);
  release_limbs(X);
  X->n = nblimbs;
  X->p = p;
  return 0;
}

int mpi_assign(mpi* X, const mpi* A) {
  if (X == A) return 0;
  const int used = used_limbs(A);
  if (const int result = mpi_grow(X, used)) return result;
  clear_limbs(X);
  for (int i = 0; i < used; ++i) X->p[i] = A->p[i];
  X->s = A->s;
  return 0;
}

int mpi_from_bytes(mpi* X, const uint8_t* bytes, size_t len) {
  for (; len > 0 && *bytes == 0; --len) ++bytes;
  const size_t limbs = len / kLimbBytes + (len % kLimbBytes != 0 ? 1 : 0);
  if (const int result = mpi_grow(X, std::max(1, static_cast<int>(limbs)))) return result;
  clear_limbs(X);
  X->s = 1;
  for (size_t i = 0; i < len; ++i)
    X->p[i / kLimbBytes] |= uint32_t{bytes[len - 1 - i]} << (8 * (i % kLimbBytes));
  return 0;
}

int mpi_to_bytes(const mpi* X, uint8_t* bytes, size_t len) {
  const int bits = mpi_msb(X);
  const size_t used = (static_cast<size_t>(bits) + 7) / 8;
  if (used > len) return kMpiBufferTooSmall;
  for (size_t i = 0; i < len; ++i) {
    const uint32_t limb = i < used ? X->p[i / kLimbBytes] : 0;
    bytes[len - 1 - i] = static_cast<uint8_t>(limb >> (8 * (i % kLimbBytes)));
  }
  return 0;
}

int mpi_msb(const mpi* X) {
  const int used = used_limbs(X);
  return used == 0 ? 0 : used * kMpiLimbBits - __builtin_clz(X->p[used - 1]);
}

int mpi_compare_abs(const mpi* A, const mpi* B) {
  const int used = used_limbs(A);
  const int difference = used - used_limbs(B);
  return difference != 0 ? difference : compare_limbs(used, A->p, B->p);
}

int mpi_compare(const mpi* A, const mpi* B) {
  const int difference = sign_of(A) - sign_of(B);
  if (difference != 0) return difference;
  return sign_of(A) < 0 ? mpi_compare_abs(B, A) : mpi_compare_abs(A, B);
}

int mpi_shift_l(mpi* X, int count) {
  if (count < 0) return 0;
  const int bits = mpi_msb(X);
  if (count > INT_MAX - bits) return kMpiNoMemory;
  const int length = bits + count;
  const int limbs = length / kMpiLimbBits + (length % kMpiLimbBits != 0 ? 1 : 0);
  if (const int result = mpi_grow(X, limbs)) return result;
  const int v = count / kMpiLimbBits;
  for (int i = X->n - 1; i >= v; --i) X->p[i] = X->p[i - v];
  for (int i = 0; i < v; ++i) X->p[i] = 0;
  const int t = count % kMpiLimbBits;
  if (t == 0) return 0;
  uint32_t carry = 0;
  for (int i = v; i < X->n; ++i) {
    const uint32_t limb = X->p[i];
    X->p[i] = (limb << t) | carry;
    carry = limb >> (kMpiLimbBits - t);
  }
  return 0;
}

WRAPS_ON_PURPOSE int mpi_add_abs(mpi* X, const mpi* A, const mpi* B) {
  if (X == B) std::swap(A, B);
  const int used = used_limbs(B);
  if (const int result = mpi_assign(X, A)) return result;
  if (const int result = mpi_grow(X, used)) return result;
  X->s = 1;
  uint32_t carry = add_limbs(used, B->p, X->p);
  for (int i = used; carry != 0; ++i) {
    if (const int result = mpi_grow(X, i + 1)) return result;
    X->p[i] += carry;
    carry = X->p[i] < carry;
  }
  return 0;
}

int mpi_sub_abs(mpi* X, const mpi* A, const mpi* B) {
  if (mpi_compare_abs(A, B) < 0) return kMpiNegativeResult;
  mpi_local copy;
  if (X == B) {
    if (const int result = mpi_assign(&copy, B)) return result;
    B = &copy;
  }
  if (const int result = mpi_assign(X, A)) return result;
  X->s = 1;
  subtract_with_borrow(used_limbs(B), B->p, X->p);
  return 0;
}

int mpi_mul_int(mpi* X, const mpi* A, unsigned int b) {
  mpi_local copy;
  if (X == A) {
    if (const int result = mpi_assign(&copy, A)) return result;
    A = &copy;
  }
  const int used = used_limbs(A);
  if (const int result = mpi_grow(X, std::max(1, b != 0 ? used + 1 : used))) return result;
  clear_limbs(X);
  if (b != 0) mpi_mul_hlp(used, A->p, X->p, b);
  X->s = A->s;
  return 0;
}

// An exponentiation spends nearly all of its time here. The loop is therefore unrolled over 16 and
// over 8 limbs, which saves 1 to 3 % of that time.
WRAPS_ON_PURPOSE void mpi_mul_hlp(int count, const unsigned int* s, unsigned int* d,
                                  unsigned int b) {
  uint32_t c = 0;
  for (; count >= 16; count -= 16, s += 16, d += 16) c = multiply_add<16>(s, d, b, c);
  for (; count >= 8; count -= 8, s += 8, d += 8) c = multiply_add<8>(s, d, b, c);
  for (; count > 0; --count, ++s, ++d) c = multiply_add<1>(s, d, b, c);
  for (; c != 0; ++d) c = (*d += c) < c;
}

int mpi_mod_mpi(mpi* R, const mpi* A, const mpi* B) {
  if (used_limbs(B) == 0) return kMpiDivisionByZero;
  mpi_local X;
  if (const int result = mpi_assign(&X, A)) return result;
  if (mpi_compare_abs(&X, B) >= 0) {
    if (const int result = reduce(&X, B)) return result;
  }
  // The magnitude of X is now below abs(B), so adding abs(B) once makes a negative remainder
  // positive.
  if (sign_of(&X) < 0) {
    if (const int result = mpi_sub_abs(&X, B, &X)) return result;
  }
  X.s = 1;
  return mpi_assign(R, &X);
}

WRAPS_ON_PURPOSE void mpi_montmul(mpi* A, const mpi* B, const mpi* N, unsigned int mm, mpi* T) {
  clear_limbs(T);
  const int n = N->n;
  const int m = std::min(B->n, n);
  uint32_t* d = T->p;
  for (int i = 0; i < n; ++i) {
    const uint32_t u0 = A->p[i];
    const uint32_t u1 = (d[0] + u0 * B->p[0]) * mm;
    mpi_mul_hlp(m, B->p, d, u0);
    mpi_mul_hlp(n, N->p, d, u1);
    // The choice of u1 made this limb of T zero. The limb is not part of the result, so storing u0
    // in it does not change the result.
    *d++ = u0;
  }
  for (int i = 0; i <= n; ++i) A->p[i] = d[i];

  // Deliberate: n limbs are subtracted even if the product, now in A, is below N. The time is then
  // about the same for all products. If the product is below N, A is subtracted from T, and the
  // difference is not used. From index n on, T is a copy of A. A borrow ends in this copy, so the
  // subtraction writes nothing beyond T.
  if (mpi_compare_abs(A, N) >= 0) {
    subtract_with_borrow(n, N->p, A->p);
  } else {
    subtract_with_borrow(n, A->p, T->p);
  }
}

namespace {

// Wipes and frees the limbs of X. X still points at them afterwards.
void release_limbs(mpi* X) {
  clear_limbs(X);
  // A compiler could drop the zeros of clear_limbs, because the memory is about to be freed. With
  // the empty assembly, the compiler must store the zeros, because the assembly might read them. No
  // test can check this, because gcc 12 and clang 14 store the zeros even without the assembly.
  __asm__ __volatile__("" : : "r"(X->p) : "memory");
  free(X->p);
}

void clear_limbs(mpi* X) {
  if (X->n > 0) memset(X->p, 0, static_cast<size_t>(X->n) * kLimbBytes);
}

// The number of limbs of X without the zero limbs at its top.
int used_limbs(const mpi* X) {
  int used = X->n;
  while (used > 0 && X->p[used - 1] == 0) --used;
  return used;
}

// Returns -1, 0 or +1 for X below, equal to or above zero.
int sign_of(const mpi* X) { return used_limbs(X) == 0 ? 0 : X->s; }

int compare_limbs(int count, const uint32_t* a, const uint32_t* b) {
  for (int i = count - 1; i >= 0; --i) {
    if (a[i] != b[i]) return a[i] < b[i] ? -1 : 1;
  }
  return 0;
}

// Adds `count` limbs of s to d, which may be s; returns the carry.
WRAPS_ON_PURPOSE uint32_t add_limbs(int count, const uint32_t* s, uint32_t* d) {
  uint32_t carry = 0;
  for (int i = 0; i < count; ++i) {
    const uint32_t addend = s[i];
    uint32_t sum = d[i] + carry;
    carry = sum < carry;
    sum += addend;
    carry += sum < addend;
    d[i] = sum;
  }
  return carry;
}

// Subtracts `count` limbs of s from d; returns the borrow.
WRAPS_ON_PURPOSE uint32_t subtract_limbs(int count, const uint32_t* s, uint32_t* d) {
  uint32_t borrow = 0;
  for (int i = 0; i < count; ++i) {
    const uint32_t minuend = d[i] - borrow;
    borrow = d[i] < borrow;
    borrow += minuend < s[i];
    d[i] = minuend - s[i];
  }
  return borrow;
}

// Like subtract_limbs, but then subtracts the borrow from the higher limbs of d. One of these limbs
// must absorb the borrow.
WRAPS_ON_PURPOSE void subtract_with_borrow(int count, const uint32_t* s, uint32_t* d) {
  uint32_t borrow = subtract_limbs(count, s, d);
  for (int i = count; borrow != 0; ++i) borrow = d[i]-- == 0;
}

// Adds s * b + c to d over `kCount` limbs; returns the carry. A vector has one limb in each lane. A
// product of limbs is the sum of four products of half limbs. Each of the four is computed for all
// lanes at once. The greatest product of half limbs is (2^16 - 1)^2. This product plus two half
// limbs fits in 32 bits, so the sums rx, ry and r1 do not wrap. The sums with c and d may wrap;
// their carries go to c.
template <int kCount>
WRAPS_ON_PURPOSE uint32_t multiply_add(const uint32_t* s, uint32_t* d, uint32_t b, uint32_t c) {
  constexpr int kLanes = std::min(kCount, 4);
  typedef uint32_t lanes __attribute__((vector_size(kLanes * kLimbBytes)));
  const uint32_t b1 = b >> 16;
  const uint32_t b0 = b & 0xFFFF;
#pragma GCC unroll 4
  for (int i = 0; i < kCount; i += kLanes) {
    lanes limbs;
    memcpy(&limbs, s + i, sizeof(limbs));
    const lanes s1 = limbs >> 16;
    const lanes s0 = limbs & 0xFFFF;
    const lanes r0 = s0 * b0;
    const lanes rx = s0 * b1 + (r0 >> 16);
    const lanes ry = s1 * b0 + (rx & 0xFFFF);
    const lanes r1 = s1 * b1 + (rx >> 16) + (ry >> 16);
    const lanes r = ry << 16 | (r0 & 0xFFFF);
    uint32_t low[kLanes], high[kLanes];
    memcpy(low, &r, sizeof(low));
    memcpy(high, &r1, sizeof(high));
#pragma GCC unroll 4
    for (int k = 0; k < kLanes; ++k) {
      low[k] += c;
      c = high[k] + (low[k] < c);
      d[i + k] += low[k];
      c += d[i + k] < low[k];
    }
  }
  return c;
}

// X = abs(X) mod abs(B) with the sign of X, for abs(X) >= abs(B) > 0. Long division with 32-bit
// digits leaves the remainder in place of the dividend and drops the quotient (Knuth, The Art of
// Computer Programming, volume 2, 4.3.1, algorithm D).
WRAPS_ON_PURPOSE int reduce(mpi* X, const mpi* B) {
  mpi_local Y;
  mpi_local product;
  if (const int result = mpi_assign(&Y, B)) return result;
  // Shifts both numbers left until the top limb of the divisor has its highest bit set. The
  // estimate of a quotient digit is then close and never too small.
  const int shift = (kMpiLimbBits - mpi_msb(&Y) % kMpiLimbBits) % kMpiLimbBits;
  if (const int result = mpi_shift_l(&Y, shift)) return result;
  if (const int result = mpi_shift_l(X, shift)) return result;
  const int n = used_limbs(X) - 1;
  const int t = used_limbs(&Y) - 1;
  if (const int result = mpi_grow(&product, t + 2)) return result;

  uint32_t* const top = X->p + (n - t);
  if (compare_limbs(t + 1, top, Y.p) >= 0) subtract_limbs(t + 1, Y.p, top);

  for (int i = n; i > t; --i) {
    const uint32_t q = quotient_digit(X, i, &Y, t);
    if (const int result = mpi_mul_int(&product, &Y, q)) return result;
    uint32_t* const x = X->p + (i - t - 1);
    const bool negative = subtract_limbs(t + 2, product.p, x) != 0;
    if (negative) x[t + 1] += add_limbs(t + 1, Y.p, x);
  }
  shift_r(X, shift);
  return 0;
}

// Returns the quotient digit of X / Y for step i of the loop in `reduce`, or this digit plus one. t
// is the index of Y's top limb.
uint32_t quotient_digit(const mpi* X, int i, const mpi* Y, int t) {
  const uint32_t divisor[2] = {t >= 1 ? Y->p[t - 1] : 0, Y->p[t]};
  const uint32_t dividend[3] = {i >= 2 ? X->p[i - 2] : 0, X->p[i - 1], X->p[i]};
  uint32_t q = estimate_digit(dividend[2], dividend[1], divisor[1]);
  for (;; --q) {
    uint32_t product[3] = {0, 0, 0};
    mpi_mul_hlp(2, divisor, product, q);
    if (compare_limbs(3, product, dividend) <= 0) return q;
  }
}

// Returns (high * 2^32 + low) / d, but at most UINT32_MAX. The highest bit of d must be set.
uint32_t estimate_digit(uint32_t high, uint32_t low, uint32_t d) {
  if (high >= d) return UINT32_MAX;
  uint32_t rest = high;
  const uint32_t q1 = half_digit(&rest, low >> 16, d);
  const uint32_t q0 = half_digit(&rest, low & 0xFFFF, d);
  return (q1 << 16) | q0;
}

// Appends the half limb `next` to `rest`, which is below d, and divides by d. Returns the quotient
// and leaves the remainder in `rest`.
WRAPS_ON_PURPOSE uint32_t half_digit(uint32_t* rest, uint32_t next, uint32_t d) {
  const uint32_t d1 = d >> 16;
  const uint32_t d0 = d & 0xFFFF;
  uint32_t q = *rest / d1;
  uint32_t r = ((*rest - q * d1) << 16) | next;
  const uint32_t m = q * d0;
  for (bool wrapped = false; r < m && !wrapped; --q) {
    r += d;
    wrapped = r < d;
  }
  *rest = r - m;
  return q;
}

// Divides the magnitude of X by 2^count, for a count below 32.
void shift_r(mpi* X, int count) {
  if (count == 0) return;
  uint32_t carry = 0;
  for (int i = X->n - 1; i >= 0; --i) {
    const uint32_t limb = X->p[i];
    X->p[i] = (limb >> count) | carry;
    carry = limb << (kMpiLimbBits - count);
  }
}

}  // namespace
