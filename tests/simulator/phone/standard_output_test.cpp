#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"
#include "support/der.h"
#include "support/process.h"

namespace {

Json Printed(const std::string& text) { return {{"event", "stdout"}, {"text", text}}; }

}  // namespace

TEST(StandardOutput, LinesAreInTheOrderOfPrinting) {
  const ProbeRun run =
      Probe({"puts one", "log 4 tag 61", "print 74776f0a", "verify 3", "puts three"}).Run();
  ASSERT_EQ(run.events.size(), 6U);
  EXPECT_EQ(run.events[0], Printed("one\n"));
  EXPECT_EQ(run.events[1]["event"], "log");
  EXPECT_EQ(run.events[2], Printed("two\n"));
  EXPECT_EQ(run.events[3]["event"], "verify");
  EXPECT_EQ(run.events[4], Printed("three\n"));
}

TEST(StandardOutput, PiecesOfALineAreOneEvent) {
  const ProbeRun run = Probe({"print 61", "print 620a", "print 63"}).Run();
  ASSERT_EQ(run.events.size(), 3U);
  EXPECT_EQ(run.events[0], Printed("ab\n"));
  EXPECT_EQ(run.events[1], Printed("c"));  // recorded when the process ends
}

TEST(StandardOutput, BytesThatAreNotUtf8AreKept) {
  EXPECT_EQ(OfKind(Probe({"print e90a"}).Run().events, "stdout"),
            std::vector<Json>({Printed("\uf7e9\n")}));
}

TEST(StandardOutput, ReachesItsDescriptor) {
  const Probe probe({"puts one", "print 74776f"});
  const ProcessResult result =
      RunProcess({"env", PRELOAD_KERNEL, "APKTOOLKIT_SIM_JOURNAL=" + probe.directory() / "journal",
                  PROBE_COMMAND, probe.path()});
  EXPECT_EQ(result.output, "one\ntwo");
}

TEST(StandardOutput, IsLeftAloneWithoutAJournal) {
  const Probe probe({"puts one", "sign 3 0000"});
  const ProcessResult result = RunProcess({"env", PRELOAD_KERNEL, PROBE_COMMAND, probe.path()});
  EXPECT_EQ(result.output, "one\n");
  EXPECT_EQ(LinesOf(ContentOf(probe.path() + ".out")), Lines({"fd 3", "4 77", "0 77"}));
}
