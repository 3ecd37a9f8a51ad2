// Surviving a mapped file that becomes shorter while it is read. The pages behind its new end have
// no bytes any more, and touching them ends a process by SIGBUS.
#pragma once

namespace simulator {

// While one lives, such a page reads as zeros for the thread that made it. One at a time a thread.
class ShrinkGuard {
 public:
  ShrinkGuard();
  ~ShrinkGuard();
  ShrinkGuard(const ShrinkGuard&) = delete;
  ShrinkGuard& operator=(const ShrinkGuard&) = delete;

  // Whether a page was missing since this object was made.
  bool HasShrunk() const;
};

}  // namespace simulator
