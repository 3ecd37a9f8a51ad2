// apktoolkit-verify as a process, in the simulated phone and without it.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <csignal>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/files.h"
#include "support/namespaces.h"
#include "support/package.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

using Words = std::vector<std::string>;

ProcessResult Call(Words command, const Words& more, const std::string& directory = {}) {
  command.insert(command.end(), more.begin(), more.end());
  return RunProcess(command, directory);
}

// The answer of the simulated phone's kernel. `words` are the files and the simulator's options.
ProcessResult Verify(const Words& words) { return Call({SimulatorPath(), "--verify"}, words); }

// The program's answer without a simulation.
ProcessResult VerifyHere(const Words& words, const std::string& directory = {}) {
  return Call({VerifyPath()}, words, directory);
}

void ExpectAnswer(const ProcessResult& run, int status, const std::string& output) {
  EXPECT_EQ(run.output, output);
  EXPECT_EQ(run.errors, "");
  EXPECT_EQ(run.status, status);
}

// A good package with a library beside it, and a phone that remembers the files that its kernel
// signed.
class SignedPackage : public testing::Test {
 protected:
  SignedPackage() {
    PackageOptions options;
    options.entries = {{"classes.dex", ToBytes("dex\n035")},
                       {"lib/arm64-v8a/libfoo.so", ToBytes("\177ELF foo")}};
    MakePackage(options).WriteTo(apk_);
    EXPECT_EQ(Simulate(apk_, {"--state", state_}).status, 0);
  }

  TempDir directory_;
  const std::string apk_ = directory_ / "base.apk";
  const std::string library_ = directory_.Write("lib/arm64/libfoo.so", ToBytes("\177ELF foo"));
  const std::string other_ = directory_.Write("lib/arm64/libbar.so", ToBytes("\177ELF bar"));
  const std::string state_ = directory_ / "state";
};

TEST_F(SignedPackage, IsTrustedWithItsLibrary) {
  ExpectAnswer(Verify({"--state", state_, apk_, library_}), 0,
               apk_ + ": trusted\n" + library_ + ": trusted\n");
}

TEST_F(SignedPackage, IsTrustedButAnUnsignedFileIsNot) {
  ExpectAnswer(Verify({"--state", state_, other_, apk_}), 1,
               other_ + ": not trusted (errno 126, ENOKEY)\n" + apk_ + ": trusted\n");
}

TEST_F(SignedPackage, LibraryIsNotTrustedAfterAByteChanges) {
  directory_.Write("lib/arm64/libfoo.so", ToBytes("\177ELF fop"));
  ExpectAnswer(Verify({"--state", state_, apk_, library_}), 1,
               apk_ + ": trusted\n" + library_ + ": not trusted (errno 126, ENOKEY)\n");
}

// Without --state, the phone does not know the files that the fixture's phone signed.
TEST_F(SignedPackage, IsNotTrustedByAnotherPhone) {
  ExpectAnswer(Verify({apk_}), 1, apk_ + ": not trusted (errno 126, ENOKEY)\n");
}

TEST(Verify, KernelGivesTheReason) {
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  ExpectAnswer(Verify({"--verify-errno", "EKEYREVOKED", file}), 1,
               file + ": not trusted (errno 128, EKEYREVOKED)\n");
  ExpectAnswer(Verify({"--verify-errno", "EKEYREVOKED", "--trust", file, file}), 0,
               file + ": trusted\n");
}

// The kernel is asked once per file. The program does not read the integrity value, and signs
// nothing.
TEST(Verify, AsksTheKernelOnceForAFile) {
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  const ProcessResult run = Verify({"--json", "--trust", file, file});
  std::istringstream lines(run.output);
  std::vector<std::string> events;
  for (std::string line; std::getline(lines, line);) {
    events.push_back(nlohmann::json::parse(line).value("event", ""));
  }
  EXPECT_EQ(events, Words({"journal", "start", "attached", "verify", "stdout", "exit"}));
  EXPECT_EQ(run.status, 0);
}

TEST(Verify, MissingFileCannotBeOpened) {
  const TempDir directory;
  const std::string missing = directory / "missing";
  const std::string below = directory.Write("file", {}) + "/below";
  ExpectAnswer(Verify({missing, below}), 1,
               missing + ": cannot be opened (errno 2, ENOENT)\n" + below +
                   ": cannot be opened (errno 20, ENOTDIR)\n");
}

TEST(Verify, FileWithoutReadPermissionCannotBeOpened) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  ASSERT_EQ(chmod(file.c_str(), 0), 0);
  ExpectAnswer(Call({"unshare", "-U", VerifyPath()}, {file}), 1,
               file + ": cannot be opened (errno 13, EACCES)\n");
}

// A FIFO does not make the program wait. The kernel's answer counts only for a regular file.
TEST(Verify, FileThatIsNotRegularIsNotTrusted) {
  const TempDir directory;
  const std::string fifo = directory / "fifo";
  ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
  ExpectAnswer(
      Verify({"--trust", fifo, "--trust", "/dev/null", fifo, "/dev/null", directory.path()}), 1,
      fifo + ": not trusted (not a regular file)\n" +
          "/dev/null: not trusted (not a regular file)\n" + directory.path() +
          ": not trusted (not a regular file)\n");
}

