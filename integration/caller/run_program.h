// Starting a program of another's trust: with limits of time and memory, and with nothing of this
// process in it. Plain POSIX, to be copied into the daemon that installs. Nothing is kept between
// calls, nothing is logged, and any thread may call.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

// In bytes. A build may set another, as one with AddressSanitizer must, whose programs need more.
#ifndef APKTOOLKIT_MEMORY_LIMIT
#define APKTOOLKIT_MEMORY_LIMIT (size_t{1} << 30)
#endif

struct RunLimits {
  // Until the program is killed. A package of 100 MB takes a phone some seconds; a kernel whose
  // integrity value does not settle keeps the tool waiting for ever.
  int milliseconds = 120000;
  // The memory that the program may write to (RLIMIT_DATA); 0: as much as this process. The tool
  // needs up to 16 bytes for each byte of the file and of what its entries hold, and ends where
  // there are no more. Not RLIMIT_AS: allocators of newer releases reserve far more addresses than
  // they use.
  size_t memory_bytes = APKTOOLKIT_MEMORY_LIMIT;
};

enum class RunEnd {
  kExited,      // with the status `value`
  kKilled,      // by the signal `value`; SIGABRT is how the tool ends without memory
  kTimedOut,    // and was killed
  kNotStarted,  // the errno is `value`, or 0 where the new process could not become the program
  kLost,        // somebody else in this process waited for it
};

struct RunResult {
  RunEnd end;
  int value;
};

// Runs `command`, a program's path and its arguments, and waits for its end, or kills it at the
// limit. The program has /dev/null for its three standard streams, no other descriptor of this
// process, no blocked signal, and this process's environment and working directory. Hold no lock
// meanwhile. SIGCHLD must not be ignored in this process.
RunResult RunProgram(const std::vector<std::string>& command, const RunLimits& limits);
