#include "util/memory.h"

#include <sys/mman.h>
#include <unistd.h>

bool FitsInMemory(size_t size) {
  if (size == 0) return true;
  const auto pages = static_cast<size_t>(sysconf(_SC_PHYS_PAGES));
  const auto page_size = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  if (size / page_size >= pages) return false;
  void* const trial =
      mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (trial == MAP_FAILED) return false;
  munmap(trial, size);
  return true;
}
