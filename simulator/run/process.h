// This process: its standard streams, its interruption by a signal, and the time limit for a file.
#pragma once

#include <spawn.h>

#include <chrono>

namespace simulator {

// Reserves the descriptors of closed standard streams, so that no file of this program gets such a
// descriptor. Returns true if standard input was open before. Programs that this process starts
// find the streams as they were before. After the call, std::cout still writes to standard output,
// but `stdout` writes to /dev/null. The tool's code in this program prints to `stdout`, so its
// lines are discarded. Call this function before anything is printed.
bool KeepStandardStreams();

// After this call, SIGINT, SIGTERM, SIGHUP, SIGQUIT and SIGPIPE do not end the process, but make
// IsInterrupted() true. The process can then clean up and call EndIfInterrupted(). Signals that
// were ignored before are still ignored.
void CatchInterruptions();
bool IsInterrupted();
// If a signal was caught, ends the process by that signal.
void EndIfInterrupted();

// For posix_spawn: the new process gets a process group of its own. A signal from the keyboard goes
// to a whole group, but must reach only this process, which then ends the new process. If the
// signal itself ended the new process, this process would report a failure of the new process.
class OwnProcessGroup {
 public:
  OwnProcessGroup();
  ~OwnProcessGroup() { posix_spawnattr_destroy(&attributes_); }
  OwnProcessGroup(const OwnProcessGroup&) = delete;
  OwnProcessGroup& operator=(const OwnProcessGroup&) = delete;

  const posix_spawnattr_t* get() const { return &attributes_; }

 private:
  posix_spawnattr_t attributes_;
};

// The time limit for the work on one file.
class Deadline {
 public:
  explicit Deadline(double seconds) : end_(Clock::now() + Seconds(seconds)) {}

  // True if the time is up, or this process was interrupted.
  bool HasPassed() const { return Clock::now() >= end_ || IsInterrupted(); }

 private:
  using Clock = std::chrono::steady_clock;
  using Seconds = std::chrono::duration<double>;

  std::chrono::time_point<Clock, Seconds> end_;
};

}  // namespace simulator
