// Opens files, reads them whole, and finds their paths; turns strings into bytes. The functions
// keep no state. Results and filled arguments belong to the caller. Only ReadFile logs.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <string>
#include <vector>

// True if both states, from fstat, are of the same regular file with equal size, mtime and ctime.
// Not every change of a file's bytes changes these (docs/decisions/the-file-that-was-read.md).
bool IsSameFile(const struct stat& before, const struct stat& after);

// Opens the file at `path` for reading; `flags` are further flags of open. Returns the descriptor,
// which the caller closes, or -1 with errno set. Never waits for a writer of a FIFO. Waits for the
// holder of a lease on a regular file, for as long as the kernel lets the holder keep it
// (/proc/sys/fs/lease-break-time, 45 seconds by default).
int OpenForReading(const char* path, int flags);

// Reads the regular file at `path` into `out`, which then has exactly the file's size in bytes.
// Stores in `state`, unless it is null, the file's state before the first byte was read. An `fd`
// other than -1 is the file itself, read from its start; `path` then only appears in messages.
// Returns false, with `out` and `state` untouched, if the file
//   - cannot be opened (OpenForReading): "Can't open file: %s\n", or
//   - is not a regular file, has an unknown size, or does not fit in memory:
//     "Can't read file: %s (streamoff=%zd)\n" with -1 for the size.
// Returns true even if the file gives fewer bytes than its size. The rest of `out` then holds its
// old bytes, and zeros where it was shorter before. An empty `out` that is too small frees its
// memory before it allocates, so that growing copies nothing and never holds two buffers.
bool ReadFile(const std::string& path, std::vector<uint8_t>& out, struct stat* state = nullptr,
              int fd = -1);

// The path of the file that is open as `fd`, as the kernel gives it, cut to its first 4095 bytes.
// Empty if `fd` is not open or the kernel gives no path.
std::string GetFilenameByFd(int fd);

// The bytes of `s` in order, without a terminating NUL.
std::vector<uint8_t> StringToVector(const std::string& s);
