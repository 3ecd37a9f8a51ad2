// Tests the tool's command line, the files that the tool does not look at, and a run without a
// simulated phone.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <regex>

#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/namespaces.h"
#include "support/package.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

// A good package with its library.
class CommandLine : public testing::Test {
 protected:
  CommandLine() { MakePackage().WriteTo(apk_); }

  const TempDir directory_;
  const std::string apk_ = directory_ / "base.apk";
  const std::string library_ = directory_.Write("lib/arm64/libfoo.so", ToBytes("\177ELF foo"));
};

void ExpectUsageError(const std::vector<std::string>& arguments) {
  std::vector<std::string> command = {ToolPath()};
  command.insert(command.end(), arguments.begin(), arguments.end());
  const ProcessResult run = RunProcess(command);
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.output, "");
  EXPECT_EQ(run.errors, "");
}

TEST_F(CommandLine, MissingPathIsAUsageError) { ExpectUsageError({}); }

TEST_F(CommandLine, TwoPathsAreAUsageError) { ExpectUsageError({apk_, apk_}); }

TEST_F(CommandLine, MissingFileEndsTheRunSilently) {
  const Simulation run = Simulate(directory_ / "none.apk");

  EXPECT_EQ(run.timeline, Exit(0));
  EXPECT_EQ(run.status, 4);  // the file was not looked at
}

// Root can read any file. In a user namespace of its own, the tool does not have this right.
TEST_F(CommandLine, UnreadableFileEndsTheRunSilently) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  std::filesystem::permissions(apk_, std::filesystem::perms::none);

  const Simulation run = Simulate(apk_, {}, {{"unshare", "-U"}, {}});

  EXPECT_EQ(run.timeline, Exit(0));
  EXPECT_EQ(run.status, 4);  // the file was not looked at
}

TEST_F(CommandLine, FileOnAReadOnlyFileSystemEndsTheRunSilently) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  const TempDir mount_point;
  const std::string apk = mount_point / "base.apk";

  const Simulation run =
      Simulate(apk, {}, {OnItsOwnFileSystem(apk_, mount_point.path(), "ro"), {}});

  EXPECT_EQ(run.timeline, Exit(0));
  EXPECT_EQ(run.status, 4);  // the file was not looked at
}

TEST_F(CommandLine, FileOnAWritableFileSystemIsSigned) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  const TempDir mount_point;
  const std::string apk = mount_point / "base.apk";
  const std::string library = mount_point / "lib/arm64/libfoo.so";

  const Simulation run =
      Simulate(apk, {}, {OnItsOwnFileSystem(apk_, mount_point.path(), "rw"), {}});

  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({Log(6, "Can't open file: " + library + "\n"),
                                   Log(6, "VeltSignJni: File not verified: " + library + "\n")}),
                      PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);  // a missing library is not refused
}

// Returns the log that the workstation's log library printed. Keeps only the letter of the priority
// and the text of each record. Up to API level 29, the library prints the tag before the time.
// Later versions print the tag after the time.
std::string WorkstationLog(const std::string& errors) {
  const std::string when = "[0-9]+-[0-9]+ [0-9:.]+ +[0-9]+ +[0-9]+ ";
  return std::regex_replace(
      errors, std::regex("ApkToolkit ([A-Z]) " + when + "|" + when + "([A-Z]) ApkToolkit: "),
      "$1$2 ");
}

TEST_F(CommandLine, RunWithoutASimulatedPhoneSignsNothing) {
  PackageOptions options;
  options.secure_storage = true;
  MakePackage(options).WriteTo(apk_);
  const std::string not_signed = std::string("E VELT can't sign a file (result=10000, errno 2: ") +
                                 strerror(ENOENT) + ").\n\n";

  const ProcessResult run = RunProcess({ToolPath(), apk_});

  EXPECT_EQ(WorkstationLog(run.errors),
            "I VeltSignJni starts: 3.\n\n"
            "I VeltSignOat: Apk case.\n\n" +
                not_signed +
                "I VeltSignJni finished: 0.\n\n"
                "I VeltSign starts: zip_fd = 3, fd = 3.\n\n"
                "I VeltSignOat: Apk case.\n\n" +
                not_signed +
                "I VeltSign finished: 65536.\n\n"
                "E ZuAddCertificate: ZuNewCertificate failed -1.\n\n");
  EXPECT_EQ(run.output, "");
  EXPECT_EQ(run.status, 0);
}

}  // namespace
