// Until when a file may keep the simulator busy.
#pragma once

#include <chrono>

#include "simulator/run/process.h"

namespace simulator {

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
