// Marks arithmetic that wraps on purpose.
#pragma once

// Declares that unsigned arithmetic in a function may wrap. The function handles carries itself, or
// needs the wrapped value. scripts/check fails for an unsigned overflow in any other function of
// the tool. The mark has no other effect.
#ifdef __clang__
#define WRAPS_ON_PURPOSE __attribute__((no_sanitize("unsigned-integer-overflow")))
#else
#define WRAPS_ON_PURPOSE
#endif
