// The mark of arithmetic that wraps on purpose.
#pragma once

// Says of a function that its unsigned sums and products are meant modulo 2^32 and that it looks
// after the carries itself. scripts/check, which takes an unsigned overflow anywhere else for a
// mistake, leaves the function alone; nothing else changes.
#ifdef __clang__
#define WRAPS_ON_PURPOSE __attribute__((no_sanitize("unsigned-integer-overflow")))
#else
#define WRAPS_ON_PURPOSE
#endif
