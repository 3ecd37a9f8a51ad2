#include "simulator/show/sarif.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"
#include "simulator/show/good_report.h"
#include "simulator/show/hostile_report.h"

using namespace simulator;

namespace {

// A good report with the size and the digest of the file.
Report Good(const std::string& file) {
  Report report = GoodReport(file);
  report.file_size = 7;
  report.file_sha256 = std::string(64, 'a');
  return report;
}

Item RefusedFor(const Cause* cause, const std::string& detail) {
  return {ItemKind::kLibrary, "lib/arm64/a.so", "", ItemState::kRefused, {cause, detail}};
}

Json LogOf(const std::vector<Report>& reports) {
  Sarif sarif;
  for (const Report& report : reports) sarif.Add(report);
  return Json::parse(sarif.Log(), nullptr, false);
}

// "level rule uri" of each result.
Lines ResultsOf(const Json& log) {
  Lines lines;
  const Json& run = log["runs"][0];
  for (const Json& result : run["results"]) {
    const Json& location = result["locations"][0]["physicalLocation"]["artifactLocation"];
    const std::string rule = result["ruleId"];
    EXPECT_EQ(run["tool"]["driver"]["rules"][result["ruleIndex"].get<size_t>()]["id"], rule);
    EXPECT_EQ(run["artifacts"][location["index"].get<size_t>()]["location"]["uri"],
              location["uri"]);
    lines.push_back(result["level"].get<std::string>() + " " + rule + " " +
                    location["uri"].get<std::string>());
  }
  return lines;
}

}  // namespace

TEST(Sarif, BeginsWithTheTextThatALaterRunExpects) {
  EXPECT_EQ(Sarif().Log().substr(0, kSarifStart.size()), kSarifStart);
}

// The log is compared as a whole, so that the test notices each added or lost member.
TEST(Sarif, HasTheWholeRun) {
  Report refused = Good("b.apk");
  refused.verdict = Verdict::kPartlySigned;
  refused.items.push_back(RefusedFor(&cause::kKernelRefused, "EPERM"));
  refused.warnings = {{&cause::kWeakKey, "512"}};
  const Json driver = LogOf({Good("a.apk"), refused})["runs"][0]["tool"]["driver"];
  EXPECT_EQ(driver["version"], APKTOOLKIT_VERSION);
  Json log = LogOf({Good("a.apk"), refused});
  log["runs"][0]["tool"]["driver"]["version"] = "x";
  EXPECT_EQ(log, Json::parse(R"json({
    "$schema": "https://docs.oasis-open.org/sarif/sarif/v2.1.0/errata01/os/schemas/sarif-schema-2.1.0.json",
    "version": "2.1.0",
    "runs": [{
      "tool": {"driver": {"name": "apktoolkit-sim", "version": "x", "rules": [
        {"id": "kernel-refused", "shortDescription": {"text": "the kernel refused (…)"},
         "help": {"text": "The file was good. docs/guide.md, \"When the kernel refuses\", says where to look."},
         "defaultConfiguration": {"level": "error"}},
        {"id": "weak-key",
         "shortDescription": {"text": "its RSA key has … bits; fewer than 2048 bits are not safe"},
         "help": {"text": "Sign a new app with a key of 2048 bits or more. For a published app, a new key changes the signer."},
         "defaultConfiguration": {"level": "warning"}}]}},
      "invocations": [{"executionSuccessful": true}],
      "artifacts": [
        {"location": {"uri": "a.apk"}, "roles": ["analysisTarget"], "length": 7, "hashes": {"sha-256":
         "aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa"}},
        {"location": {"uri": "b.apk"}, "roles": ["analysisTarget"], "length": 7, "hashes": {"sha-256":
         "aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa"}}],
      "results": [
        {"ruleId": "kernel-refused", "ruleIndex": 0, "level": "error",
         "message": {"text": "lib/arm64/a.so: not signed: the kernel refused (EPERM)"},
         "locations": [{"physicalLocation": {"artifactLocation": {"uri": "b.apk", "index": 1}}}]},
        {"ruleId": "weak-key", "ruleIndex": 1, "level": "warning",
         "message": {"text": "its RSA key has 512 bits; fewer than 2048 bits are not safe"},
         "locations": [{"physicalLocation": {"artifactLocation": {"uri": "b.apk", "index": 1}}}]}]
    }]})json"));
}

