#include "simulator/run/process.h"

#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <cstdio>
#include <initializer_list>
#include <iostream>

namespace simulator {

namespace {

volatile sig_atomic_t caught = 0;

void Catch(int signal) { caught = signal; }

}  // namespace

// /dev/null replaces a closed stream. It is opened read-only, because a write to the closed stream
// must fail. exec closes it, so that started programs find the stream closed, as it was.
bool KeepStandardStreams() {
  const bool has_input = fcntl(STDIN_FILENO, F_GETFD) >= 0;
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
    if (fcntl(stream, F_GETFD) < 0) open("/dev/null", O_RDONLY | O_CLOEXEC);
  }
  // std::cout keeps the present standard output. Output by way of `stdout` goes to /dev/null.
  std::ios::sync_with_stdio(false);
  if (FILE* const nowhere = fopen("/dev/null", "we")) stdout = nowhere;
  return has_input;
}

void CatchInterruptions() {
  struct sigaction action = {};
  action.sa_handler = Catch;
  for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGPIPE}) {
    struct sigaction before = {};
    sigaction(signal, nullptr, &before);
    if (before.sa_handler != SIG_IGN) sigaction(signal, &action, nullptr);
  }
}

OwnProcessGroup::OwnProcessGroup() {
  posix_spawnattr_init(&attributes_);
  posix_spawnattr_setflags(&attributes_, POSIX_SPAWN_SETPGROUP);  // a new group
}

bool IsInterrupted() { return caught != 0; }

void EndIfInterrupted() {
  if (caught == 0) return;
  signal(caught, SIG_DFL);
  raise(caught);
}

}  // namespace simulator
