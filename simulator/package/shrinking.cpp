#include "simulator/package/shrinking.h"

#include <signal.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstdint>

namespace simulator {

namespace {

thread_local volatile sig_atomic_t is_guarded = 0;
thread_local volatile sig_atomic_t has_shrunk = 0;

// Handles SIGBUS. A thread that has a ShrinkGuard may read a page beyond the end of a mapped file.
// This function then maps a page of zeros there, so that the read continues. In all other cases,
// the function restores the default action of SIGBUS. The read that failed is then repeated, and
// ends the process.
void FillPage(int signal, siginfo_t* info, void*) {
  const uintptr_t page_size = static_cast<uintptr_t>(sysconf(_SC_PAGESIZE));
  void* const page =
      reinterpret_cast<void*>(reinterpret_cast<uintptr_t>(info->si_addr) & ~(page_size - 1));
  const bool is_filled =
      is_guarded != 0 && info->si_code == BUS_ADRERR &&
      mmap(page, page_size, PROT_READ, MAP_FIXED | MAP_PRIVATE | MAP_ANONYMOUS, -1, 0) == page;
  if (is_filled) {
    has_shrunk = 1;
  } else {
    ::signal(signal, SIG_DFL);
  }
}

}  // namespace

ShrinkGuard::ShrinkGuard() {
  [[maybe_unused]] static const bool done = [] {
    struct sigaction action = {};
    action.sa_sigaction = FillPage;
    action.sa_flags = SA_SIGINFO;
    return sigaction(SIGBUS, &action, nullptr) == 0;
  }();
  has_shrunk = 0;
  is_guarded = 1;
}

ShrinkGuard::~ShrinkGuard() { is_guarded = 0; }

bool ShrinkGuard::HasShrunk() const { return has_shrunk != 0; }

}  // namespace simulator
