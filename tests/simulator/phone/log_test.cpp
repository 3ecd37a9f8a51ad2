#include <gtest/gtest.h>

#include <csignal>

#include "simulator/phone/probe_run.h"
#include "support/der.h"

namespace {

Json LogEvent(int priority, const std::string& tag, const std::string& text) {
  return {{"event", "log"}, {"priority", priority}, {"tag", tag}, {"text", text}};
}

std::string Repeated(const std::string& text, int times) {
  std::string all;
  for (int i = 0; i < times; ++i) all += text;
  return all;
}

}  // namespace

TEST(Log, KeepsPriorityTagAndText) {
  const ProbeRun run =
      Probe({"log 4 ApkToolkit 6869", "log 6 other 22", "log-write 5 tag 25"}).Run();
  EXPECT_EQ(run.results, Lines({"1 77", "1 77", "1 77"}));
  EXPECT_EQ(OfKind(run.events, "log"),
            std::vector<Json>({LogEvent(4, "ApkToolkit", "hi|5\n"), LogEvent(6, "other", "\"|5\n"),
                               LogEvent(5, "tag", "%")}));
}

// The probe's command "log-data" logs with the function that the platform's zip library calls.
TEST(Log, KeepsWhatThePlatformsLibrariesWriteByThemselves) {
  const ProbeRun run = Probe({"log-data 5 ziparchive 5a6970"}).Run();
  EXPECT_EQ(run.results, Lines({"0 77"}));
  EXPECT_EQ(OfKind(run.events, "log"), std::vector<Json>({LogEvent(5, "ziparchive", "Zip")}));
  EXPECT_EQ(run.errors, "");
}

TEST(Log, BytesThatAreNotUtf8AreKept) {
  EXPECT_EQ(OfKind(Probe({"log 4 tag e9c3a9ff"}).Run().events, "log"),
            std::vector<Json>({LogEvent(4, "tag", "\uf7e9\u00e9\uf7ff|5\n")}));
}

TEST(Log, CutsTextsTo1023Bytes) {
  const std::string long_text = Repeated("61", 2000);
  const std::vector<Json> kept(2, LogEvent(4, "tag", Repeated("a", 1023)));
  EXPECT_EQ(
      OfKind(Probe({"log 4 tag " + long_text, "log-write 4 tag " + long_text}).Run().events, "log"),
      kept);
}

TEST(Log, AssertionIsRecordedAndKills) {
  const ProbeRun run = Probe({"log-assert tag"}).Run();
  ASSERT_EQ(run.events.size(), 2U);
  EXPECT_EQ(run.events[0], LogEvent(7, "tag", "why 7"));
  EXPECT_EQ(run.events[1], Json({{"event", "exit"}, {"signal", SIGABRT}}));
}
