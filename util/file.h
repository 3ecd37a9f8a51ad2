// Whole files in memory, the names behind descriptors, and strings as bytes. Nothing is kept
// between calls; what is returned or filled belongs to the caller. ReadFile alone logs.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <string>
#include <vector>

// Whether two states of regular files, as fstat tells them, are of one file that was not changed
// between them: as far as its size and the times of the last change of its bytes and of its state
// say.
bool IsSameFile(const struct stat& before, const struct stat& after);

// Reads the regular file at `path` into `out`, which then has exactly the file's size in bytes, and
// tells in `state`, unless it is null, what fstat said of it before a byte was read. Does not
// wait for a writer, nor abort for a size that cannot be had, whatever `path` names. False, with
// both untouched, when the file
//   - cannot be opened: "Can't open file: %s\n", or
//   - has no size that can be found, is not a regular file, or is larger than can be had in memory:
//     "Can't read file: %s (streamoff=%zd)\n" with -1 for the size.
// A file that gives fewer bytes than its size is still true; the rest of `out` is what growing it
// made it: zeros where it was shorter before, what it held where it was not.
bool ReadFile(const std::string& path, std::vector<uint8_t>& out, struct stat* state = nullptr);

// The path of the file that `fd` is open on, as the kernel tells it, cut to its first 4095 bytes;
// empty when `fd` is not open or the kernel has no path to tell.
std::string GetFilenameByFd(int fd);

// The bytes of `s` in order, without a terminating NUL.
std::vector<uint8_t> StringToVector(const std::string& s);
