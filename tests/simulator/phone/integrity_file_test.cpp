#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/phone/probe_run.h"

namespace {

const std::string kOwn = "/proc/self/integrity/value";
const std::string kHealthy = "31 77";
const std::string kNoFile = "-1 " + std::to_string(ENOENT);

Json IntegrityEvent(int pid, const Json& text) {
  return {{"event", "integrity"}, {"pid", pid}, {"text", text}};
}

}  // namespace

TEST(IntegrityFile, IsOpenedByFopenAndFopen64) {
  const Lines ways = {"fopen " + kOwn + " r", "fopen64 " + kOwn + " re"};
  const ProbeRun run = Probe(ways).Run();
  EXPECT_EQ(run.results, Lines(ways.size(), kHealthy));
  EXPECT_EQ(OfKind(run.events, "integrity"),
            std::vector<Json>(ways.size(), IntegrityEvent(0, "1f")));
}

TEST(IntegrityFile, EachOpeningReadsTheNextValueAndRepeatsTheLast) {
  const ProbeRun run =
      Probe(Lines(4, "fopen " + kOwn + " r")).Run({"--integrity", "ffffffff,2e,0"});
  EXPECT_EQ(run.results, Lines({"4294967295 77", "46 77", "0 77", "0 77"}));
  EXPECT_EQ(OfKind(run.events, "integrity"),
            std::vector<Json>({IntegrityEvent(0, "ffffffff"), IntegrityEvent(0, "2e"),
                               IntegrityEvent(0, "0"), IntegrityEvent(0, "0")}));
}

TEST(IntegrityFile, DoesNotExistForTheValueMissing) {
  const ProbeRun run =
      Probe(Lines(3, "fopen " + kOwn + " r")).Run({"--integrity", "missing,1f,missing"});
  EXPECT_EQ(run.results, Lines({kNoFile, kHealthy, kNoFile}));
  EXPECT_EQ(OfKind(run.events, "integrity"),
            std::vector<Json>(
                {IntegrityEvent(0, nullptr), IntegrityEvent(0, "1f"), IntegrityEvent(0, nullptr)}));
}

// The file has the digits and a line end.
TEST(IntegrityFile, HoldsALine) {
  EXPECT_EQ(Probe({"bytes " + kOwn}).Run({"--integrity", "1f"}).results, Lines({"3 77"}));
}

TEST(IntegrityFile, MayHoldATextThatIsNotANumber) {
  const ProbeRun run = Probe({"fopen " + kOwn + " r"}).Run({"--integrity", "zz"});
  EXPECT_EQ(run.results, Lines({"-2 77"}));
  EXPECT_EQ(OfKind(run.events, "integrity"), std::vector<Json>({IntegrityEvent(0, "zz")}));
}

TEST(IntegrityFile, MayBeEmpty) {
  const ProbeRun run = Probe({"fopen " + kOwn + " r"}).Run({"--integrity", ""});
  EXPECT_EQ(run.results, Lines({"-2 0"}));  // fscanf reached the end of the file; errno is then 0
  EXPECT_EQ(OfKind(run.events, "integrity"), std::vector<Json>({IntegrityEvent(0, "")}));
}

TEST(IntegrityFile, ExistsUnderTheNumberOfATask) {
  const ProbeRun run = Probe({"own-task", "fopen /proc/1/integrity/value r"}).Run();
  EXPECT_EQ(run.results, Lines({kHealthy, kHealthy}));
  const std::vector<Json> events = OfKind(run.events, "integrity");
  ASSERT_EQ(events.size(), 2U);
  EXPECT_GT(events[0]["pid"], 1);
  EXPECT_EQ(events[1], IntegrityEvent(1, "1f"));
}

TEST(IntegrityFile, IsMissingForATaskThatDoesNotExist) {
  const ProbeRun run = Probe({"fopen /proc/2147483647/integrity/value r"}).Run();
  EXPECT_EQ(run.results, Lines({kNoFile}));
  EXPECT_EQ(OfKind(run.events, "integrity").size(), 0U);
}

TEST(IntegrityFile, OtherNamesAreNotSimulated) {
  const Lines names = {"/proc/self/integrity/label",      "/proc/self/integrity/value/",
                       "/proc/self/integrity/values",     "/proc/self/integrity",
                       "/proc/1x/integrity/value",        "/proc/01/integrity/value",
                       "/proc/-1/integrity/value",        "/proc/integrity/value",
                       "/proc//integrity/value",          "/tmp/proc/self/integrity/value",
                       "/proc/9999999999/integrity/value"};
  Lines commands;
  for (const std::string& name : names) commands.push_back("fopen " + name + " r");
  const ProbeRun run = Probe(commands).Run();
  EXPECT_EQ(run.results, Lines(names.size(), kNoFile));
  EXPECT_EQ(OfKind(run.events, "integrity").size(), 0U);
}

TEST(IntegrityFile, CannotBeWritten) {
  const std::string refusal = "-1 " + std::to_string(EACCES);
  const ProbeRun run = Probe({"fopen " + kOwn + " w", "fopen " + kOwn + " r+", "write " + kOwn,
                              "fopen " + kOwn + " r"})
                           .Run();
  EXPECT_EQ(run.results, Lines({refusal, refusal, "-1 " + std::to_string(EPERM), kHealthy}));
}

TEST(IntegrityFile, GetsTheLowestFreeDescriptor) {
  EXPECT_EQ(Probe(Lines(2, "keep " + kOwn)).Run().results, Lines({"5 77", "6 77"}));
}

TEST(IntegrityFile, OtherFilesAreOpenedNormally) {
  const Probe probe({});
  const std::string file = probe.directory().Write("number", ToBytes("2e"));
  const Lines ways = {"fopen " + file + " r", "fopen64 " + file + " r"};
  EXPECT_EQ(Probe(ways).Run().results, Lines(ways.size(), "46 77"));
}
