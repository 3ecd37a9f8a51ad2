// Files opened and read whole, the names behind descriptors, and strings as bytes. Nothing is kept
// between calls; results and filled arguments belong to the caller. Reading alone logs.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <string>
#include <vector>

// True if both states, as fstat tells them, are of one regular file, with equal size, mtime and
// ctime. Not every change of a file's bytes moves these (docs/decisions/the-file-that-was-read.md).
bool IsSameFile(const struct stat& before, const struct stat& after);

// Opens the file at `path` for reading, with `flags` (of open) besides. Returns the descriptor,
// which the caller closes, or -1 with errno set. Never waits for a writer of a FIFO. Waits for the
// holder of a lease on a regular file, whom the kernel gives a limited time
// (/proc/sys/fs/lease-break-time, 45 seconds unless it is changed).
int OpenForReading(const char* path, int flags);

// Reads the regular file at `path` into `out`, which then has exactly the file's size in bytes, and
// tells in `state`, unless it is null, what fstat said of it before a byte was read. An `fd` other
// than -1 is the file itself, read from its start; `path` is then for the message alone. Returns
// false, with `out` and `state` untouched, if the file
//   - cannot be opened (OpenForReading): "Can't open file: %s\n", or
//   - has no size that can be found, is not a regular file, or is larger than can be had in memory:
//     "Can't read file: %s (streamoff=%zd)\n" with -1 for the size.
// A file that gives fewer bytes than its size is still true; the rest of `out` is what growing it
// made it: zeros where it was shorter before, what it held where it was not. An empty `out` gives
// its memory back before it gets more, so that growing copies nothing and never holds two.
bool ReadFile(const std::string& path, std::vector<uint8_t>& out, struct stat* state = nullptr,
              int fd = -1);

// The path of the file that `fd` is open on, as the kernel tells it, cut to its first 4095 bytes;
// empty when `fd` is not open or the kernel has no path to tell.
std::string GetFilenameByFd(int fd);

// The bytes of `s` in order, without a terminating NUL.
std::vector<uint8_t> StringToVector(const std::string& s);
