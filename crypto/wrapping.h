// Marks arithmetic that wraps on purpose.
#pragma once

// Declares that a function computes unsigned sums and products modulo 2^32 and handles the carries
// itself. scripts/check fails for an unsigned overflow in any other function. The mark has no other
// effect.
#ifdef __clang__
#define WRAPS_ON_PURPOSE __attribute__((no_sanitize("unsigned-integer-overflow")))
#else
#define WRAPS_ON_PURPOSE
#endif
