// Opens files, reads them whole, and finds their paths. Converts strings to bytes. The functions
// keep no state. The caller owns results and filled arguments. Only ReadFile logs.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <string>
#include <vector>

// True if both states, from stat or fstat, are of the same regular file with equal size, mtime and
// ctime. Some changes of a file's bytes leave the size and both times unchanged
// (docs/decisions/the-file-that-was-read.md).
bool IsSameFile(const struct stat& before, const struct stat& after);

// Opens the file at `path` for reading; `flags` are further flags of open. Returns the descriptor,
// which the caller closes, or -1 with errno set. Never waits for a writer of a FIFO. Waits for the
// holder of a lease on a regular file, for as long as the kernel lets the holder keep it
// (/proc/sys/fs/lease-break-time, 45 seconds by default).
int OpenForReading(const char* path, int flags);

// Reads the regular file at `path` into `out`, which then has exactly the file's size in bytes.
// If `state` is not null, stores there the file's state before the first byte was read. If `fd` is
// not -1, reads the open file `fd` from its start, and uses `path` only in messages. Returns false,
// with `out` and `state` unchanged, if the file
//   - cannot be opened (OpenForReading): "Can't open file: %s\n", or
//   - is not a regular file, has an unknown size, or does not fit in memory:
//     "Can't read file: %s (streamoff=%zd)\n" with -1 for the size.
// Returns true even if fewer bytes can be read than the file's size. The rest of `out` then keeps
// its old bytes. Bytes that `out` did not have before are 0. If `out` is empty and its memory is
// too small, this memory is freed before the new memory is allocated.
bool ReadFile(const std::string& path, std::vector<uint8_t>& out, struct stat* state = nullptr,
              int fd = -1);

// The path of the file that is open as `fd`, as the kernel reports it, cut to its first 4095 bytes.
// Empty if `fd` is not open or the kernel reports no path.
std::string GetFilenameByFd(int fd);

// The bytes of `s` in order, without a terminating NUL.
std::vector<uint8_t> StringToVector(const std::string& s);