TEST(Verify, SocketCannotBeOpened) {
  const TempDir directory;
  const std::string path = directory / "socket";
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  path.copy(address.sun_path, sizeof(address.sun_path) - 1);
  const int fd = socket(AF_UNIX, SOCK_STREAM, 0);
  ASSERT_EQ(bind(fd, reinterpret_cast<const sockaddr*>(&address), sizeof(address)), 0);
  ExpectAnswer(VerifyHere({path}), 1, path + ": cannot be opened (errno 6, ENXIO)\n");
  close(fd);
}

// A blocking open would wait for the holder of the lease.
TEST(Verify, FileThatIsLeasedCannotBeOpened) {
  const TempDir directory;
  const std::string path = directory.Write("file", {});
  const int fd = open(path.c_str(), O_RDWR | O_CLOEXEC);
  signal(SIGIO, SIG_IGN);  // the kernel's signal to the holder
  if (fcntl(fd, F_SETLEASE, F_WRLCK) != 0) GTEST_SKIP() << "the file system has no leases";
  ExpectAnswer(VerifyHere({path}), 1, path + ": cannot be opened (errno 11, EAGAIN)\n");
  close(fd);
}

TEST(Verify, LinkIsFollowedToItsFile) {
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  const std::string link = directory / "link";
  ASSERT_EQ(symlink("file", link.c_str()), 0);
  ExpectAnswer(Verify({"--trust", file, link}), 0, link + ": trusted\n");
}

// U+00FC and U+00A0 are not control characters. U+009B and U+0080 are.
TEST(Verify, ControlCharactersInFileNamesAreEscaped) {
  constexpr char kNotAscii[] = "gr\xc3\xbcn \xc2\xa0 \xc2\x9b \xc2\x80 \xff";
  const TempDir directory;
  directory.Write("a\nb: trusted\t\x7f\\\x1b[2J", {});
  directory.Write(kNotAscii, {});
  ExpectAnswer(VerifyHere({"a\nb: trusted\t\x7f\\\x1b[2J", kNotAscii}, directory.path()), 1,
               "a\\x0ab: trusted\\x09\\x7f\\x5c\\x1b[2J: not trusted (errno 22, EINVAL)\n"
               "gr\xc3\xbcn \xc2\xa0 \\xc2\\x9b \\xc2\\x80 \xff: not trusted (errno 22, EINVAL)\n");
}

// The workstation's kernel does not have the file-integrity feature. It refuses the feature's
// unknown fcntl command with EINVAL.
TEST(Verify, KernelWithoutTheFeatureTrustsNoFile) {
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  ExpectAnswer(VerifyHere({file}), 1, file + ": not trusted (errno 22, EINVAL)\n");
}

TEST(VerifyUsage, IsShownWithoutAFileAndForAnOption) {
  const std::string usage =
      "usage: apktoolkit-verify FILE...\n(for a file whose name begins with -, write ./-NAME)\n";
  for (const Words& words : {Words{}, {"--help"}, {"/dev/null", "-x"}, {"-"}}) {
    const ProcessResult run = VerifyHere(words);
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.errors, usage);
    EXPECT_EQ(run.output, "");
  }
  const TempDir directory;
  directory.Write("-x", {});
  EXPECT_EQ(VerifyHere({"./-x"}, directory.path()).output,
            "./-x: not trusted (errno 22, EINVAL)\n");
}

// If the answer cannot be written, the status must not be 0.
TEST(VerifyOutput, IsAFailureIfItCannotBeWritten) {
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  const Words trusting = {SimulatorPath(), "--verify", "--trust", file, file};
  for (const char* stream : {"exec \"$@\" >/dev/full", "exec \"$@\" >&-"}) {
    EXPECT_EQ(Call({"sh", "-c", stream, "sh", VerifyPath()}, {file}).status, 2) << stream;
    EXPECT_EQ(Call({"sh", "-c", stream, "sh"}, trusting).status, 3) << stream;
  }
}

// ---- The simulator's option --verify.

TEST(SimulatorVerify, ExcludesTheOptionsForSigning) {
  for (const std::string option :
       {"--install", "--strict", "--recursive", "--quiet", "--verbose", "--werror", "--html=page",
        "--junit=results", "--sarif=log", "--integrity=1f", "--sign-errno=EPERM", "--zu-result=1",
        "--installer=required", "--api=30"}) {
    const ProcessResult run = Verify({option, "/dev/null"});
    EXPECT_EQ(run.status, 2) << option;
    const bool needs_value = option == "--installer=required";
    const std::string name = needs_value ? option : option.substr(0, option.find('='));
    EXPECT_EQ(run.errors.find(name + " excludes --verify\n"), 0U) << run.errors;
  }
}

}  // namespace
