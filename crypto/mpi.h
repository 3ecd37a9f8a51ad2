// Multi-precision integers for the RSA public operation.
//
// A number is an mpi, and owns its limbs. A limb is a digit of 32 bits. Limbs are allocated by
// malloc, and overwritten with zeros before they are freed or replaced. No argument may be null,
// and no two arguments may be the same number, except where the comment of an operation allows
// this. Operations that allocate return kMpiNoMemory if malloc fails. The number for the result can
// then still be used and freed, but its value may have changed. The functions log nothing.
#pragma once

#include <cstddef>
#include <cstdint>

// A signed integer in sign-magnitude form, shorter than 2^31 bits. The magnitude may have any
// number of zero limbs at its top.
struct mpi {
  int32_t s;    // the sign: +1 or -1; normally +1 if the number is zero
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

// Sets each number to the empty value: sign +1, no limbs. Does not free limbs that a number had
// before. The list ends with a null pointer.
void mpi_init(mpi* X, ...) __attribute__((sentinel));

// Wipes and frees the limbs of each number and sets it to the empty value. Empty numbers are
// allowed. The list ends with a null pointer.
void mpi_free(mpi* X, ...) __attribute__((sentinel));

// Calls `call`, which is mpi_init or mpi_free, for all numbers of a record. A record is a single
// number, or a struct with numbers. Each type of record has an overload. This overload is for a
// single number.
inline void mpi_apply(void (*call)(mpi* X, ...), mpi* X) { call(X, nullptr); }

// Adds a constructor and a destructor to a record. The constructor sets all numbers to the empty
// value. The destructor wipes and frees their limbs.
template <typename Record>
struct mpi_owner : Record {
  mpi_owner() : Record{} { mpi_apply(mpi_init, this); }
  ~mpi_owner() { mpi_apply(mpi_free, this); }
  mpi_owner(const mpi_owner&) = delete;
  mpi_owner& operator=(const mpi_owner&) = delete;
};
using mpi_local = mpi_owner<mpi>;

// Grows X to at least `nblimbs` limbs. New limbs are zero. Never shrinks X. After a failure, X is
// unchanged.
int mpi_grow(mpi* X, int nblimbs);

// X = A. X may be A. Limbs of X that A does not need are kept, and become zero.
int mpi_assign(mpi* X, const mpi* A);

// X = the unsigned big-endian number in the `len` bytes at `bytes`. An empty X gets as many limbs
// as the number needs, but at least one. `bytes` may be null only if `len` is 0.
int mpi_from_bytes(mpi* X, const uint8_t* bytes, size_t len);

// Writes the magnitude of X as exactly `len` bytes, big-endian, with leading zero bytes. Returns
// kMpiBufferTooSmall and writes nothing if the magnitude is longer.
int mpi_to_bytes(const mpi* X, uint8_t* bytes, size_t len);

// The bit length of the magnitude: one more than the index of the highest set bit, 0 for zero.
int mpi_msb(const mpi* X);

// mpi_compare_abs compares the magnitudes of A and B. mpi_compare compares the values of A and B.
// Both return a number below, equal to or above 0 if A is less than, equal to or greater than B.
// Two zeros are equal even if their signs differ.
int mpi_compare_abs(const mpi* A, const mpi* B);
int mpi_compare(const mpi* A, const mpi* B);

// Multiplies the magnitude of X by 2^count and keeps the sign. If needed, X grows to the bit length
// of the product, or to `count` bits if X is zero. A negative count changes nothing. Returns
// kMpiNoMemory, with X unchanged, if the bit length of the result does not fit in an int.
int mpi_shift_l(mpi* X, int count);

// X = abs(A) + abs(B), with sign +1. X may be A, B or both. Verification does not call this
// function. It is the counterpart of mpi_sub_abs, and tests compare both functions with GMP.
int mpi_add_abs(mpi* X, const mpi* A, const mpi* B);

// X = abs(A) - abs(B), with sign +1. X may be A, B or both. Returns kMpiNegativeResult, with X
// unchanged, if abs(A) < abs(B).
int mpi_sub_abs(mpi* X, const mpi* A, const mpi* B);

// X = A * b, with the sign of A. X may be A.
int mpi_mul_int(mpi* X, const mpi* A, unsigned int b);

// Adds s * b to d, over `count` limbs of s. d must have `count` limbs, and also every higher limb
// that the carry reaches. `s` may be null if `count` is 0.
void mpi_mul_hlp(int count, const unsigned int* s, unsigned int* d, unsigned int b);

// R = A mod abs(B), 0 <= R < abs(B), with sign +1. R may be A or B. Returns kMpiDivisionByZero,
// with R unchanged, if B is zero.
int mpi_mod_mpi(mpi* R, const mpi* A, const mpi* B);

// A = A * B / 2^(32 * N.n) mod N, for A and B below N. Signs are neither read nor changed. A may be
// B. N must be odd, and `mm` must be -1 / N mod 2^32. T is scratch space, and its old value does
// not matter. A must have at least N.n + 1 limbs, B at least one, and T at least 2 * (N.n + 1).
void mpi_montmul(mpi* A, const mpi* B, const mpi* N, unsigned int mm, mpi* T);

// X = A^abs(E) mod N, for A >= 0 and N of fewer than 2^25 limbs. N has this limit because the
// calculation uses the number 2^(64 * N.n), and every number must be shorter than 2^31 bits. X may
// be A, but neither E nor N. Returns kMpiBadModulus, with X unchanged, if N is negative or even.
int mpi_pow_mod(mpi* X, const mpi* A, const mpi* E, const mpi* N);
