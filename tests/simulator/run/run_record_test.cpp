// Tests how TakeApart decides whether an answer of the kernel is about the file itself or about
// another file. While the tool signs libraries or the file, the tool's present step decides. At
// other times, the path in the event decides.
#include "simulator/run/run_record.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

const std::string kFile = "/data/app/base.apk";

Json Log(const std::string& text) {
  return {{"event", "log"}, {"priority", 4}, {"tag", "ApkToolkit"}, {"text", text}};
}

const Json kFileBegins = Log("VeltSign starts: zip_fd = 3, fd = 3.\n");
const Json kFileEnds = Log("VeltSign finished: 0.\n");

Json Sign(const std::string& path) {
  return {{"event", "sign"}, {"path", path}, {"payload", "0100ab"}, {"result", 0}, {"errno", 0}};
}

Json Verify(const std::string& path) {
  return {{"event", "verify"}, {"path", path}, {"result", -1}, {"errno", 126}};
}

RunRecord Record(Events events) {
  const Json start = {{"event", "start"}, {"file", "base.apk"}, {"path", kFile}};
  const Json exit = {{"event", "exit"}, {"status", 0}};
  events.insert(events.begin(), start);
  events.push_back(exit);
  return TakeApart(events);
}

// The files that the kernel signed: "own" for the file itself, and the paths of libraries.
Lines SignedBy(const Events& events) {
  const RunRecord record = Record(events);
  Lines lines;
  if (record.own) lines.push_back("own");
  for (const Attempt& library : record.libraries) lines.push_back(library.path);
  return lines;
}

}  // namespace

// The step counts more than the path, because a file may be moved during the run.
TEST(RunRecord, StepOfTheToolCountsMoreThanThePath) {
  EXPECT_EQ(SignedBy({kFileBegins, Sign("/data/app/moved.apk")}), Lines({"own"}));
  EXPECT_EQ(SignedBy({Log("VeltSignJni starts: 3.\n"), Sign(kFile)}), Lines({kFile}));
}

TEST(RunRecord, PathDecidesBeforeAndAfterTheStep) {
  EXPECT_EQ(SignedBy({Sign(kFile)}), Lines({"own"}));
  EXPECT_EQ(SignedBy({Sign("")}), Lines({"own"}));
  EXPECT_EQ(SignedBy({Sign("/other")}), Lines({"/other"}));
  EXPECT_EQ(SignedBy({kFileBegins, kFileEnds, Sign(kFile)}), Lines({"own"}));
  EXPECT_EQ(SignedBy({kFileBegins, kFileEnds, Sign("/other")}), Lines({"/other"}));
}

TEST(RunRecord, VerificationCountsOnlyForTheFileItself) {
  EXPECT_TRUE(Record({Verify(kFile)}).is_jar);
  EXPECT_EQ(Record({Verify(kFile)}).verify_error, 126);
  EXPECT_FALSE(Record({Verify("/other")}).is_jar);
  EXPECT_EQ(Record({Verify("/other")}).verify_error, std::nullopt);
}