TEST(Sarif, RulesAndFilesAreListedOnce) {
  Report refused = Good("b.apk");
  refused.verdict = Verdict::kRefused;
  refused.items = {RefusedFor(&cause::kToolError, "a"), RefusedFor(&cause::kToolError, "b")};
  const Json log = LogOf({refused, refused});
  EXPECT_EQ(log["runs"][0]["tool"]["driver"]["rules"].size(), 1U);
  EXPECT_EQ(log["runs"][0]["artifacts"].size(), 1U);
  EXPECT_EQ(ResultsOf(log), Lines(4, "error tool-error b.apk"));
}

TEST(Sarif, RefusalThatFollowsFromAnotherIsNoResultOfItsOwn) {
  Report refused = Good("b.apk");
  refused.verdict = Verdict::kRefused;
  refused.items = {RefusedFor(&cause::kPackageRefused, ""), RefusedFor(&cause::kToolError, "a")};
  EXPECT_EQ(ResultsOf(LogOf({refused})), Lines({"error tool-error b.apk"}));
  // A refused file always has a result.
  refused.items.pop_back();
  EXPECT_EQ(ResultsOf(LogOf({refused})), Lines({"error package-refused b.apk"}));
}

// A program that reads only the results finds an error. A program that reads only `invocations`
// finds that the run failed.
TEST(Sarif, FileThatWasNotJudgedIsAnErrorAndTheRunWasNotSuccessful) {
  for (const Verdict verdict : {Verdict::kNotLookedAt, Verdict::kNotSimulated}) {
    Report report;
    report.file = "a.apk";
    report.verdict = verdict;
    report.items = {{ItemKind::kTool, "tool", "", ItemState::kRefused, {&cause::kInterrupted, ""}}};
    const Json log = LogOf({report});
    EXPECT_EQ(ResultsOf(log), Lines({"error interrupted a.apk"}));
    const Json& invocation = log["runs"][0]["invocations"][0];
    EXPECT_EQ(invocation["executionSuccessful"], false);
    ASSERT_EQ(invocation["toolExecutionNotifications"].size(), 1U);
    EXPECT_EQ(invocation["toolExecutionNotifications"][0]["level"], "error");
    EXPECT_FALSE(log["runs"][0]["artifacts"][0].contains("hashes"));
  }
  Report unasked = Good("a.apk");
  unasked.installer = {Judgement::State::kMissing, "java is missing", {}};
  EXPECT_EQ(LogOf({unasked, unasked})["runs"][0]["invocations"],
            Json::parse(R"([{"executionSuccessful": true, "toolExecutionNotifications": [
                {"level": "warning", "message":
                    {"text": "no phone's installer was asked: java is missing"}}]}])"));
  Report refused = Good("a.apk");
  refused.verdict = Verdict::kRefused;
  refused.items = {RefusedFor(&cause::kToolError, "a")};
  EXPECT_EQ(LogOf({refused})["runs"][0]["invocations"],
            Json::parse(R"([{"executionSuccessful": true}])"));
}

TEST(Sarif, HostileTextsKeepMarkupButNoEscapeCharacter) {
  const Json log = LogOf({HostileReport(kHostileText)});
  ASSERT_TRUE(log.is_object());
  EXPECT_EQ(log["runs"][0]["results"].size(), 4U);
  const std::string message = log["runs"][0]["results"][0]["message"]["text"];
  EXPECT_NE(message.find("<script>"), std::string::npos);
  EXPECT_EQ(message.find('\x1b'), std::string::npos);
}

// RFC 3986 §2.3 lists the characters that need no percent-encoding. The "/" of a path is not
// encoded either. A colon in a path is encoded: otherwise, a program could read the part before the
// colon as the scheme of a URI (§4.2).
TEST(UriOf, EncodesAllButUnreservedCharactersAndSlashes) {
  EXPECT_EQ(UriOf("base.apk"), "base.apk");
  EXPECT_EQ(UriOf("../a-b/c_d~e.apk"), "../a-b/c_d~e.apk");
  EXPECT_EQ(UriOf("/data/app/base.apk"), "file:///data/app/base.apk");
  EXPECT_EQ(UriOf("http://x/?a#b%"), "http%3a//x/%3fa%23b%25");
  EXPECT_EQ(UriOf("a b\n\xe9\"\\"), "a%20b%0a%e9%22%5c");
}
