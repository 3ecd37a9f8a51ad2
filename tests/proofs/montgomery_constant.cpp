// Checks the constant of the Montgomery products for every odd limb. Takes a few seconds.
#include <cstdint>
#include <cstdio>

// No header declares montgomery_constant, so its file is included.
#include "crypto/mpi_pow_mod.cpp"

int main() {
  uint32_t m0 = 1;
  do {
    if (m0 * montgomery_constant(m0) != UINT32_MAX) {
      printf("NOT PROVED: montgomery constant: %u\n", m0);
      return 1;
    }
    m0 += 2;
  } while (m0 != 1);
  printf("proved: for each odd limb, montgomery constant is minus the limb's inverse\n");
  return 0;
}
