// bench_run ROUNDS PROGRAM... -- FILE: runs each program ROUNDS times with the argument FILE. The
// programs run in turns (A B C A B C ...), so that other load on the machine affects all of them
// alike. bench_run ends at the first run that fails. After each successful run, bench_run prints a
// line:
//
//   PROGRAM <TAB> wall microseconds <TAB> cpu microseconds <TAB> peak resident kilobytes
//
// The measured peak memory of a program is at least the peak of the process that starts the
// program. bench_run is therefore a small, separate program.
#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>

namespace {

long long Microseconds(const timeval& time) { return time.tv_sec * 1000000LL + time.tv_usec; }

long long Now() {
  timespec now;
  clock_gettime(CLOCK_MONOTONIC, &now);
  return now.tv_sec * 1000000LL + now.tv_nsec / 1000;
}

void Fail(const char* what) {
  fprintf(stderr, "bench_run: %s: %s\n", what, strerror(errno));
  exit(1);
}

// Runs the program once, with its output in /dev/null. Prints the line for this run, or ends
// bench_run with status 1 if the run fails.
void Run(char* program, char* file, const posix_spawn_file_actions_t* silent) {
  char* arguments[] = {program, file, nullptr};
  const long long start = Now();
  pid_t pid;
  errno = posix_spawn(&pid, program, silent, nullptr, arguments, environ);
  if (errno != 0) Fail(program);
  int status;
  rusage usage;
  if (wait4(pid, &status, 0, &usage) != pid) Fail("wait4");
  const long long wall = Now() - start;
  if (status != 0) {
    fprintf(stderr, "bench_run: %s failed with status %x\n", program, status);
    exit(1);
  }
  printf("%s\t%lld\t%lld\t%ld\n", program, wall,
         Microseconds(usage.ru_utime) + Microseconds(usage.ru_stime), usage.ru_maxrss);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 5 || strcmp(argv[argc - 2], "--") != 0) {
    fprintf(stderr, "usage: bench_run ROUNDS PROGRAM... -- FILE\n");
    return 1;
  }
  posix_spawn_file_actions_t silent;
  posix_spawn_file_actions_init(&silent);
  posix_spawn_file_actions_addopen(&silent, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_addopen(&silent, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
  const int rounds = atoi(argv[1]);
  for (int round = 0; round < rounds; ++round) {
    for (int i = 2; i < argc - 2; ++i) Run(argv[i], argv[argc - 1], &silent);
  }
  return 0;
}
