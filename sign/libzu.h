// The one function that the closed process-authentication library `libzu` exports to the tool.
#pragma once

#include <cstddef>

// Registers `length` bytes at `data` under `name` (NUL-terminated) for the open file `fd`. Borrows
// everything. 0 and 0x10004 mean success, any other value a failure.
extern "C" int ZuNewCertificate(int fd, const char* name, const unsigned char* data, size_t length);
