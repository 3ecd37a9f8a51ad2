// Runs a program of another level of trust, with limits of time and memory and without access to
// this process's state. Plain POSIX, to be copied into the daemon that installs. Keeps no state,
// logs nothing; any thread may call.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

// In bytes. A build may set another value: with AddressSanitizer, programs need more.
#ifndef APKTOOLKIT_MEMORY_LIMIT
#define APKTOOLKIT_MEMORY_LIMIT (size_t{1} << 30)
#endif

struct RunLimits {
  // The program is killed after this time. A package of 100 MB takes a phone some seconds. A kernel
  // whose integrity value never settles keeps the tool waiting for ever.
  // integrity value does not settle keeps the tool waiting for ever.
  int milliseconds = 120000;
  // The memory that the program may write to (RLIMIT_DATA); 0: as much as this process. The tool
  // needs up to 16 bytes for each byte of the file and of its entries' contents, and aborts without
  // them. Not RLIMIT_AS: allocators of newer releases reserve far more addresses than they use.
  size_t memory_bytes = APKTOOLKIT_MEMORY_LIMIT;
};

enum class RunEnd {
  kExited,      // with the status `value`
  kKilled,      // by the signal `value`; without memory the tool ends by SIGABRT
  kTimedOut,    // and then killed
  kNotStarted,  // `value` is the errno, or 0 if the child could not exec the program
  kLost,        // another thread of this process waited for it
};

struct RunResult {
  RunEnd end;
  int value;
};

// Runs `command`, a program's path and its arguments, and waits for its end, or kills it at the
// limit. The program gets /dev/null for its three standard streams, no other descriptor of this
// process and no blocked signal. It keeps this process's environment and working directory. Hold no
// lock meanwhile. SIGCHLD must not be ignored in this process.
RunResult RunProgram(const std::vector<std::string>& command, const RunLimits& limits);
