// The one function that the closed process-authentication library `libzu` exports to the tool.
#pragma once

#include <cstddef>

// Registers `length` bytes at `data` under `name` (NUL-terminated) for the open file `fd`. The
// caller still owns the arguments. IsZuSuccess interprets the result.
extern "C" int ZuNewCertificate(int fd, const char* name, const unsigned char* data, size_t length);

// Two results mean success. Every other result is a failure.
constexpr bool IsZuSuccess(int result) { return result == 0 || result == 0x10004; }
