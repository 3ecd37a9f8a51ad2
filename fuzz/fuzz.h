// What the fuzz targets share: the way in which an invariant breaks, and what a target needs of its
// input. Each target is one file, <target>_fuzz.cpp, and one program.
#pragma once

#include <fuzzer/FuzzedDataProvider.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

// Ends the run like a memory fault does, when what must hold does not.
inline void Require(bool holds, const char* what) {
  if (holds) return;
  fprintf(stderr, "broken: %s\n", what);
  abort();
}

// Whether the `length` bytes at `part` lie in the `size` bytes at `whole`; a null `part` has none.
inline bool LiesIn(const uint8_t* part, size_t length, const uint8_t* whole, size_t size) {
  if (part == nullptr) return length == 0;
  return part >= whole && part <= whole + size &&
         length <= size - static_cast<size_t>(part - whole);
}
