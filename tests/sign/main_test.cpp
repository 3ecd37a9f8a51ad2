// Tests main() itself, not the three steps that it calls (VeltSignJni, VeltSign and ZuSign). The
// tool runs without the simulated phone. The tool's log goes to standard error.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "support/files.h"
#include "support/lease.h"
#include "support/package.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

// Runs the tool by a shell command, which gets the tool as $0 and the file as $1.
ProcessResult RunTool(const std::string& command, const std::string& file) {
  return RunProcess({"sh", "-c", command, ToolPath(), file});
}

bool Says(const ProcessResult& run, const std::string& text) {
  return run.errors.find(text) != std::string::npos;
}

TEST(Main, ProcessesTheFileIfStandardInputIsOpen) {
  const DiskFile file(MakePackage().Build());
  const ProcessResult run = RunTool("\"$0\" \"$1\" </dev/null", file.path());
  EXPECT_EQ(run.status, 0);
  EXPECT_TRUE(Says(run, "VeltSignJni starts: 3.")) << run.errors;
}

// Without standard input, the file gets descriptor 0, which main() refuses.
TEST(Main, IgnoresTheFileIfStandardInputIsClosed) {
  const DiskFile file(MakePackage().Build());
  const ProcessResult run = RunTool("\"$0\" \"$1\" <&-", file.path());
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.output + run.errors, "");
}

TEST(Main, FifoIsRefusedWithoutWaiting) {
  const TempDir directory;
  ASSERT_EQ(mkfifo((directory / "fifo").c_str(), 0600), 0);
  const ProcessResult run = RunTool("timeout 20 \"$0\" \"$1\" </dev/null", directory / "fifo");
  EXPECT_EQ(run.status, 0);
  EXPECT_TRUE(Says(run, "OpenArchiveFd(3) [file: " + directory / "fifo" + "] returned: "))
      << run.errors;
  EXPECT_TRUE(Says(run, "Zip archive is not valid for fd=3")) << run.errors;
}

TEST(Main, LeasedFileIsProcessedAfterTheLeaseIsGivenUp) {
  const DiskFile file(MakePackage(WithLibraries({})).Build());
  const Lease lease(file.path());
  if (!lease.IsHeld())
    GTEST_SKIP() << "the file system of " << file.path() << " does not support leases";
  const ProcessResult run = RunTool("timeout 20 \"$0\" \"$1\" </dev/null", file.path());
  EXPECT_EQ(run.status, 0);
  EXPECT_TRUE(lease.WasGivenUp());
  EXPECT_TRUE(Says(run, "VeltSignJni finished: 0.")) << run.errors;
}

// The parser of the signature block prints a line about the bad block. The line stays in the buffer
// of standard output until the process ends.
TEST(Main, ClosedPipeOnStandardOutputEndsTheRunAfterItsSteps) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.RSA").data = ToBytes("no block");
  const DiskFile file(package.Build());
  const ProcessResult run = RunProcess({"python3", "-c", R"(
import os, signal, subprocess, sys
reader, writer = os.pipe()
os.close(reader)
tool = subprocess.run(sys.argv[1:], stdin=subprocess.DEVNULL, stdout=writer)
sys.exit(tool.returncode != -signal.SIGPIPE))",
                                        ToolPath(), file.path()});
  EXPECT_EQ(run.status, 0) << run.errors;
  EXPECT_TRUE(Says(run, "VeltSign finished: 65536.")) << run.errors;
}

}  // namespace
