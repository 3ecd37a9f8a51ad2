// Two functions that the fuzz targets share: a way to fail, and a check that bytes are inside other
// bytes. Each target is one program, whose entry point is in <target>_fuzz.cpp.
#pragma once

#include <fuzzer/FuzzedDataProvider.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

// `what` states an invariant. If `holds` is false, prints `what` and ends the process with abort(),
// which libFuzzer reports as a crash.
inline void Require(bool holds, const char* what) {
  if (holds) return;
  fprintf(stderr, "broken: %s\n", what);
  abort();
}

// True if the `length` bytes at `part` lie in the `size` bytes at `whole`. If `part` is null, true
// only if `length` is 0.
inline bool LiesIn(const uint8_t* part, size_t length, const uint8_t* whole, size_t size) {
  if (part == nullptr) return length == 0;
  return part >= whole && part <= whole + size &&
         length <= size - static_cast<size_t>(part - whole);
}
