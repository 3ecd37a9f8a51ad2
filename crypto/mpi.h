// Multi-precision integers, just large enough for the RSA public operation.
#pragma once

#include <cstdint>

struct mpi {
  int32_t s;
  int32_t n;
  uint32_t* p;
};

void mpi_init(mpi* X, ...);
void mpi_free(mpi* X, ...);
int mpi_grow(mpi* X, int nblimbs);
int mpi_msb(const mpi* X);
int mpi_shift_l(mpi* X, int count);
int mpi_add_abs(mpi* X, const mpi* A, const mpi* B);
int mpi_sub_abs(mpi* X, const mpi* A, const mpi* B);
int mpi_mul_int(mpi* X, const mpi* A, unsigned int b);
void mpi_mul_hlp(int count, const unsigned int* s, unsigned int* d, unsigned int b);
int mpi_mod_mpi(mpi* R, const mpi* A, const mpi* B);
void mpi_montmul(mpi* A, const mpi* B, const mpi* N, unsigned int mm, mpi* T);
