// Marks arithmetic that wraps on purpose.
#pragma once

// Marks a function whose unsigned arithmetic may wrap. The function handles carries itself, or
// needs the wrapped value. The steps `sanitize` and `fuzz` of scripts/check use a build that checks
// for unsigned overflow. In this build, the program ends if unsigned arithmetic wraps in an
// unmarked function of the tool. In all other builds, the mark has no effect.
#ifdef __clang__
#define WRAPS_ON_PURPOSE __attribute__((no_sanitize("unsigned-integer-overflow")))
#else
#define WRAPS_ON_PURPOSE
#endif
