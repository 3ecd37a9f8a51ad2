// Multi-precision integers, just large enough for the RSA public operation.
//
// A number owns its limbs, which come from malloc and are overwritten with zeros before they are
// freed or replaced. Numbers passed in are never null; a number may be several of an operation's
// arguments at once where its comment says so. Operations that allocate return kMpiNoMemory when
// malloc fails and then leave their result in a valid state. Nothing here logs.
#pragma once

#include <cstddef>
#include <cstdint>

// A signed integer in sign-magnitude form. The magnitude may carry any number of zero limbs at its
// top; it is shorter than 2^31 bits.
struct mpi {
  int32_t s;    // the sign: +1 or -1; of a zero normally +1
  int32_t n;    // number of limbs allocated in `p`
  uint32_t* p;  // the magnitude, least significant limb first; null when `n` is 0
};

inline constexpr int kMpiLimbBits = 32;

// Results of the operations; 0 is success.
inline constexpr int kMpiNoMemory = 1;
inline constexpr int kMpiBadModulus = 4;
inline constexpr int kMpiBufferTooSmall = 8;
inline constexpr int kMpiNegativeResult = 16;
inline constexpr int kMpiDivisionByZero = 18;

// Sets each number to the empty value: sign +1, no limbs. Whatever it held before is not freed. The
// list ends with a null pointer.
void mpi_init(mpi* X, ...) __attribute__((sentinel));

// Wipes and frees the limbs of each number and sets it to the empty value. The list ends with a
// null pointer; empty numbers may be in it.
void mpi_free(mpi* X, ...) __attribute__((sentinel));

// Calls mpi_init or mpi_free on the numbers of a record: here, of one that is a number itself.
inline void mpi_apply(void (*call)(mpi* X, ...), mpi* X) { call(X, nullptr); }

// A record whose numbers are empty at first and released when its scope ends.
template <typename Record>
struct mpi_owner : Record {
  mpi_owner() : Record{} { mpi_apply(mpi_init, this); }
  ~mpi_owner() { mpi_apply(mpi_free, this); }
  mpi_owner(const mpi_owner&) = delete;
  mpi_owner& operator=(const mpi_owner&) = delete;
};
using mpi_local = mpi_owner<mpi>;

// Gives X at least `nblimbs` limbs; the new ones are zero. Never shrinks. On failure X is
// unchanged.
int mpi_grow(mpi* X, int nblimbs);

// X = A. X keeps limbs that it has beyond A's, as zeros.
int mpi_assign(mpi* X, const mpi* A);

// X = the unsigned big-endian number in `len` bytes, in no more limbs than it needs if X was empty,
// but at least one. `bytes` may be null only when `len` is 0.
int mpi_from_bytes(mpi* X, const uint8_t* bytes, size_t len);

// Writes the magnitude of X as exactly `len` bytes, big-endian, with leading zero bytes. Returns
// kMpiBufferTooSmall, with nothing written, when it needs more.
int mpi_to_bytes(const mpi* X, uint8_t* bytes, size_t len);

// The bit length of the magnitude: one more than the index of the highest set bit, 0 for zero.
int mpi_msb(const mpi* X);

// Less than, equal to or greater than 0 as A is to B: their magnitudes, and with their signs. Two
// zeros are equal whatever their signs.
int mpi_compare_abs(const mpi* A, const mpi* B);
int mpi_compare(const mpi* A, const mpi* B);

// Multiplies the magnitude of X by 2^count; the sign stays. X grows to the bit length of the
// product, or for a zero to `count` bits, if it has less room. A negative count changes nothing; a
// result that no longer has an int's bit length counts as memory exhausted and leaves X unchanged.
int mpi_shift_l(mpi* X, int count);

// X = abs(A) + abs(B), with sign +1. X may be A, B or both. Verification itself adds no two
// numbers: this is the counterpart of mpi_sub_abs, and tests hold both against GMP.
int mpi_add_abs(mpi* X, const mpi* A, const mpi* B);

// X = abs(A) - abs(B), with sign +1. X may be A, B or both. Returns kMpiNegativeResult, with X
// unchanged, when abs(A) < abs(B).
int mpi_sub_abs(mpi* X, const mpi* A, const mpi* B);

// X = A * b, with the sign of A. X may be A.
int mpi_mul_int(mpi* X, const mpi* A, unsigned int b);

// Adds s * b to d: `count` limbs of s, and in d as many and those that the carry runs into, which
// the caller knows to be there. `s` may be null when `count` is 0.
void mpi_mul_hlp(int count, const unsigned int* s, unsigned int* d, unsigned int b);

// R = A mod abs(B), 0 <= R < abs(B), with sign +1. R may be A or B. Returns kMpiDivisionByZero,
// with R unchanged, when B is zero.
int mpi_mod_mpi(mpi* R, const mpi* A, const mpi* B);

// A = A * B / 2^(32 * N.n) mod N, for A and B below N; the signs are neither looked at nor changed.
// A may be B. N is odd, `mm` is -1 / N mod 2^32 and T is scratch, whose former value is of no
// account. A has at least N.n + 1 limbs, B at least one, T at least 2 * (N.n + 1).
void mpi_montmul(mpi* A, const mpi* B, const mpi* N, unsigned int mm, mpi* T);

// X = A^abs(E) mod N, for A >= 0 and N of fewer than 2^25 limbs. X may be A, but neither E nor N.
// Returns kMpiBadModulus, with X unchanged, when N is negative or even.
int mpi_pow_mod(mpi* X, const mpi* A, const mpi* E, const mpi* N);
