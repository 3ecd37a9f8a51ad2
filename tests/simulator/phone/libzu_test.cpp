#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"
#include "support/process.h"

TEST(LibzuStandIn, RegistersAndLeavesErrnoAlone) {
  const Probe probe({"register 3 com.example.app 00ffa5"});
  const ProbeRun run = probe.Run();
  EXPECT_EQ(run.results, Lines({"0 77"}));
  EXPECT_EQ(OfKind(run.events, "register"), std::vector<Json>({{{"event", "register"},
                                                                {"fd", 3},
                                                                {"path", probe.path()},
                                                                {"name", "com.example.app"},
                                                                {"data", "00ffa5"},
                                                                {"result", 0}}}));
}

TEST(LibzuStandIn, AnswersWhatThePhoneSays) {
  for (const std::string result : {"65540", "-7", "2147483647", "-2147483648"}) {
    const ProbeRun run = Probe({"register 3 name ab"}).Run({"--zu-result", result});
    EXPECT_EQ(run.results, Lines({result + " 77"}));
    EXPECT_EQ(OfKind(run.events, "register")[0]["result"], std::stol(result));
  }
}

TEST(LibzuStandIn, RecordsADescriptorThatIsNotOpen) {
  const ProbeRun run = Probe({"register 700 name ab"}).Run();
  EXPECT_EQ(run.results, Lines({"0 77"}));
  EXPECT_EQ(OfKind(run.events, "register")[0]["path"], "");
}

TEST(LibzuStandIn, ReturnsMinusOneWithoutAPhone) {
  const Probe probe({"register 3 name ab"});
  const ProcessResult result = RunProcess({PROBE_COMMAND, probe.path()});
  EXPECT_EQ(result.output + result.errors, "");
  EXPECT_EQ(LinesOf(ContentOf(probe.path() + ".out")), Lines({"fd 3", "-1 77"}));
}
