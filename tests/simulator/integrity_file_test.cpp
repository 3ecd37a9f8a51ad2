#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/probe_run.h"

namespace {

const std::string kOwn = "/proc/self/integrity/value";
const std::string kHealthy = "31 77";
const std::string kNoFile = "-1 " + std::to_string(ENOENT);

Json Opened(int pid, const Json& text) {
  return {{"event", "integrity"}, {"pid", pid}, {"text", text}};
}

}  // namespace

TEST(IntegrityFile, EveryWayOfOpeningFindsIt) {
  const Lines ways = {"fopen " + kOwn + " r", "fopen64 " + kOwn + " re", "read " + kOwn,
                      "read64 " + kOwn,       "readat " + kOwn,          "readat64 " + kOwn,
                      "read_2 " + kOwn,       "read64_2 " + kOwn,        "readat_2 " + kOwn,
                      "readat64_2 " + kOwn};
  const ProbeRun run = Probe(ways).Run();
  EXPECT_EQ(run.results, Lines(ways.size(), kHealthy));
  EXPECT_EQ(OfKind(run.events, "integrity"), std::vector<Json>(ways.size(), Opened(0, "1f")));
}

TEST(IntegrityFile, EachOpeningAnswersTheNextValueAndTheLastRepeats) {
  const ProbeRun run =
      Probe(Lines(4, "fopen " + kOwn + " r")).Run({"--integrity", "ffffffff,2e,0"});
  EXPECT_EQ(run.results, Lines({"4294967295 77", "46 77", "0 77", "0 77"}));
  EXPECT_EQ(
      OfKind(run.events, "integrity"),
      std::vector<Json>({Opened(0, "ffffffff"), Opened(0, "2e"), Opened(0, "0"), Opened(0, "0")}));
}

TEST(IntegrityFile, MissingIsNoFile) {
  const ProbeRun run = Probe({"fopen " + kOwn + " r", "read " + kOwn, "read " + kOwn})
                           .Run({"--integrity", "missing,1f,missing"});
  EXPECT_EQ(run.results, Lines({kNoFile, kHealthy, kNoFile}));
  EXPECT_EQ(OfKind(run.events, "integrity"),
            std::vector<Json>({Opened(0, nullptr), Opened(0, "1f"), Opened(0, nullptr)}));
}

TEST(IntegrityFile, MayHoldWhatIsNoNumber) {
  const ProbeRun run = Probe({"fopen " + kOwn + " r"}).Run({"--integrity", "zz"});
  EXPECT_EQ(run.results, Lines({"-2 77"}));
  EXPECT_EQ(OfKind(run.events, "integrity"), std::vector<Json>({Opened(0, "zz")}));
}

TEST(IntegrityFile, MayBeEmpty) {
  const ProbeRun run = Probe({"fopen " + kOwn + " r"}).Run({"--integrity", ""});
  EXPECT_EQ(run.results, Lines({"-2 0"}));  // the C library's errno where a scan meets the end
  EXPECT_EQ(OfKind(run.events, "integrity"), std::vector<Json>({Opened(0, "")}));
}

TEST(IntegrityFile, OfANumberedTask) {
  const ProbeRun run = Probe({"own-task", "read /proc/1/integrity/value"}).Run();
  EXPECT_EQ(run.results, Lines({kHealthy, kHealthy}));
  const std::vector<Json> events = OfKind(run.events, "integrity");
  ASSERT_EQ(events.size(), 2U);
  EXPECT_GT(events[0]["pid"], 1);
  EXPECT_EQ(events[1], Opened(1, "1f"));
}

TEST(IntegrityFile, OfATaskThatDoesNotExistIsMissing) {
  const ProbeRun run = Probe({"read /proc/2147483647/integrity/value"}).Run();
  EXPECT_EQ(run.results, Lines({kNoFile}));
  EXPECT_EQ(OfKind(run.events, "integrity").size(), 0U);
}

TEST(IntegrityFile, OnlyThatNameIsSimulated) {
  const Lines names = {"/proc/self/integrity/label",      "/proc/self/integrity/value/",
                       "/proc/self/integrity/values",     "/proc/self/integrity",
                       "/proc/1x/integrity/value",        "/proc/01/integrity/value",
                       "/proc/-1/integrity/value",        "/proc/integrity/value",
                       "/proc//integrity/value",          "/tmp/proc/self/integrity/value",
                       "/proc/9999999999/integrity/value"};
  Lines commands;
  for (const std::string& name : names) commands.push_back("read " + name);
  const ProbeRun run = Probe(commands).Run();
  EXPECT_EQ(run.results, Lines(names.size(), kNoFile));
  EXPECT_EQ(OfKind(run.events, "integrity").size(), 0U);
}

TEST(IntegrityFile, CannotBeWritten) {
  const std::string refusal = "-1 " + std::to_string(EACCES);
  const ProbeRun run = Probe({"openrw " + kOwn, "fopen " + kOwn + " w", "fopen " + kOwn + " r+",
                              "write " + kOwn, "read " + kOwn})
                           .Run();
  EXPECT_EQ(run.results,
            Lines({refusal, refusal, refusal, "-1 " + std::to_string(EPERM), kHealthy}));
}

TEST(IntegrityFile, IsTheLowestFreeDescriptor) {
  EXPECT_EQ(Probe({"open " + kOwn, "open " + kOwn}).Run().results, Lines({"5 77", "6 77"}));
}

TEST(IntegrityFile, OtherFilesAreOpenedAsEver) {
  const Probe probe({});
  const std::string file = probe.folder().Write("number", ToBytes("2e"));
  const Lines ways = {"fopen " + file + " r", "fopen64 " + file + " r", "read " + file,
                      "read64 " + file,       "readat " + file,         "readat64 " + file,
                      "read_2 " + file,       "read64_2 " + file,       "readat_2 " + file,
                      "readat64_2 " + file};
  EXPECT_EQ(Probe(ways).Run().results, Lines(ways.size(), "46 77"));
}

TEST(IntegrityFile, TheModeOfANewFileIsPassedOn) {
  const Folder folder;
  const std::string file = folder / "new";
  EXPECT_EQ(Probe({"create " + file + " 0600"}).Run().results, Lines({"5 77"}));
  struct stat state = {};
  ASSERT_EQ(stat(file.c_str(), &state), 0);
  EXPECT_EQ(state.st_mode & 0777, 0600U);
}
