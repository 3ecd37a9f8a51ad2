#include <fcntl.h>
#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/phone/probe_run.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

std::string Refusal(int error) { return "-1 " + std::to_string(error); }

const std::string kSuccess = "0 77";  // result 0; errno is still 77, which the probe set

Json SignEvent(int fd, const std::string& path, const std::string& payload, int error) {
  return {{"event", "sign"},          {"fd", fd},      {"path", path}, {"payload", payload},
          {"result", error ? -1 : 0}, {"errno", error}};
}

Json VerifyEvent(int fd, const std::string& path, int error) {
  return {{"event", "verify"},
          {"fd", fd},
          {"path", path},
          {"result", error ? -1 : 0},
          {"errno", error}};
}

}  // namespace

TEST(KernelSign, SucceedsAndLeavesErrnoAlone) {
  const Probe probe({"sign 3 0200abcd", "sign64 3 0000"});
  const ProbeRun run = probe.Run();
  EXPECT_EQ(run.results, Lines({kSuccess, kSuccess}));
  EXPECT_EQ(OfKind(run.events, "sign"),
            std::vector<Json>({SignEvent(3, probe.path(), "0200abcd", 0),
                               SignEvent(3, probe.path(), "0000", 0)}));
}

TEST(KernelSign, ReadsAsManyBytesAsTheLengthSays) {
  const Probe probe({"sign 3 0100abcdef"});
  EXPECT_EQ(OfKind(probe.Run().events, "sign"),
            std::vector<Json>({SignEvent(3, probe.path(), "0100ab", 0)}));
}

TEST(KernelSign, AcceptsTheLongestPayload) {
  std::string payload = "ffff";
  for (int i = 0; i < 0xffff; ++i) payload += "5a";
  const Probe probe({"sign 3 " + payload});
  EXPECT_EQ(OfKind(probe.Run().events, "sign"),
            std::vector<Json>({SignEvent(3, probe.path(), payload, 0)}));
}

TEST(KernelSign, ClosedDescriptorIsEbadf) {
  const ProbeRun run = Probe({"sign 700 0000", "sign64 -1 0000"}).Run();
  EXPECT_EQ(run.results, Lines({Refusal(EBADF), Refusal(EBADF)}));
  EXPECT_EQ(OfKind(run.events, "sign"),
            std::vector<Json>({SignEvent(700, "", "", EBADF), SignEvent(-1, "", "", EBADF)}));
}

TEST(KernelSign, DescriptorThatOnlyNamesAFileIsEbadf) {
  EXPECT_EQ(Probe({"name /", "sign 5 0000", "verify 5"}).Run().results,
            Lines({"5 77", Refusal(EBADF), Refusal(EBADF)}));
}

TEST(KernelSign, UnreadablePayloadIsEfault) {
  const Probe probe({"sign 3 null", "sign 3 wild", "sign 3 cut"});
  const ProbeRun run = probe.Run();
  EXPECT_EQ(run.results, Lines({Refusal(EFAULT), Refusal(EFAULT), Refusal(EFAULT)}));
  EXPECT_EQ(OfKind(run.events, "sign"),
            std::vector<Json>(3, SignEvent(3, probe.path(), "", EFAULT)));
}

TEST(KernelSign, ClosedDescriptorComesBeforeUnreadablePayload) {
  EXPECT_EQ(Probe({"sign 700 null"}).Run().results, Lines({Refusal(EBADF)}));
}

TEST(KernelSign, RefusesWithTheErrorOfThePhone) {
  const Probe probe({"sign 3 0100ab", "sign 3 null", "sign 700 0000"});
  const ProbeRun run = probe.Run({"--sign-errno", "EACCES"});
  EXPECT_EQ(run.results, Lines({Refusal(EACCES), Refusal(EFAULT), Refusal(EBADF)}));
  EXPECT_EQ(OfKind(run.events, "sign")[0], SignEvent(3, probe.path(), "0100ab", EACCES));
}

TEST(KernelVerify, FileThatIsNotTrustedIsEnokey) {
  const Probe probe({"verify 3", "verify64 3"});
  const ProbeRun run = probe.Run();
  EXPECT_EQ(run.results, Lines({Refusal(ENOKEY), Refusal(ENOKEY)}));
  EXPECT_EQ(OfKind(run.events, "verify"),
            std::vector<Json>(2, VerifyEvent(3, probe.path(), ENOKEY)));
}

TEST(KernelVerify, TrustedFileIsTrustedUnderAnyName) {
  const Probe probe({"verify 3", "verify64 3"});
  const std::string other = probe.directory() / "link";
  ASSERT_EQ(link(probe.path().c_str(), other.c_str()), 0);
  const ProbeRun run = probe.Run({"--trust", "/dev/null", "--trust", other});
  EXPECT_EQ(run.errors, "");
  EXPECT_EQ(run.results, Lines({kSuccess, kSuccess}));
  EXPECT_EQ(OfKind(run.events, "verify"), std::vector<Json>(2, VerifyEvent(3, probe.path(), 0)));
}

TEST(KernelVerify, FileThatWasSignedIsTrusted) {
  const Probe probe({"verify 3", "sign 3 0000", "verify 3", "open /", "verify 5"});
  EXPECT_EQ(probe.Run().results,
            Lines({Refusal(ENOKEY), kSuccess, kSuccess, "5 77", Refusal(ENOKEY)}));
}

TEST(KernelVerify, FileWhoseSigningWasRefusedIsNotTrusted) {
  EXPECT_EQ(Probe({"sign 3 0000", "verify 3"}).Run({"--sign-errno", "EPERM"}).results,
            Lines({Refusal(EPERM), Refusal(ENOKEY)}));
}

