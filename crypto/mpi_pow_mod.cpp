// Modular exponentiation, by Montgomery products and a sliding window.
#include "crypto/mpi.h"
#include "crypto/wrapping.h"

namespace {

// The number of entries in an exponentiation's window table. An index has at most 6 bits.
constexpr int kWindowTableSize = 64;

// The values that all Montgomery products of one exponentiation share.
struct montgomery {
  const mpi* N;
  uint32_t mm;
  mpi_local T;

  // Sets X = A. X then has enough limbs for a Montgomery product.
  int copy(mpi* X, const mpi* A) const;
  void multiply(mpi* A, const mpi* B) { mpi_montmul(A, B, N, mm, &T); }
};

uint32_t montgomery_constant(uint32_t m0);
int window_size(int bits);
int fill_window(mpi_local* W, int w, montgomery* m);
void raise(mpi* X, const mpi* E, const mpi_local* W, int w, montgomery* m);

}  // namespace

int mpi_pow_mod(mpi* X, const mpi* A, const mpi* E, const mpi* N) {
  if (N->n == 0 || N->p[0] % 2 == 0 || N->s < 0) return kMpiBadModulus;
  const int w = window_size(mpi_msb(E));
  montgomery m = {N, montgomery_constant(N->p[0]), {}};
  mpi_local W[kWindowTableSize];
  mpi_local RR;
  mpi_local one;
  if (const int result = mpi_grow(&m.T, 2 * (N->n + 1))) return result;
  if (const int result = mpi_grow(&one, 1)) return result;
  one.p[0] = 1;
  // R is 2^(32 * N.n). A Montgomery product with R^2 mod N converts a number into Montgomery form.
  // A Montgomery product with 1 converts it back.
  if (const int result = mpi_assign(&RR, &one)) return result;
  if (const int result = mpi_shift_l(&RR, 2 * kMpiLimbBits * N->n)) return result;
  if (const int result = mpi_mod_mpi(&RR, &RR, N)) return result;
  if (const int result = mpi_grow(&W[1], N->n + 1)) return result;
  if (const int result = mpi_mod_mpi(&W[1], A, N)) return result;
  m.multiply(&W[1], &RR);
  if (const int result = m.copy(X, &RR)) return result;
  m.multiply(X, &one);
  if (const int result = fill_window(W, w, &m)) return result;
  raise(X, E, W, w, &m);
  m.multiply(X, &one);
  return 0;
}

namespace {

int montgomery::copy(mpi* X, const mpi* A) const {
  const int result = mpi_grow(X, N->n + 1);
  return result != 0 ? result : mpi_assign(X, A);
}

// Returns -1 / m0 mod 2^32 for an odd m0. Starts with the inverse of m0 modulo 2^4. Each Newton
// step then doubles the number of correct bits.
WRAPS_ON_PURPOSE uint32_t montgomery_constant(uint32_t m0) {
  uint32_t x = m0 + ((m0 * 2 + 4) & 8);
  for (int bits = kMpiLimbBits; bits >= 8; bits /= 2) x *= 2 - m0 * x;
  return 0 - x;
}

// Returns the number of bits in a window for an exponent of `bits` bits. A window of w bits needs
// about 2^(w-1) products for the table, and about one product for every w + 1 bits of the exponent.
// The limits below keep the total number of these products small. Deliberate: no window has 2 bits.
// A window of 1 bit needs one product for each set bit of the exponent. Short exponents have few
// set bits in practice, so a window of 2 bits would save no time.
int window_size(int bits) {
  return bits > 671 ? 6 : bits > 239 ? 5 : bits > 79 ? 4 : bits > 23 ? 3 : 1;
}

// Computes the powers W[i] = W[1]^i for 2^(w-1) <= i < 2^w. A full window starts with a set bit, so
// it needs only these powers. The exponent bits after the last full window need only W[1].
int fill_window(mpi_local* W, int w, montgomery* m) {
  const int j = 1 << (w - 1);
  if (const int result = m->copy(&W[j], &W[1])) return result;
  for (int i = 1; i < w; ++i) m->multiply(&W[j], &W[j]);
  for (int i = j + 1; i < 2 * j; ++i) {
    if (const int result = m->copy(&W[i], &W[i - 1])) return result;
    m->multiply(&W[i], &W[1]);
  }
  return 0;
}

// Computes X = W[1]^abs(E), by a sliding window of w bits. Before the call, X must be 1. X (before
// and after the call) and the numbers in W are in Montgomery form.
void raise(mpi* X, const mpi* E, const mpi_local* W, int w, montgomery* m) {
  int nbits = 0;
  int wbits = 0;
  for (int i = mpi_msb(E) - 1; i >= 0; --i) {
    const int bit = static_cast<int>(E->p[i / kMpiLimbBits] >> (i % kMpiLimbBits) & 1);
    if (bit == 0 && nbits == 0) {
      m->multiply(X, X);
      continue;
    }
    ++nbits;
    wbits |= bit << (w - nbits);
    if (nbits < w) continue;
    for (int k = 0; k < w; ++k) m->multiply(X, X);
    m->multiply(X, &W[wbits]);
    nbits = 0;
    wbits = 0;
  }
  // The remaining exponent bits, which are fewer than w.
  for (; nbits > 0; --nbits) {
    m->multiply(X, X);
    wbits <<= 1;
    if ((wbits >> w & 1) != 0) m->multiply(X, &W[1]);
  }
}

}  // namespace
