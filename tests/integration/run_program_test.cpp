#include "integration/caller/run_program.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <pthread.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>

#include "support/files.h"
#include "support/simulation.h"

namespace {

// Runs `script` in a shell, and returns how the shell ended. The output goes to `file`, which is $0
// in the script.
RunResult Shell(const std::string& script, const std::string& file = "/dev/null",
                const RunLimits& limits = {}) {
  return RunProgram({"/bin/sh", "-c", "exec >\"$0\"; " + script, file}, limits);
}

// The script's output.
std::string Printed(const std::string& script, const RunLimits& limits = {}) {
  const TempDir directory;
  const RunResult run = Shell(script, directory / "output", limits);
  EXPECT_EQ(run.end, RunEnd::kExited);
  return ContentOf(directory / "output");
}

void Expect(const RunResult& run, RunEnd end, int value) {
  EXPECT_EQ(run.end, end);
  EXPECT_EQ(run.value, value);
}

TEST(RunProgram, ReturnsTheExitStatus) {
  Expect(Shell("exit 0"), RunEnd::kExited, 0);
  Expect(Shell("exit 1"), RunEnd::kExited, 1);
  Expect(RunProgram({"/bin/false"}, {}), RunEnd::kExited, 1);
}

TEST(RunProgram, PassesEachArgument) {
  EXPECT_EQ(Printed("echo \"$#\""), "0\n");
  const TempDir directory;
  const std::string file = directory / "output";
  RunProgram({"/bin/sh", "-c", "printf '%s|' \"$@\" >\"$0\"", file, "a b", "", "*"}, {});
  EXPECT_EQ(ContentOf(file), "a b||*|");
}

TEST(RunProgram, ReturnsTheSignal) {
  Expect(Shell("kill -ABRT $$"), RunEnd::kKilled, SIGABRT);
  Expect(Shell("kill -KILL $$"), RunEnd::kKilled, SIGKILL);
}

TEST(RunProgram, KillsAProgramThatTakesTooLong) {
  RunLimits limits;
  limits.milliseconds = 200;
  const auto start = std::chrono::steady_clock::now();
  Expect(RunProgram({"/bin/sleep", "60"}, limits), RunEnd::kTimedOut, 0);
  const auto taken = std::chrono::steady_clock::now() - start;
  EXPECT_GE(taken, std::chrono::milliseconds(200));
  EXPECT_LT(taken, std::chrono::seconds(5));
  EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1);  // the child process is gone
}

TEST(RunProgram, DoesNotKillAProgramThatEndsInTime) {
  RunLimits limits;
  limits.milliseconds = 20000;
  Expect(RunProgram({"/bin/sleep", "0.3"}, limits), RunEnd::kExited, 0);
}

TEST(RunProgram, MissingOrNonExecutableFileIsNotStarted) {
  Expect(RunProgram({"/nowhere/apktoolkit"}, {}), RunEnd::kNotStarted, 0);
  Expect(RunProgram({"/dev/null"}, {}), RunEnd::kNotStarted, 0);
}

// Returns the files that are open as the standard streams of a shell, one path per line.
std::string Streams() {
  const TempDir directory;
  const std::string file = directory / "output";
  const char script[] =
      "streams=$(readlink /proc/$$/fd/0 /proc/$$/fd/1 /proc/$$/fd/2); echo \"$streams\" >\"$0\"";
  RunProgram({"/bin/sh", "-c", script, file}, {});
  return ContentOf(file);
}

TEST(RunProgram, ProgramHasDevNullStreamsAndNoOtherDescriptors) {
  const int inherited = open("/dev/null", O_RDONLY);  // without O_CLOEXEC
  EXPECT_EQ(Streams(), "/dev/null\n/dev/null\n/dev/null\n");
  EXPECT_EQ(Printed("ls /proc/self/fd"), "0\n1\n2\n3\n");  // 3: the directory that ls reads
  close(inherited);
}

// Lowering the limit does not close the descriptors above it.
TEST(RunProgram, ProgramHasNoDescriptorsAboveTheLimit) {
  const int inherited = fcntl(STDIN_FILENO, F_DUPFD, 100);  // without O_CLOEXEC
  ASSERT_GE(inherited, 100);
  rlimit before = {};
  getrlimit(RLIMIT_NOFILE, &before);
  const rlimit fewer = {static_cast<rlim_t>(inherited), before.rlim_max};
  setrlimit(RLIMIT_NOFILE, &fewer);
  const std::string descriptors = Printed("ls /proc/self/fd");
  setrlimit(RLIMIT_NOFILE, &before);
  close(inherited);
  EXPECT_EQ(descriptors, "0\n1\n2\n3\n");
}

// One system call that reads /proc/self/fd cannot list all of these descriptors.
TEST(RunProgram, ProgramHasNoneOfVeryManyDescriptors) {
  std::vector<int> inherited(500);
  for (int& fd : inherited) fd = dup(STDIN_FILENO);
  EXPECT_EQ(Printed("ls /proc/self/fd"), "0\n1\n2\n3\n");
  for (const int fd : inherited) close(fd);
}

// A daemon may run without standard streams.
TEST(RunProgram, ProgramHasItsStreamsEvenIfThisProcessHasNone) {
  std::string streams;
  {
    const FreeDescriptor input(STDIN_FILENO), output(STDOUT_FILENO), errors(STDERR_FILENO);
    streams = Streams();
  }
  EXPECT_EQ(streams, "/dev/null\n/dev/null\n/dev/null\n");
}

// Runs cp and not a shell, because some shells unblock signals.
TEST(RunProgram, ProgramHasNoBlockedSignals) {
  sigset_t some, before;
  sigemptyset(&some);
  sigaddset(&some, SIGTERM);
  pthread_sigmask(SIG_BLOCK, &some, &before);
  const TempDir directory;
  const std::string file = directory / "status";
  RunProgram({"/bin/cp", "/proc/self/status", file}, {});
  pthread_sigmask(SIG_SETMASK, &before, nullptr);
  EXPECT_NE(ContentOf(file).find("\nSigBlk:\t0000000000000000\n"), std::string::npos);
}

TEST(RunProgram, LimitsWritableMemory) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the emulator limits no memory";
  RunLimits limits;
  limits.memory_bytes = size_t{64} << 20;
  EXPECT_EQ(Printed("ulimit -d", limits), "65536\n");  // in KiB
  limits.memory_bytes = 0;
  rlimit own = {};
  ASSERT_EQ(getrlimit(RLIMIT_DATA, &own), 0);
  EXPECT_EQ(Printed("ulimit -d", limits), own.rlim_cur == RLIM_INFINITY
                                              ? "unlimited\n"
                                              : std::to_string(own.rlim_cur / 1024) + "\n");
}

TEST(RunProgram, ReturnsNotStartedWithoutDescriptors) {
  rlimit before = {};
  getrlimit(RLIMIT_NOFILE, &before);
  const rlimit none = {0, before.rlim_max};
  setrlimit(RLIMIT_NOFILE, &none);
  const RunResult run = RunProgram({"/bin/true"}, {});
  setrlimit(RLIMIT_NOFILE, &before);
  Expect(run, RunEnd::kNotStarted, EMFILE);
}

// While SIGCHLD is ignored, the kernel discards the child's exit status.
TEST(RunProgram, ReturnsLostIfSigchldIsIgnored) {
  const auto before = signal(SIGCHLD, SIG_IGN);
  Expect(RunProgram({"/bin/true"}, {}), RunEnd::kLost, ECHILD);
  signal(SIGCHLD, before);
}

}  // namespace
