// Runs a program with limits of time and memory, and without this process's open descriptors. The
// code uses only the C library and /proc, so that it can be copied into the daemon that installs
// packages. It keeps no state and logs nothing, and any thread may call it.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

// The default of RunLimits::memory_bytes. A build may set another value: with AddressSanitizer,
// programs need more memory.
#ifndef APKTOOLKIT_MEMORY_LIMIT
#define APKTOOLKIT_MEMORY_LIMIT (size_t{1} << 30)
#endif

struct RunLimits {
  // The program is killed after this time. A package of 100 MB takes a phone some seconds. The tool
  // waits forever if its integrity value (/proc/self/integrity/value) stays ffffffff.
  int milliseconds = 120000;
  // The limit, in bytes, of the memory that the program can write to (RLIMIT_DATA). If 0, the
  // program has this process's limit. The tool needs up to 16 bytes for each byte of the file and
  // of its entries' contents, and up to 2 KiB for each byte of AndroidManifest.xml. It aborts if it
  // cannot get this memory. RLIMIT_AS is not used, because allocators of newer Android releases
  // reserve far more addresses than they use.
  size_t memory_bytes = APKTOOLKIT_MEMORY_LIMIT;
};

enum class RunEnd {
  kExited,      // with the status `value`
  kKilled,      // by the signal `value`; if memory runs out, the tool aborts (SIGABRT)
  kTimedOut,    // and then killed
  kNotStarted,  // if no child could be made, `value` is the errno; if the child could not prepare
                // itself or exec the program, `value` is 0
  kLost,        // another thread of this process waited for the child, or SIGCHLD is ignored;
                // `value` is the errno
};

struct RunResult {
  RunEnd end;
  int value;
};

// Runs `command`, a program's path and its arguments. Waits until the program ends, and kills it at
// the time limit. The program gets /dev/null for its three standard streams, and no other
// descriptor of this process. No signal is blocked in the program. The program keeps this process's
// environment and working directory. The caller must not hold a lock during the call, and must not
// ignore SIGCHLD.
RunResult RunProgram(const std::vector<std::string>& command, const RunLimits& limits);
