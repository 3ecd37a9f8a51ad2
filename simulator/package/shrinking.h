// Protects the process from a mapped file that becomes shorter while it is read. The pages beyond
// the new end have no bytes. Without this protection, reading them ends the process with SIGBUS.
#pragma once

namespace simulator {

// While a guard exists, the thread that made it reads zeros from the pages beyond the new end. A
// thread must not have two guards at the same time.
class ShrinkGuard {
 public:
  ShrinkGuard();
  ~ShrinkGuard();
  ShrinkGuard(const ShrinkGuard&) = delete;
  ShrinkGuard& operator=(const ShrinkGuard&) = delete;

  // True if this thread has read a page beyond the new end since the guard was made.
  bool HasShrunk() const;
};

}  // namespace simulator
