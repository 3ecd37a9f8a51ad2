// Marks arithmetic that wraps on purpose.
#pragma once

// Marks a function whose unsigned arithmetic may wrap. The function handles carries itself, or
// needs the wrapped value. An unsigned overflow in any other function of the tool ends the test or
// the fuzz target (scripts/check). The mark has no other effect.
#ifdef __clang__
#define WRAPS_ON_PURPOSE __attribute__((no_sanitize("unsigned-integer-overflow")))
#else
#define WRAPS_ON_PURPOSE
#endif
