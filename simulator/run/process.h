// This process: its standard streams, its interruption by a signal, and the time limit for a file.
#pragma once

#include <chrono>

namespace simulator {

// Sees to it that no file of this program's gets the place of a standard stream that was closed.
// Whether there was a standard input; programs that are started from here find it as it was.
// std::cout writes to standard output, and nothing else does: what the tool's own code prints in
// this process goes nowhere. To be called before anything is printed.
bool KeepStandardStreams();

// From here on, an interruption from the keyboard or a request to end does not end the process
// before it has cleaned up.
void CatchInterruptions();
bool IsInterrupted();
// Ends the process by the signal that came, if one came.
void EndIfInterrupted();

// Until when a file may keep the simulator busy.
class Deadline {
 public:
  explicit Deadline(double seconds) : end_(Clock::now() + Seconds(seconds)) {}

  // The time is up, or this process is to end.
  bool HasPassed() const { return Clock::now() >= end_ || IsInterrupted(); }

 private:
  using Clock = std::chrono::steady_clock;
  using Seconds = std::chrono::duration<double>;

  std::chrono::time_point<Clock, Seconds> end_;
};

}  // namespace simulator