TEST(KernelVerify, ClosedDescriptorIsEbadf) {
  const ProbeRun run = Probe({"verify 700"}).Run();
  EXPECT_EQ(run.results, Lines({Refusal(EBADF)}));
  EXPECT_EQ(OfKind(run.events, "verify"), std::vector<Json>({VerifyEvent(700, "", EBADF)}));
}

TEST(KernelVerify, RefusesWithTheErrorOfThePhone) {
  EXPECT_EQ(Probe({"verify 3"}).Run({"--verify-errno", "EKEYREJECTED"}).results,
            Lines({Refusal(EKEYREJECTED)}));
}

TEST(KernelFcntl, OtherCommandsGoToTheRealKernel) {
  // The commands of the file-integrity feature are 1124 and 1125. The real kernel does not know the
  // commands 1123, 1126 and 99999, but knows the F_ commands. Descriptor 700 is not open.
  const Lines commands = {"fcntl 3 1123 0",
                          "fcntl 3 1126 0",
                          "fcntl64 3 1123 0",
                          "fcntl64 3 99999 0",
                          "fcntl 700 1126 0",
                          "fcntl 3 " + std::to_string(F_GETFD) + " 0",
                          "fcntl 3 " + std::to_string(F_DUPFD) + " 40",
                          "fcntl64 3 " + std::to_string(F_DUPFD_CLOEXEC) + " 50",
                          "fcntl64 50 " + std::to_string(F_GETFD) + " 0"};
  const ProbeRun run = Probe(commands).Run();
  // An emulator checks the command before the descriptor.
  const std::string not_open = Refusal(AreProgramsEmulated() ? EINVAL : EBADF);
  EXPECT_EQ(run.results, Lines({Refusal(EINVAL), Refusal(EINVAL), Refusal(EINVAL), Refusal(EINVAL),
                                not_open, "0 77", "40 77", "50 77", "1 77"}));
  EXPECT_EQ(run.events.size(), 1U);  // the event "exit"
}

TEST(KernelStandIn, HidesItsDescriptorsFromTheTool) {
  const Probe probe({"open /", "sign 3 0000", "register 3 name ab", "log 4 tag 61",
                     "fopen /proc/self/integrity/value r", "open /", "inherited"});
  const ProbeRun run = probe.Run();
  ASSERT_EQ(run.results.size(), 7U);
  // The probe has its script at descriptor 3 and its results at descriptor 4.
  EXPECT_EQ(run.results[0], "5 77");
  EXPECT_EQ(run.results[5], "6 77");
  // A program that the tool starts with exec has the same open descriptors as without the
  // simulation.
  const std::string inherited = run.results[6];
  RunProcess({PROBE_COMMAND, probe.path()});
  EXPECT_EQ(inherited, LinesOf(ContentOf(probe.path() + ".out")).back());
}

TEST(KernelStandIn, WorksWithFewDescriptors) {
  if (AreProgramsEmulated()) GTEST_SKIP() << "the emulator needs more descriptors";
  const Probe probe({"sign 3 0000", "register 3 name ab", "open /"});
  Lines command = {"sh", "-c", "ulimit -n 10 && exec \"$@\"", "sh"};
  for (const std::string& word : {SimulatorPath(), std::string("--json"), std::string("--tool"),
                                  std::string(PROBE_PATH), probe.path()}) {
    command.push_back(word);
  }
  const ProcessResult result = RunProcess(command);
  const std::vector<Json> events = ParseJournal(result.output);
  EXPECT_EQ(OfKind(events, "sign").size(), 1U) << result.output << result.errors;
  EXPECT_EQ(OfKind(events, "register").size(), 1U);
  EXPECT_EQ(LinesOf(ContentOf(probe.path() + ".out")), Lines({"fd 3", kSuccess, kSuccess, "5 77"}));
}

TEST(KernelStandIn, RecordsWhenNoDescriptorIsLeft) {
  const ProbeRun run = Probe({"limit 5", "open /", "sign 3 0100ab", "verify 3"}).Run();
  EXPECT_EQ(run.results, Lines({"0 77", Refusal(EMFILE), kSuccess, kSuccess}));
  EXPECT_EQ(OfKind(run.events, "sign").size(), 1U);
}

TEST(KernelStandIn, RemovesThePreloadFromTheEnvironment) {
  EXPECT_EQ(Probe({"has-variable LD_PRELOAD", "has-variable PATH"}).Run().results,
            Lines({"0 77", "1 77"}));
}

TEST(KernelStandIn, WritesNothingToTheStandardStreams) {
  const Probe probe({"sign 3 0000", "verify 3", "log 6 tag 61", "register 3 name ab",
                     "fopen /proc/self/integrity/value r"});
  const ProcessResult result =
      RunProcess({"env", PRELOAD_KERNEL, "APKTOOLKIT_SIM_JOURNAL=" + probe.directory() / "journal",
                  PROBE_COMMAND, probe.path()});
  EXPECT_EQ(result.output, "");
  EXPECT_EQ(result.errors, "");
}

TEST(KernelStandIn, LeavesErrnoAloneWhenTheJournalIsFull) {
  const Probe probe({"sign 3 0000", "log-write 4 tag 61", "register 3 name ab",
                     "fopen /proc/self/integrity/value r"});
  RunProcess(
      {"env", PRELOAD_KERNEL, "APKTOOLKIT_SIM_JOURNAL=/dev/full", PROBE_COMMAND, probe.path()});
  EXPECT_EQ(LinesOf(ContentOf(probe.path() + ".out")),
            Lines({"fd 3", kSuccess, "1 77", kSuccess, "31 77"}));
}
